// Menus: menu bar, pulldown and popup panes, cells, option menus.
#include "toolkit/oi_menu.h"

#include <Xm/CascadeB.h>
#include <Xm/Label.h>
#include <Xm/PushB.h>
#include <Xm/RowColumn.h>
#include <Xm/Separator.h>
#include <Xm/ToggleB.h>

#include <cctype>

#include "toolkit/oi_window.h"
#include "toolkit/oi_xstring.h"


bool oiParseAccelerator(const std::string& binding, std::string& accelerator, std::string& text) {
  size_t colon = binding.find(':');
  std::string a = binding.substr(0, colon);
  while (!a.empty() && isspace(static_cast<unsigned char>(a.back()))) a.pop_back();
  while (!a.empty() && isspace(static_cast<unsigned char>(a.front()))) a.erase(0, 1);
  size_t key = a.find("<Key>");
  if (a.empty() || key == std::string::npos || key + 5 >= a.size()) return false;
  accelerator = a;
  std::string mods = a.substr(0, key), keysym = a.substr(key + 5);
  text.clear();
  for (const char* m : {"Ctrl", "Shift", "Alt", "Meta", "Mod1"}) {
    if (mods.find(m) == std::string::npos) continue;
    text += (std::string(m) == "Mod1" ? "Alt" : m);
    text += "+";
  }
  text += keysym;
  return true;
}

// ------------------------------------------------------------------ cells

OI_MenuCell::OI_MenuCell(Widget menu, const std::string& name, const std::string& label, bool check)
    : check_(check) {
  Widget w;
  if (check) {
    Arg args[2];
    XtSetArg(args[0], XmNvisibleWhenOff, True);
    XtSetArg(args[1], XmNindicatorOn, XmINDICATOR_CHECK_BOX);
    w = XmCreateToggleButton(menu, oiStr(name.c_str()), args, 2);
    XtAddCallback(w, XmNvalueChangedCallback, activateCB, this);
  } else {
    w = XmCreatePushButton(menu, oiStr(name.c_str()), nullptr, 0);
    XtAddCallback(w, XmNactivateCallback, activateCB, this);
  }
  adopt(w, name);
  oiLabelUnlessSet(w, label);
  readAcceleratorResource();
  XtManageChild(w);
}

void OI_MenuCell::readAcceleratorResource() {
  // "accelerators" in translation syntax ("Ctrl<Key>O: fire()") sets the cell's accelerator.
  std::string binding = resourceString("accelerators");
  std::string accel, text;
  if (!binding.empty() && oiParseAccelerator(binding, accel, text)) setAccelerator(accel, text);
}

void OI_MenuCell::setAccelerator(const std::string& accelerator, const std::string& text) {
  if (!widget()) return;
  OI_XmString t(text);
  XtVaSetValues(widget(), XmNaccelerator, accelerator.c_str(), XmNacceleratorText, static_cast<XmString>(t),
                nullptr);
}

bool OI_MenuCell::state() const { return check_ && widget() && XmToggleButtonGetState(widget()); }

void OI_MenuCell::setState(bool on) {
  if (check_ && widget()) XmToggleButtonSetState(widget(), on, False);
}

void OI_MenuCell::fire() {
  if (!widget() || !XtIsSensitive(widget())) return;
  if (check_) {
    XmToggleButtonSetState(widget(), !state(), True);
  } else {
    oiGuard("menu cell", [this] {
      if (onActivate) onActivate();
    });
  }
}

void OI_MenuCell::activateCB(Widget w, XtPointer client, XtPointer) {
  auto* self = static_cast<OI_MenuCell*>(client);
  oiGuard("menu cell", [&] {
    if (self->check_) {
      if (self->onToggle) self->onToggle(XmToggleButtonGetState(w));
    } else if (self->onActivate) {
      self->onActivate();
    }
  });
  oiRestoreFocus(w);
}

// ------------------------------------------------------------------ panes

OI_Menu::OI_Menu(Widget parent, const std::string& name, Kind kind) : kind_(kind) {
  Widget w = kind == popup ? XmCreatePopupMenu(parent, oiStr(name.c_str()), nullptr, 0)
                           : XmCreatePulldownMenu(parent, oiStr(name.c_str()), nullptr, 0);
  adopt(w, name);
}

OI_MenuCell* OI_Menu::addCell(const std::string& name, const std::string& label, std::function<void()> fn) {
  OI_MenuCell* c = own(std::make_unique<OI_MenuCell>(widget(), name, label, false));
  c->onActivate = std::move(fn);
  cells_.push_back(c);
  return c;
}

OI_MenuCell* OI_Menu::addCheck(const std::string& name, const std::string& label, bool set,
                               std::function<void(bool)> fn) {
  OI_MenuCell* c = own(std::make_unique<OI_MenuCell>(widget(), name, label, true));
  c->setState(set);
  c->onToggle = std::move(fn);
  cells_.push_back(c);
  return c;
}

void OI_Menu::addSeparator(const std::string& name) {
  Widget s = XmCreateSeparator(widget(), oiStr(name.c_str()), nullptr, 0);
  XtManageChild(s);
}

void OI_Menu::addTitle(const std::string& name, const std::string& label) {
  Widget t = XmCreateLabel(widget(), oiStr(name.c_str()), nullptr, 0);
  oiLabelUnlessSet(t, label);
  XtManageChild(t);
  addSeparator(name + "Separator");
}

OI_Menu* OI_Menu::addSubmenu(const std::string& name, const std::string& label, const std::string& paneName) {
  OI_Menu* sub = own(std::make_unique<OI_Menu>(widget(), paneName, pulldown));
  Arg args[1];
  XtSetArg(args[0], XmNsubMenuId, sub->widget());
  sub->cascade_ = XmCreateCascadeButton(widget(), oiStr(name.c_str()), args, 1);
  oiLabelUnlessSet(sub->cascade_, label);
  XtManageChild(sub->cascade_);
  return sub;
}

void OI_Menu::setRadio(bool on) {
  if (widget()) XtVaSetValues(widget(), XmNradioBehavior, on ? True : False, XmNradioAlwaysOne, on ? True : False,
                              nullptr);
  for (OI_MenuCell* c : cells_)
    if (c->isCheck() && c->widget()) XtVaSetValues(c->widget(), XmNindicatorType, on ? XmONE_OF_MANY : XmN_OF_MANY,
                                                   nullptr);
}

OI_MenuCell* OI_Menu::cell(const std::string& name) const {
  for (OI_MenuCell* c : cells_)
    if (c->name() == name) return c;
  return nullptr;
}

void OI_Menu::popupAt(XEvent* ev) {
  if (!widget() || kind_ != popup || !ev || ev->type != ButtonPress) return;
  XmMenuPosition(widget(), &ev->xbutton);
  XtManageChild(widget());
}

// ------------------------------------------------------------------ bar

OI_MenuBar::OI_MenuBar(Widget parent, const std::string& name) {
  Widget w = XmCreateMenuBar(parent, oiStr(name.c_str()), nullptr, 0);
  adopt(w, name);
  XtManageChild(w);
}

OI_Menu* OI_MenuBar::addPulldown(const std::string& name, const std::string& label, const std::string& paneName) {
  OI_Menu* m = own(std::make_unique<OI_Menu>(widget(), paneName, OI_Menu::pulldown));
  Arg args[1];
  XtSetArg(args[0], XmNsubMenuId, m->widget());
  m->cascade_ = XmCreateCascadeButton(widget(), oiStr(name.c_str()), args, 1);
  oiLabelUnlessSet(m->cascade_, label);
  XtManageChild(m->cascade_);
  menus_.push_back(m);
  return m;
}

void OI_MenuBar::setHelpPulldown(OI_Menu* menu) {
  if (menu && menu->cascade()) XtVaSetValues(widget(), XmNmenuHelpWidget, menu->cascade(), nullptr);
}

OI_Menu* OI_MenuBar::pulldown(const std::string& name) const {
  for (OI_Menu* m : menus_)
    if (m->name() == name || (m->cascade() && name == XtName(m->cascade()))) return m;
  return nullptr;
}

// ------------------------------------------------------------------ option menu

OI_OptionMenu::OI_OptionMenu(Widget parent, const std::string& name, const std::string& label) {
  pane_ = XmCreatePulldownMenu(parent, oiStr((name + "Pane").c_str()), nullptr, 0);
  OI_XmString s(label);
  Arg args[2];
  XtSetArg(args[0], XmNsubMenuId, pane_);
  XtSetArg(args[1], XmNlabelString, static_cast<XmString>(s));
  Widget w = XmCreateOptionMenu(parent, oiStr(name.c_str()), args, 2);
  adopt(w, name);
  XtManageChild(w);
}

void OI_OptionMenu::addChoice(const std::string& name, const std::string& label) {
  Widget b = XmCreatePushButton(pane_, oiStr(name.c_str()), nullptr, 0);
  oiLabelUnlessSet(b, label);
  XtAddCallback(b, XmNactivateCallback, chosenCB, this);
  XtManageChild(b);
  choices_.emplace_back(name, b);
}

void OI_OptionMenu::setChoice(const std::string& name) {
  for (auto& [n, b] : choices_)
    if (n == name && widget()) XtVaSetValues(widget(), XmNmenuHistory, b, nullptr);
}

void OI_OptionMenu::setColumnLength(int length) {
  if (!pane_ || length <= 0 || choices_.size() <= static_cast<size_t>(length)) return;
  const short columns = static_cast<short>((choices_.size() + static_cast<size_t>(length) - 1) / static_cast<size_t>(length));
  XtVaSetValues(pane_, XmNpacking, XmPACK_COLUMN, XmNorientation, XmVERTICAL, XmNnumColumns, columns, nullptr);
}

std::string OI_OptionMenu::choice() const {
  if (!widget()) return {};
  Widget b = nullptr;
  XtVaGetValues(widget(), XmNmenuHistory, &b, nullptr);
  return b ? XtName(b) : "";
}

void OI_OptionMenu::chosenCB(Widget w, XtPointer client, XtPointer) {
  auto* self = static_cast<OI_OptionMenu*>(client);
  oiGuard("option menu", [&] {
    if (self->onChange) self->onChange(XtName(w));
  });
  oiRestoreFocus(self->widget());
}

void OI_OptionMenu::describe(std::ostream& out) const { out << " choice=" << choice() << "\n"; }
