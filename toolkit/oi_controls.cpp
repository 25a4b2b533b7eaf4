// Plain controls over Motif widgets.
#include "toolkit/oi_controls.h"

#include <Xm/Frame.h>
#include <Xm/Label.h>
#include <Xm/List.h>
#include <Xm/PushB.h>
#include <Xm/RowColumn.h>
#include <Xm/Separator.h>
#include <Xm/TextF.h>
#include <Xm/ToggleB.h>

#include "toolkit/oi_window.h"
#include "toolkit/oi_xstring.h"


OI_Box::OI_Box(Widget parent, const std::string& name, Direction dir) {
  Arg args[2];
  XtSetArg(args[0], XmNorientation, dir == horizontal ? XmHORIZONTAL : XmVERTICAL);
  XtSetArg(args[1], XmNpacking, XmPACK_TIGHT);
  Widget w = XmCreateRowColumn(parent, oiStr(name.c_str()), args, 2);
  adopt(w, name);
  XtManageChild(w);
}

void OI_Box::setSpacing(int pixels) {
  if (widget()) XtVaSetValues(widget(), XmNspacing, pixels, nullptr);
}

OI_Label::OI_Label(Widget parent, const std::string& name, const std::string& text) {
  Widget w = XmCreateLabel(parent, oiStr(name.c_str()), nullptr, 0);
  adopt(w, name);
  oiLabelUnlessSet(w, text);
  XtManageChild(w);
}

OI_Separator::OI_Separator(Widget parent, const std::string& name, bool vertical) {
  Arg args[1];
  XtSetArg(args[0], XmNorientation, vertical ? XmVERTICAL : XmHORIZONTAL);
  Widget w = XmCreateSeparator(parent, oiStr(name.c_str()), args, 1);
  adopt(w, name);
  XtManageChild(w);
}

OI_Button::OI_Button(Widget parent, const std::string& name, const std::string& label, std::function<void()> fn)
    : onActivate(std::move(fn)) {
  Widget w = XmCreatePushButton(parent, oiStr(name.c_str()), nullptr, 0);
  adopt(w, name);
  oiLabelUnlessSet(w, label);
  XtAddCallback(w, XmNactivateCallback, activateCB, this);
  XtManageChild(w);
}

void OI_Button::setIcon(const unsigned char* bits, int width, int height) {
  Widget w = widget();
  if (!w || !bits) return;
  Pixel fg = 0, bg = 0;
  XtVaGetValues(w, XmNforeground, &fg, XmNbackground, &bg, nullptr);
  Display* d = XtDisplay(w);
  Pixmap p = XCreatePixmapFromBitmapData(d, RootWindowOfScreen(XtScreen(w)),
                                         const_cast<char*>(reinterpret_cast<const char*>(bits)),
                                         static_cast<unsigned>(width), static_cast<unsigned>(height), fg, bg,
                                         static_cast<unsigned>(DefaultDepthOfScreen(XtScreen(w))));
  if (p == None) return;
  XtVaSetValues(w, XmNlabelType, XmPIXMAP, XmNlabelPixmap, p, nullptr);
  icon_ = OI_Pixmap(d, p);  // the old one is freed only after the button stopped using it
}

void OI_Button::setBevelWidth(int pixels) {
  if (widget()) XtVaSetValues(widget(), XmNshadowThickness, pixels, nullptr);
}

void OI_Button::press() {
  if (!widget() || !XtIsSensitive(widget())) return;
  oiGuard("button", [this] {
    if (onActivate) onActivate();
  });
}

void OI_Button::activateCB(Widget w, XtPointer client, XtPointer) {
  auto* self = static_cast<OI_Button*>(client);
  oiGuard("button", [self] {
    if (self->onActivate) self->onActivate();
  });
  oiRestoreFocus(w);
}

OI_EntryField::OI_EntryField(Widget parent, const std::string& name, int columns) {
  Arg args[1];
  XtSetArg(args[0], XmNcolumns, columns);
  Widget w = XmCreateTextField(parent, oiStr(name.c_str()), args, 1);
  adopt(w, name);
  XtAddCallback(w, XmNactivateCallback, activateCB, this);
  XtManageChild(w);
}

std::string OI_EntryField::text() const {
  if (!widget()) return {};
  char* v = XmTextFieldGetString(widget());
  std::string s = v ? v : "";
  XtFree(v);
  return s;
}

void OI_EntryField::setText(const std::string& text) {
  if (widget()) XmTextFieldSetString(widget(), const_cast<char*>(text.c_str()));
}

void OI_EntryField::activateCB(Widget, XtPointer client, XtPointer) {
  auto* self = static_cast<OI_EntryField*>(client);
  oiGuard("entry field", [self] {
    if (self->onActivate) self->onActivate(self->text());
  });
}

void OI_EntryField::describe(std::ostream&) const {}

OI_Frame::OI_Frame(Widget parent, const std::string& name, const std::string& title) {
  Widget w = XmCreateFrame(parent, oiStr(name.c_str()), nullptr, 0);
  adopt(w, name);
  if (!title.empty()) {
    Arg args[1];
    XtSetArg(args[0], XmNframeChildType, XmFRAME_TITLE_CHILD);
    Widget t = XmCreateLabel(w, oiStr((name + "Title").c_str()), args, 1);
    oiLabelUnlessSet(t, title);
    XtManageChild(t);
  }
  XtManageChild(w);
}

void OI_Button::setToolTip(const std::string& text) {
  if (!widget()) return;
  XmString current = nullptr;
  XtVaGetValues(widget(), XmNtoolTipString, &current, nullptr);
  if (current) return;  // the user's resource
  OI_XmString s(text);
  XtVaSetValues(widget(), XmNtoolTipString, static_cast<XmString>(s), nullptr);
}

OI_OneOfMany::OI_OneOfMany(Widget parent, const std::string& name) {
  Widget w = XmCreateRadioBox(parent, oiStr(name.c_str()), nullptr, 0);
  adopt(w, name);
  XtManageChild(w);
}

void OI_OneOfMany::addChoice(const std::string& name, const std::string& label) {
  if (!widget()) return;
  Widget t = XmCreateToggleButton(widget(), oiStr(name.c_str()), nullptr, 0);
  oiLabelUnlessSet(t, label);
  XtManageChild(t);
  choices_.push_back(t);
}

int OI_OneOfMany::selected() const {
  for (size_t i = 0; i < choices_.size(); ++i)
    if (XmToggleButtonGetState(choices_[i])) return static_cast<int>(i);
  return -1;
}

void OI_OneOfMany::select(int index) {
  for (size_t i = 0; i < choices_.size(); ++i)
    XmToggleButtonSetState(choices_[i], static_cast<int>(i) == index ? True : False, False);
}

OI_ScrolledList::OI_ScrolledList(Widget parent, const std::string& name, int visibleItems, int columns) {
  Arg args[3];
  XtSetArg(args[0], XmNvisibleItemCount, visibleItems);
  XtSetArg(args[1], XmNselectionPolicy, XmBROWSE_SELECT);
  XtSetArg(args[2], XmNlistSizePolicy, columns > 0 ? XmCONSTANT : XmVARIABLE);
  Widget w = XmCreateScrolledList(parent, oiStr(name.c_str()), args, 3);
  adopt(w, name);
  XmRenderTable fonts = nullptr;
  XtVaGetValues(w, XmNrenderTable, &fonts, nullptr);
  if (columns > 0 && fonts) {
    OI_XmString sample(std::string(static_cast<size_t>(columns), '0'));
    XtVaSetValues(w, XmNwidth, XmStringWidth(fonts, sample), nullptr);
  }
  XtAddCallback(w, XmNbrowseSelectionCallback, selectCB, this);
  XtAddCallback(w, XmNdefaultActionCallback, defaultCB, this);
  XtManageChild(w);
}

void OI_ScrolledList::setItems(const std::vector<std::string>& items) {
  if (!widget()) return;
  XmListDeleteAllItems(widget());
  for (const auto& i : items) {
    OI_XmString s(i);
    XmListAddItemUnselected(widget(), s, 0);
  }
}

std::vector<std::string> OI_ScrolledList::items() const {
  std::vector<std::string> out;
  if (!widget()) return out;
  XmStringTable table = nullptr;
  int n = 0;
  XtVaGetValues(widget(), XmNitems, &table, XmNitemCount, &n, nullptr);
  for (int i = 0; i < n; ++i) out.push_back(oiXmStringText(table[i]));
  return out;
}

int OI_ScrolledList::selectedIndex() const {
  if (!widget()) return -1;
  int* positions = nullptr;
  int n = 0;
  int index = -1;
  if (XmListGetSelectedPos(widget(), &positions, &n) && n > 0) index = positions[0] - 1;
  XtFree(reinterpret_cast<char*>(positions));
  return index;
}

void OI_ScrolledList::select(int index) {
  if (!widget()) return;
  XmListDeselectAllItems(widget());
  if (index >= 0) XmListSelectPos(widget(), index + 1, False);
}

void OI_ScrolledList::selectCB(Widget, XtPointer client, XtPointer call) {
  auto* self = static_cast<OI_ScrolledList*>(client);
  auto* cb = static_cast<XmListCallbackStruct*>(call);
  oiGuard("list", [&] {
    if (self->onSelect) self->onSelect(cb->item_position - 1);
  });
}

void OI_ScrolledList::defaultCB(Widget, XtPointer client, XtPointer call) {
  auto* self = static_cast<OI_ScrolledList*>(client);
  auto* cb = static_cast<XmListCallbackStruct*>(call);
  oiGuard("list", [&] {
    if (self->onDefaultAction) self->onDefaultAction(cb->item_position - 1);
  });
}

void OI_ScrolledList::describe(std::ostream& out) const {
  out << " selected=" << selectedIndex() << "\n";
  for (const auto& i : items()) out << "  item: " << i << "\n";
}
