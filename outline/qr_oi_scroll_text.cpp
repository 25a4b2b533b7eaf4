// Scrolling texts with shared bars, and their gang.
#include "outline/qr_oi_scroll_text.h"

#include <memory>

#include "toolkit/oi_scroll_bar.h"

const char* QR_OI_ScrollTextGang::barName(OI_Side side) {
  switch (side) {
    case OI_Side::top: return "QR_top_sb";
    case OI_Side::bottom: return "QR_bottom_sb";
    case OI_Side::left: return "QR_left_sb";
    case OI_Side::right: return "QR_right_sb";
  }
  return "";
}

QR_OI_ScrollText::QR_OI_ScrollText(Widget parent, const std::string& name) : OI_ScrollText(parent, name) {}

void QR_OI_ScrollText::layout() {
  Widget w = widget();
  if (w && XtParent(w)) {
    for (OI_Side side : {OI_Side::top, OI_Side::bottom, OI_Side::left, OI_Side::right}) {
      Widget found = XtNameToWidget(XtParent(w), QR_OI_ScrollTextGang::barName(side));
      if (auto* bar = dynamic_cast<OI_ScrollBar*>(OI_Widget::fromWidget(found))) attachSharedBar(side, bar);
    }
  }
  OI_ScrollText::layout();
}

QR_OI_ScrollTextGang::QR_OI_ScrollTextGang(Widget parent, const std::string& name) : OI_GridBox(parent, name) {}

QR_OI_ScrollTextGang::~QR_OI_ScrollTextGang() {
  // The texts go with the box's children; nothing may lay them out on the way.
  texts_.clear();
}

QR_OI_ScrollText* QR_OI_ScrollTextGang::addText(const std::string& name, int col, int row, bool stretchX,
                                                bool stretchY) {
  return addText(std::make_unique<QR_OI_ScrollText>(widget(), name), col, row, stretchX, stretchY);
}

QR_OI_ScrollText* QR_OI_ScrollTextGang::addText(std::unique_ptr<QR_OI_ScrollText> text, int col, int row,
                                                bool stretchX, bool stretchY) {
  QR_OI_ScrollText* t = own(std::move(text));
  place(t->widget(), 3 * col + 1, 3 * row + 1, stretchX, stretchY);
  texts_.push_back(t);
  return t;
}

OI_ScrollBar* QR_OI_ScrollTextGang::addSharedBar(OI_Side side, int col, int row) {
  bool vertical = side == OI_Side::left || side == OI_Side::right;
  OI_ScrollBar* bar = own(std::make_unique<OI_ScrollBar>(widget(), barName(side), vertical));
  int x = 3 * col + 1, y = 3 * row + 1;
  switch (side) {
    case OI_Side::top: y -= 1; break;
    case OI_Side::bottom: y += 1; break;
    case OI_Side::left: x -= 1; break;
    case OI_Side::right: x += 1; break;
  }
  place(bar->widget(), x, y, !vertical, vertical);
  bar->onShownChanged = [this] { layout(); };
  layout();
  return bar;
}

void QR_OI_ScrollTextGang::layout() {
  for (QR_OI_ScrollText* t : texts_) t->layout();
  OI_GridBox::layout();
}
