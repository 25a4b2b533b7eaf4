// The test hook: a readable dump of every window's widgets on SIGUSR1.
#include "toolkit/oi_test_hook.h"

#include <X11/IntrinsicP.h>
#include <X11/CoreP.h>
#include <X11/CompositeP.h>
#include <X11/Shell.h>
#include <Xm/Label.h>
#include <Xm/List.h>
#include <Xm/LabelG.h>
#include <Xm/Text.h>
#include <Xm/TextF.h>
#include <Xm/ToggleB.h>
#include <Xm/ToggleBG.h>
#include <Xm/Xm.h>

#include <csignal>
#include <cstdio>
#include <cstdlib>
#include <fstream>
#include <sstream>

#include "toolkit/oi_application.h"
#include "toolkit/oi_widget.h"
#include "toolkit/oi_xstring.h"

namespace {

XtSignalId hookSignal = 0;
std::string hookPath;

void onSignal(int) {
  if (hookSignal) XtNoticeSignal(hookSignal);
}

std::string pathOf(Widget w) {
  std::string p;
  for (; w; w = XtParent(w)) p = std::string(XtName(w)) + (p.empty() ? "" : "." + p);
  return p;
}

void describeWidget(Widget w, std::ostream& out, Display* d) {
  out << pathOf(w) << " class=" << XtClass(w)->core_class.class_name << " managed=" << (XtIsManaged(w) ? 1 : 0)
      << " sensitive=" << (XtIsSensitive(w) ? 1 : 0);
  if (XtIsWidget(w) && XtIsRealized(w)) {
    XWindowAttributes a;
    bool viewable = XGetWindowAttributes(d, XtWindow(w), &a) && a.map_state == IsViewable;
    Position x = 0, y = 0;
    XtTranslateCoords(w, 0, 0, &x, &y);
    out << " viewable=" << (viewable ? 1 : 0) << " geom=" << x << "," << y << "," << w->core.width << "x"
        << w->core.height;
  } else if (!XtIsWidget(w)) {
    // Gadgets share their parent's window; their place is relative to it.
    Widget p = XtParent(w);
    Position x = 0, y = 0;
    if (XtIsRealized(p)) XtTranslateCoords(p, w->core.x, w->core.y, &x, &y);
    bool viewable = false;
    if (XtIsRealized(p)) {
      XWindowAttributes a;
      viewable = XGetWindowAttributes(d, XtWindow(p), &a) && a.map_state == IsViewable && XtIsManaged(w);
    }
    out << " viewable=" << (viewable ? 1 : 0) << " geom=" << x << "," << y << "," << w->core.width << "x"
        << w->core.height;
  }
  if (XmIsLabel(w) || XmIsLabelGadget(w)) {
    XmString s = nullptr;
    XtVaGetValues(w, XmNlabelString, &s, nullptr);
    out << " label=\"" << oiXmStringText(s) << "\"";
    if (s) XmStringFree(s);
  }
  if (XmIsToggleButton(w) || XmIsToggleButtonGadget(w)) out << " set=" << (XmToggleButtonGetState(w) ? 1 : 0);
  if (XtIsWMShell(w)) {
    String title = nullptr, icon = nullptr;
    XtVaGetValues(w, XtNtitle, &title, XtNiconName, &icon, nullptr);
    out << " title=\"" << (title ? title : "") << "\" iconName=\"" << (icon ? icon : "") << "\"";
  }
  if (XmIsList(w) && !OI_Widget::fromWidget(w)) {
    XmStringTable items = nullptr;
    int n = 0;
    XtVaGetValues(w, XmNitems, &items, XmNitemCount, &n, nullptr);
    out << " items=" << n << "\n";
    for (int i = 0; i < n; ++i) out << "  item: " << oiXmStringText(items[i]) << "\n";
    return;
  }
  if (XmIsTextField(w) || XmIsText(w)) {
    char* v = XmIsTextField(w) ? XmTextFieldGetString(w) : XmTextGetString(w);
    out << " value=\"" << (v ? v : "") << "\"";
    XtFree(v);
  }
  if (OI_Widget* o = OI_Widget::fromWidget(w)) {
    std::ostringstream more;
    o->describe(more);
    std::string s = more.str();
    if (s.empty()) out << "\n";
    else out << s;
  } else {
    out << "\n";
  }
}

void walk(Widget w, std::ostream& out, Display* d) {
  if (w->core.being_destroyed) return;
  describeWidget(w, out, d);
  if (XtIsComposite(w)) {
    auto* cw = reinterpret_cast<CompositeWidget>(w);
    for (Cardinal i = 0; i < cw->composite.num_children; ++i) walk(cw->composite.children[i], out, d);
  }
  if (XtIsWidget(w))
    for (Cardinal i = 0; i < w->core.num_popups; ++i) walk(w->core.popup_list[i], out, d);
}

void hookProc(XtPointer client, XtSignalId*) {
  auto* app = static_cast<OI_Application*>(client);
  oiGuard("test hook", [&] { oiWriteTestState(*app, hookPath); });
}

}  // namespace

bool oiWriteTestState(OI_Application& app, const std::string& path) {
  std::ostringstream out;
  Display* d = app.display();
  out << "busy=" << app.busyCount() << "\n";
  for (Widget top : app.topLevels()) {
    Widget focus = XmGetFocusWidget(top);
    if (focus) out << "focus " << pathOf(top) << " = " << pathOf(focus) << "\n";
  }
  walk(app.shell(), out, d);
  out << "end\n";
  std::string tmp = path + ".tmp";
  {
    std::ofstream f(tmp, std::ios::trunc);
    if (!f) return false;
    f << out.str();
    if (!f) return false;
  }
  return rename(tmp.c_str(), path.c_str()) == 0;
}

void oiInstallTestHook(OI_Application& app) {
  const char* p = getenv("KG_TEST_HOOK");
  if (!p || !*p) return;
  hookPath = p;
  hookSignal = XtAppAddSignal(app.context(), hookProc, &app);
  struct sigaction sa {};
  sa.sa_handler = onSignal;
  sigemptyset(&sa.sa_mask);
  sa.sa_flags = 0;  // the event wait must be interrupted to see the signal
  sigaction(SIGUSR1, &sa, nullptr);
  // A first state tells the test that the signal may be sent from now on.
  oiWriteTestState(app, hookPath);
}
