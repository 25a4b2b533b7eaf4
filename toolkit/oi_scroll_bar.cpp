// A scroll bar that one or more texts follow.
#include "toolkit/oi_scroll_bar.h"

#include <Xm/ScrollBar.h>

#include <algorithm>

#include "toolkit/oi_multi_text.h"
#include "toolkit/oi_xstring.h"

OI_ScrollBar::OI_ScrollBar(Widget parent, const std::string& name, bool vertical) : vertical_(vertical) {
  Arg args[3];
  XtSetArg(args[0], XmNorientation, vertical ? XmVERTICAL : XmHORIZONTAL);
  XtSetArg(args[1], XmNtraversalOn, False);
  Widget w = XmCreateScrollBar(parent, oiStr(name.c_str()), args, 2);
  adopt(w, name);
  for (const char* cb : {XmNvalueChangedCallback, XmNdragCallback, XmNincrementCallback, XmNdecrementCallback,
                         XmNpageIncrementCallback, XmNpageDecrementCallback, XmNtoTopCallback,
                         XmNtoBottomCallback})
    XtAddCallback(w, cb, movedCB, this);
  XtManageChild(w);
}

OI_ScrollBar::~OI_ScrollBar() {
  onShownChanged = nullptr;
  while (!texts_.empty()) detach(texts_.back(), false);
}

void OI_ScrollBar::widgetDestroyed() {
  onShownChanged = nullptr;
  while (!texts_.empty()) detach(texts_.back(), false);
}

void OI_ScrollBar::attach(OI_MultiText* text) {
  if (!text || std::find(texts_.begin(), texts_.end(), text) != texts_.end()) return;
  texts_.push_back(text);
  text->bars_.push_back(this);
  update();
}

void OI_ScrollBar::detach(OI_MultiText* text, bool refresh) {
  auto it = std::find(texts_.begin(), texts_.end(), text);
  if (it == texts_.end()) return;
  texts_.erase(it);
  std::erase(text->bars_, this);
  if (refresh) update();
}

void OI_ScrollBar::setDynamic(bool on) {
  dynamic_ = on;
  update();
}

void OI_ScrollBar::update() {
  Widget w = widget();
  if (!w || updating_) return;
  updating_ = true;
  int total = 0, visible = 0, value = 0;
  bool first = true;
  for (OI_MultiText* t : texts_) {
    if (!t->widget()) continue;
    int tot = static_cast<int>(vertical_ ? t->lineCount() : t->model().maxLineLength());
    int vis = static_cast<int>(vertical_ ? t->visibleLines() : t->visibleColumns());
    total = std::max(total, tot);
    visible = first ? vis : std::min(visible, vis);
    if (first) value = static_cast<int>(vertical_ ? t->topLine() : t->leftColumn());
    first = false;
  }
  visible = std::max(1, visible);
  int maximum = std::max(total, visible);
  int slider = std::min(visible, maximum);
  value = std::clamp(value, 0, maximum - slider);
  XtVaSetValues(w, XmNminimum, 0, XmNmaximum, maximum, XmNsliderSize, slider, XmNvalue, value, XmNincrement, 1,
                XmNpageIncrement, std::max(1, slider - 1), nullptr);
  bool needed = !dynamic_ || total > visible;
  bool changed = false;
  if (needed && !XtIsManaged(w)) {
    XtManageChild(w);
    changed = true;
  } else if (!needed && XtIsManaged(w)) {
    XtUnmanageChild(w);
    changed = true;
  }
  updating_ = false;
  if (changed && onShownChanged) oiGuard("scroll bar layout", onShownChanged);
}

int OI_ScrollBar::value() const {
  int v = 0;
  if (widget()) XtVaGetValues(widget(), XmNvalue, &v, nullptr);
  return v;
}

void OI_ScrollBar::setValue(int value) {
  if (!widget()) return;
  int maximum = 0, slider = 0;
  XtVaGetValues(widget(), XmNmaximum, &maximum, XmNsliderSize, &slider, nullptr);
  value = std::clamp(value, 0, std::max(0, maximum - slider));
  XmScrollBarSetValues(widget(), value, slider, 0, 0, False);
  scrollTexts(value);
}

void OI_ScrollBar::textScrolled(OI_MultiText* text) {
  if (updating_ || !widget()) return;
  int v = static_cast<int>(vertical_ ? text->topLine() : text->leftColumn());
  int maximum = 0, slider = 0;
  XtVaGetValues(widget(), XmNmaximum, &maximum, XmNsliderSize, &slider, nullptr);
  XmScrollBarSetValues(widget(), std::clamp(v, 0, std::max(0, maximum - slider)), slider, 0, 0, False);
  scrollTexts(v);
}

void OI_ScrollBar::scrollTexts(int value) {
  updating_ = true;
  for (OI_MultiText* t : texts_) {
    if (vertical_) t->setTopLine(static_cast<uint32_t>(std::max(0, value)));
    else t->setLeftColumn(static_cast<uint32_t>(std::max(0, value)));
  }
  updating_ = false;
}

void OI_ScrollBar::movedCB(Widget, XtPointer client, XtPointer call) {
  auto* self = static_cast<OI_ScrollBar*>(client);
  auto* cb = static_cast<XmScrollBarCallbackStruct*>(call);
  oiGuard("scroll bar", [&] { self->scrollTexts(cb->value); });
}

void OI_ScrollBar::describe(std::ostream& out) const {
  int maximum = 0, slider = 0;
  if (widget()) XtVaGetValues(widget(), XmNmaximum, &maximum, XmNsliderSize, &slider, nullptr);
  out << " value=" << value() << " maximum=" << maximum << " slider=" << slider << " texts=" << texts_.size()
      << "\n";
}
