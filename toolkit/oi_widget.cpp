// The base of the toolkit's C++ objects.
#include "toolkit/oi_widget.h"

#include <Xm/Xm.h>

#include <cstdio>
#include <exception>
#include <unordered_map>

#include "toolkit/oi_xstring.h"

namespace {
std::unordered_map<Widget, OI_Widget*>& registry() {
  static std::unordered_map<Widget, OI_Widget*> r;
  return r;
}
}  // namespace

void oiGuard(const char* where, const std::function<void()>& body) {
  try {
    body();
  } catch (const std::exception& e) {
    fprintf(stderr, "Kestrelgauge: %s: %s\n", where, e.what());
  } catch (...) {
    fprintf(stderr, "Kestrelgauge: %s: unexpected failure\n", where);
  }
}

OI_Widget::~OI_Widget() {
  // Children first: each destroys its own widget while the parent's still stands.
  while (!owned_.empty()) owned_.pop_back();
  if (widget_) {
    Widget w = widget_;
    XtRemoveCallback(w, XmNdestroyCallback, destroyedCB, this);
    registry().erase(w);
    widget_ = nullptr;
    XtDestroyWidget(w);
  }
}

void OI_Widget::adopt(Widget w, const std::string& name) {
  widget_ = w;
  name_ = name;
  registry()[w] = this;
  XtAddCallback(w, XmNdestroyCallback, destroyedCB, this);
}

void OI_Widget::destroyedCB(Widget w, XtPointer client, XtPointer) {
  auto* self = static_cast<OI_Widget*>(client);
  registry().erase(w);
  if (self->widget_ == w) {
    self->widget_ = nullptr;
    oiGuard("widget destroyed", [self] { self->widgetDestroyed(); });
  }
}

OI_Widget* OI_Widget::fromWidget(Widget w) {
  auto it = registry().find(w);
  return it == registry().end() ? nullptr : it->second;
}

OI_Widget* OI_Widget::enclosing(Widget w) {
  for (; w; w = XtParent(w))
    if (OI_Widget* o = fromWidget(w)) return o;
  return nullptr;
}

Display* OI_Widget::display() const { return widget_ ? XtDisplay(widget_) : nullptr; }

void OI_Widget::manage() {
  if (widget_) XtManageChild(widget_);
}

void OI_Widget::unmanage() {
  if (widget_) XtUnmanageChild(widget_);
}

bool OI_Widget::isManaged() const { return widget_ && XtIsManaged(widget_); }

void OI_Widget::setSensitive(bool on) {
  if (widget_) XtSetSensitive(widget_, on);
}

bool OI_Widget::isSensitive() const { return widget_ && XtIsSensitive(widget_); }

bool OI_Widget::isViewable() const {
  if (!widget_ || !XtIsRealized(widget_)) return false;
  XWindowAttributes a;
  if (!XGetWindowAttributes(XtDisplay(widget_), XtWindow(widget_), &a)) return false;
  return a.map_state == IsViewable;
}

void OI_Widget::setLabel(const std::string& text) {
  if (!widget_) return;
  OI_XmString s(text);
  XtVaSetValues(widget_, XmNlabelString, static_cast<XmString>(s), nullptr);
}

std::string OI_Widget::label() const {
  if (!widget_) return {};
  XmString s = nullptr;
  XtVaGetValues(widget_, XmNlabelString, &s, nullptr);
  std::string out = oiXmStringText(s);
  if (s) XmStringFree(s);
  return out;
}

void OI_Widget::overrideTranslations(const std::string& table) {
  if (!widget_) return;
  XtTranslations t = XtParseTranslationTable(table.c_str());
  if (t) XtOverrideTranslations(widget_, t);
}

void OI_Widget::takeFocus() {
  if (widget_) XmProcessTraversal(widget_, XmTRAVERSE_CURRENT);
}

std::string OI_Widget::resourceString(const char* name, const char* cls) const {
  if (!widget_) return {};
  std::string className = cls ? cls : name;
  if (!cls && !className.empty() && className[0] >= 'a' && className[0] <= 'z') className[0] -= 'a' - 'A';
  XtResource r = {oiStr(name), oiStr(className.c_str()), oiStr(XtRString), sizeof(String), 0,
                  oiStr(XtRString), nullptr};
  String value = nullptr;
  XtGetApplicationResources(widget_, &value, &r, 1, nullptr, 0);
  return value ? value : "";
}

void OI_Widget::describe(std::ostream&) const {}

void oiLabelUnlessSet(Widget w, const std::string& label) {
  XtResource r = {oiStr("labelString"), oiStr("LabelString"), oiStr(XtRString), sizeof(String), 0,
                  oiStr(XtRString), nullptr};
  String value = nullptr;
  XtGetApplicationResources(w, &value, &r, 1, nullptr, 0);
  if (value) return;
  OI_XmString s(label);
  XtVaSetValues(w, XmNlabelString, static_cast<XmString>(s), nullptr);
}
