// A multi-line text with its own or shared scroll bars.
#include "toolkit/oi_scroll_text.h"

#include <algorithm>

#include "toolkit/oi_multi_text.h"
#include "toolkit/oi_scroll_bar.h"

namespace {
OI_ScrollText::TextMaker& textMaker() {
  static OI_ScrollText::TextMaker maker;
  return maker;
}
}  // namespace

void OI_ScrollText::setTextMaker(TextMaker maker) { textMaker() = std::move(maker); }

OI_ScrollText::OI_ScrollText(Widget parent, const std::string& name) : OI_GridBox(parent, name + "Scroll") {
  std::unique_ptr<OI_MultiText> t =
      textMaker() ? textMaker()(widget(), name) : std::make_unique<OI_MultiText>(widget(), name);
  text_ = own(std::move(t));
  ownV_ = own(std::make_unique<OI_ScrollBar>(widget(), "VertScrollBar", true));
  ownH_ = own(std::make_unique<OI_ScrollBar>(widget(), "HorScrollBar", false));
  place(text_->widget(), 1, 1, true, true);
  place(ownV_->widget(), 2, 1, false, true);
  place(ownH_->widget(), 1, 2, true, false);
  ownV_->attach(text_);
  ownH_->attach(text_);
  ownV_->onShownChanged = [this] { layout(); };
  ownH_->onShownChanged = [this] { layout(); };
  fitToContents();
}

OI_ScrollText::~OI_ScrollText() {
  ownV_->onShownChanged = nullptr;
  ownH_->onShownChanged = nullptr;
  // A shared bar may already be gone; it then took itself out of the text's list.
  for (OI_ScrollBar*& bar : shared_) {
    if (bar && text_ && std::find(text_->scrollBars().begin(), text_->scrollBars().end(), bar) !=
                            text_->scrollBars().end())
      bar->detach(text_, false);
    bar = nullptr;
  }
}

OI_ScrollBar* OI_ScrollText::scrollBar(OI_Side side) const {
  if (OI_ScrollBar* b = shared_[static_cast<int>(side)]) return b;
  return (side == OI_Side::left || side == OI_Side::right) ? ownV_ : ownH_;
}

OI_ScrollBar* OI_ScrollText::scrollBar(const std::string& layoutName) const {
  if (layoutName == "@top_scroll_bar") return scrollBar(OI_Side::top);
  if (layoutName == "@bottom_scroll_bar") return scrollBar(OI_Side::bottom);
  if (layoutName == "@left_scroll_bar") return scrollBar(OI_Side::left);
  if (layoutName == "@right_scroll_bar") return scrollBar(OI_Side::right);
  return nullptr;
}

void OI_ScrollText::attachSharedBar(OI_Side side, OI_ScrollBar* bar) {
  if (!bar || shared_[static_cast<int>(side)] == bar) return;
  if (OI_ScrollBar* old = shared_[static_cast<int>(side)])
    if (std::find(text_->scrollBars().begin(), text_->scrollBars().end(), old) != text_->scrollBars().end())
      old->detach(text_);
  shared_[static_cast<int>(side)] = bar;
  bool vertical = side == OI_Side::left || side == OI_Side::right;
  OI_ScrollBar* own = vertical ? ownV_ : ownH_;
  own->detach(text_);
  own->setDynamic(true);  // with no text it hides
  bar->attach(text_);
  layout();
}

void OI_ScrollText::setDynamicScrollBars(bool on) {
  ownV_->setDynamic(on || !ownV_->texts().size());
  ownH_->setDynamic(on || !ownH_->texts().size());
  // Shown or hidden now, so that the window's first size already holds a static bar.
  ownV_->update();
  ownH_->update();
  layout();
}
