// The outline's text with its cover window.
#include "outline/qr_oi_multi_text.h"

#include <Xm/Xm.h>

#include <memory>

#include "toolkit/oi_scroll_text.h"

QR_OI_MultiText::QR_OI_MultiText(Widget parent, const std::string& name) : OI_MultiText(parent, name) {}

QR_OI_MultiText::~QR_OI_MultiText() {
  if (cover_ != None && widget()) XDestroyWindow(XtDisplay(widget()), cover_);
}

void QR_OI_MultiText::widgetDestroyed() {
  // The cover was a child of the text's window and went with it.
  cover_ = None;
  covered_ = false;
  OI_MultiText::widgetDestroyed();
}

void QR_OI_MultiText::coverFrom(uint32_t line) {
  Widget w = widget();
  if (!w || !XtIsRealized(w)) return;
  Display* d = XtDisplay(w);
  if (cover_ == None) {
    XSetWindowAttributes a;
    a.background_pixmap = None;  // no background: the server keeps what is on the screen
    a.backing_store = NotUseful;
    a.override_redirect = True;
    cover_ = XCreateWindow(d, XtWindow(w), 0, 0, 1, 1, 0, CopyFromParent, InputOutput, CopyFromParent,
                           CWBackPixmap | CWBackingStore | CWOverrideRedirect, &a);
  }
  Dimension width = 0, height = 0;
  XtVaGetValues(w, XmNwidth, &width, XmNheight, &height, nullptr);
  int y = line <= topLine() ? 0 : static_cast<int>(line - topLine()) * cellHeight();
  if (y >= static_cast<int>(height) || width == 0) {
    uncover();
    return;
  }
  XMoveResizeWindow(d, cover_, 0, y, width, static_cast<unsigned>(height - y));
  XMapRaised(d, cover_);
  covered_ = true;
}

void QR_OI_MultiText::uncover() {
  if (cover_ != None && widget()) XUnmapWindow(XtDisplay(widget()), cover_);
  covered_ = false;
}

void QR_OI_Init() {
  OI_ScrollText::setTextMaker([](Widget parent, const std::string& name) -> std::unique_ptr<OI_MultiText> {
    return std::make_unique<QR_OI_MultiText>(parent, name);
  });
}
