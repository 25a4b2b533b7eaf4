// Top-level windows.
#include "toolkit/oi_window.h"

#include <X11/Shell.h>
#include <Xm/MainW.h>
#include <Xm/Protocols.h>
#include <Xm/Xm.h>

#include <algorithm>
#include <map>

#include "toolkit/oi_application.h"
#include "toolkit/oi_menu.h"
#include "toolkit/oi_xstring.h"

namespace {
std::map<Widget, Widget>& focusHomes() {
  static std::map<Widget, Widget> homes;
  return homes;
}

Widget shellOf(Widget w) {
  while (w && !XtIsShell(w)) w = XtParent(w);
  return w;
}
}  // namespace

void oiRestoreFocus(Widget w) {
  Widget shell = shellOf(w);
  // Menus live in their own shells: climb to the window that holds the menu's cascade.
  while (shell && XtParent(shell) && focusHomes().count(shell) == 0) shell = shellOf(XtParent(shell));
  auto it = focusHomes().find(shell);
  if (it != focusHomes().end() && it->second && OI_Widget::fromWidget(it->second))
    XmProcessTraversal(it->second, XmTRAVERSE_CURRENT);
}

OI_TopLevel::OI_TopLevel(const std::string& name, const std::string& title) {
  OI_Application* app = OI_Application::instance();
  Arg args[4];
  XtSetArg(args[0], XmNdeleteResponse, XmDO_NOTHING);
  XtSetArg(args[1], XmNtitle, const_cast<char*>(title.c_str()));
  XtSetArg(args[2], XmNiconName, const_cast<char*>(title.c_str()));
  XtSetArg(args[3], XmNtoolTipEnable, True);  // buttons that carry tips show them
  Widget shell = XtCreatePopupShell(name.c_str(), topLevelShellWidgetClass, app->shell(), args, 4);
  adopt(shell, name);
  shell_ = shell;
  main_ = XmCreateMainWindow(shell, oiStr("mainWindow"), nullptr, 0);
  XtManageChild(main_);
  Atom del = XmInternAtom(XtDisplay(shell), oiStr("WM_DELETE_WINDOW"), False);
  XmAddWMProtocolCallback(shell, del, closeCB, this);
  XtAddEventHandler(shell, StructureNotifyMask, False, structureHandler, this);
  app->addTopLevel(shell);
}

OI_TopLevel::~OI_TopLevel() { widgetDestroyed(); }

void OI_TopLevel::widgetDestroyed() {
  if (shell_) {
    focusHomes().erase(shell_);
    if (OI_Application* app = OI_Application::instance()) app->removeTopLevel(shell_);
  }
  shell_ = nullptr;
  main_ = nullptr;
}

OI_MenuBar* OI_TopLevel::menuBar(const std::string& name) {
  if (!menuBar_) {
    menuBar_ = own(std::make_unique<OI_MenuBar>(main_, name));
    XtVaSetValues(main_, XmNmenuBar, menuBar_->widget(), nullptr);
  }
  return menuBar_;
}

void OI_TopLevel::setWorkArea(Widget w) { XtVaSetValues(main_, XmNworkWindow, w, nullptr); }

void OI_TopLevel::setTitle(const std::string& title) {
  if (widget()) XtVaSetValues(widget(), XmNtitle, title.c_str(), nullptr);
}

void OI_TopLevel::setIconName(const std::string& name) {
  if (widget()) XtVaSetValues(widget(), XmNiconName, name.c_str(), nullptr);
}

void OI_TopLevel::setIcon(const unsigned char* bits, int width, int height) {
  Widget w = widget();
  if (!w || !bits || width <= 0 || height <= 0) return;
  Display* d = XtDisplay(w);
  Pixmap p = XCreateBitmapFromData(d, RootWindowOfScreen(XtScreen(w)), reinterpret_cast<const char*>(bits),
                                   static_cast<unsigned>(width), static_cast<unsigned>(height));
  XtVaSetValues(w, XmNiconPixmap, p, nullptr);
  icon_ = OI_Pixmap(d, p);  // the old one goes only after the shell stopped using it
}

void OI_TopLevel::raise() {
  Widget w = widget();
  if (w && XtIsRealized(w)) XRaiseWindow(XtDisplay(w), XtWindow(w));
}

void OI_TopLevel::setMinSize(int width, int height) {
  if (widget()) XtVaSetValues(widget(), XmNminWidth, width, XmNminHeight, height, nullptr);
}

void OI_TopLevel::show() {
  if (!widget()) return;
  XtPopup(widget(), XtGrabNone);
  shown_ = true;
}

void OI_TopLevel::hide() {
  if (!widget()) return;
  XtPopdown(widget());
  shown_ = false;
}

namespace {
void clearAll(Widget w) {
  if (!XtIsWidget(w) || !XtIsRealized(w)) return;
  XClearArea(XtDisplay(w), XtWindow(w), 0, 0, 0, 0, True);
  if (!XtIsComposite(w)) return;
  WidgetList kids = nullptr;
  Cardinal n = 0;
  XtVaGetValues(w, XmNchildren, &kids, XmNnumChildren, &n, nullptr);
  for (Cardinal i = 0; i < n; ++i) clearAll(kids[i]);
}
}  // namespace

void OI_TopLevel::refresh() {
  if (widget()) clearAll(widget());
}

void OI_TopLevel::setFocusHome(OI_Widget* w) {
  if (widget()) focusHomes()[widget()] = w ? w->widget() : nullptr;
}

void OI_TopLevel::closeCB(Widget, XtPointer client, XtPointer) {
  auto* self = static_cast<OI_TopLevel*>(client);
  oiGuard("window close", [self] {
    if (self->onClose) self->onClose();
  });
}

void OI_TopLevel::structureHandler(Widget, XtPointer client, XEvent* ev, Boolean*) {
  auto* self = static_cast<OI_TopLevel*>(client);
  if (ev->type != ConfigureNotify) return;
  int w = ev->xconfigure.width, h = ev->xconfigure.height;
  if (w == self->lastW_ && h == self->lastH_) return;
  self->lastW_ = w;
  self->lastH_ = h;
  oiGuard("window resize", [&] {
    if (self->onResize) self->onResize(w, h);
  });
}
