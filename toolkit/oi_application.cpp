// The application: display connection, resource database, event loop, timers and busy pointer.
#include "toolkit/oi_application.h"

#include <X11/IntrinsicP.h>
#include <X11/CompositeP.h>
#include <X11/CoreP.h>
#include <X11/Shell.h>
#include <X11/ShellP.h>
#include <X11/cursorfont.h>
#include <Xm/DialogS.h>
#include <Xm/MenuShell.h>
#include <Xm/Xm.h>

#include <algorithm>
#include <cstring>
#include <ctime>
#include <deque>

#include "toolkit/oi_test_hook.h"
#include "toolkit/oi_widget.h"
#include "toolkit/oi_xstring.h"

namespace {
OI_Application* theApp = nullptr;

// Options whose values become resources over the installed database, as Xt reads them.
XrmOptionDescRec commandLineOptions[] = {
    {oiStr("-xrm"), nullptr, XrmoptionResArg, nullptr},
    {oiStr("-geometry"), oiStr(".geometry"), XrmoptionSepArg, nullptr},
    {oiStr("-title"), oiStr(".title"), XrmoptionSepArg, nullptr},
    {oiStr("-bg"), oiStr("*background"), XrmoptionSepArg, nullptr},
    {oiStr("-background"), oiStr("*background"), XrmoptionSepArg, nullptr},
    {oiStr("-fg"), oiStr("*foreground"), XrmoptionSepArg, nullptr},
    {oiStr("-foreground"), oiStr("*foreground"), XrmoptionSepArg, nullptr},
    {oiStr("-iconic"), oiStr(".iconic"), XrmoptionNoArg, oiStr("on")},
    // The texts draw with their "fontName" (an Xft pattern or a core font name).
    {oiStr("-fn"), oiStr("*fontName"), XrmoptionSepArg, nullptr},
    {oiStr("-font"), oiStr("*fontName"), XrmoptionSepArg, nullptr},
};
}  // namespace

long long oiNowMs() {
  timespec ts;
  clock_gettime(CLOCK_MONOTONIC, &ts);
  return static_cast<long long>(ts.tv_sec) * 1000 + ts.tv_nsec / 1000000;
}

struct OI_Application::Timer {
  enum Kind { timeout, work, idle } kind = timeout;
  XtIntervalId interval = 0;
  XtWorkProcId workId = 0;
  unsigned long ms = 0;
  std::function<void()> fn;
  std::function<bool()> workFn;
};

OI_TimerHandle::OI_TimerHandle(OI_TimerHandle&& o) noexcept : id_(o.id_) { o.id_ = 0; }

OI_TimerHandle& OI_TimerHandle::operator=(OI_TimerHandle&& o) noexcept {
  if (this != &o) {
    id_ = o.id_;
    o.id_ = 0;
  }
  return *this;
}

void OI_TimerHandle::cancel() {
  if (id_ && theApp) theApp->cancelTimer(id_);
  id_ = 0;
}

bool OI_TimerHandle::pending() const { return id_ && theApp && theApp->timerPending(id_); }

OI_Application* OI_Application::instance() { return theApp; }

namespace {
XtEventDispatchProc keyDispatcher = nullptr;
XtEventDispatchProc buttonDispatcher = nullptr;

// Every key and button press passes here on its way to its widget: the user is active.
Boolean noteActivity(XEvent* ev) {
  if (theApp) theApp->noteUserActivity();
  XtEventDispatchProc next = ev->type == KeyPress ? keyDispatcher : buttonDispatcher;
  return next ? next(ev) : False;
}
}  // namespace

bool OI_Application::open(int& argc, char** argv, std::string& error, const char* const* fallbacks) {
  if (theApp) return true;
  // The -xrm and related settings are kept to be put over a database installed later.
  std::vector<std::string> xrm;
  for (int i = 1; i + 1 < argc; ++i) {
    for (const auto& o : commandLineOptions) {
      if (strcmp(argv[i], o.option) != 0 || o.argKind == XrmoptionNoArg) continue;
      if (o.argKind == XrmoptionResArg) xrm.push_back(argv[i + 1]);
      else xrm.push_back(std::string(o.specifier) + ": " + argv[i + 1]);
    }
    if (strcmp(argv[i], "-iconic") == 0) xrm.push_back(".iconic: on");
  }
  XtToolkitInitialize();
  XtAppContext ctx = XtCreateApplicationContext();
  if (fallbacks) XtAppSetFallbackResources(ctx, const_cast<String*>(fallbacks));
  Display* d = XtOpenDisplay(ctx, nullptr, oiStr(appName), oiStr(appClass), nullptr, 0, &argc, argv);
  if (!d) {
    const char* name = nullptr;
    for (int i = 1; i + 1 < argc; ++i)
      if (strcmp(argv[i], "-display") == 0) name = argv[i + 1];
    error = std::string("Can't open display ") + XDisplayName(name);
    XtDestroyApplicationContext(ctx);
    return false;
  }
  auto* app = new OI_Application;
  app->context_ = ctx;
  app->display_ = d;
  app->commandLineXrm_ = std::move(xrm);
  Arg args[2];
  XtSetArg(args[0], XmNmappedWhenManaged, False);
  // "-name" renames the application for its resources, as in every X program.
  String name = nullptr, cls = nullptr;
  XtGetApplicationNameAndClass(d, &name, &cls);
  app->shell_ = XtAppCreateShell(name ? name : appName, appClass, applicationShellWidgetClass, d, args, 1);
  app->busyCursor_ = XCreateFontCursor(d, XC_watch);
  app->lastActivity_ = oiNowMs();
  theApp = app;
  keyDispatcher = XtSetEventDispatcher(d, KeyPress, noteActivity);
  buttonDispatcher = XtSetEventDispatcher(d, ButtonPress, noteActivity);
  oiInstallTestHook(*app);
  return true;
}

void OI_Application::close() {
  delete theApp;
  theApp = nullptr;
}

OI_Application::~OI_Application() {
  timers_.clear();
  if (shell_) XtDestroyWidget(shell_);
  // Destruction is two-phase: let Xt finish it before the display goes.
  if (busyCursor_ != None) XFreeCursor(display_, busyCursor_);
  XtCloseDisplay(display_);
  XtDestroyApplicationContext(context_);
}

std::string OI_Application::displayResources() const {
  const char* s = XResourceManagerString(display_);
  return s ? s : "";
}

void OI_Application::installDatabase(XrmDatabase db, bool commandLineOnTop) {
  if (commandLineOnTop)
    for (const auto& line : commandLineXrm_) XrmPutLineResource(&db, line.c_str());
  XrmSetDatabase(display_, db);
}

XrmDatabase OI_Application::database() const { return XrmGetDatabase(display_); }

void OI_Application::run() {
  while (!quitting()) processOne();
}

void OI_Application::quit() {
  XtAppSetExitFlag(context_);
  wake();
}

void OI_Application::wake() {
  // The event wait returns only for an X event: send one to the (unmapped) application shell.
  if (shell_ && !XtIsRealized(shell_)) {
    XtVaSetValues(shell_, XmNwidth, 1, XmNheight, 1, nullptr);
    XtRealizeWidget(shell_);
  }
  if (shell_) {
    XEvent ev{};
    ev.xclient.type = ClientMessage;
    ev.xclient.window = XtWindow(shell_);
    ev.xclient.message_type = XInternAtom(display_, "KG_WAKE", False);
    ev.xclient.format = 32;
    XSendEvent(display_, XtWindow(shell_), False, NoEventMask, &ev);
    XFlush(display_);
  }
}

bool OI_Application::quitting() const { return XtAppGetExitFlag(context_); }

void OI_Application::processOne() {
  // One event, timer, input or signal; waits when none is pending.
  XtAppProcessEvent(context_, XtIMAll);
}


void OI_Application::processPending() {
  XSync(display_, False);
  while (XtAppPending(context_) && !quitting()) XtAppProcessEvent(context_, XtIMAll);
}

void OI_Application::noteUserActivity() { lastActivity_ = oiNowMs(); }

bool OI_Application::anyWindowOpen() const {
  for (Widget top : topLevels_) {
    if (!XtIsRealized(top)) continue;
    XWindowAttributes a;
    if (XGetWindowAttributes(display_, XtWindow(top), &a) && a.map_state == IsViewable) return true;
  }
  return false;
}

namespace {

Widget showingPopup(Widget w) {
  if (w->core.being_destroyed) return nullptr;
  if ((XmIsMenuShell(w) || XmIsDialogShell(w)) && reinterpret_cast<ShellWidget>(w)->shell.popped_up) return w;
  if (XtIsComposite(w)) {
    auto* cw = reinterpret_cast<CompositeWidget>(w);
    for (Cardinal i = 0; i < cw->composite.num_children; ++i)
      if (Widget found = showingPopup(cw->composite.children[i])) return found;
  }
  if (XtIsWidget(w))
    for (Cardinal i = 0; i < w->core.num_popups; ++i)
      if (Widget found = showingPopup(w->core.popup_list[i])) return found;
  return nullptr;
}

}  // namespace

Widget OI_Application::guiActionInProgress() const { return shell_ ? showingPopup(shell_) : nullptr; }

OI_TimerHandle OI_Application::addTimeOut(unsigned long ms, std::function<void()> fn) {
  unsigned long id = nextTimer_++;
  auto t = std::make_unique<Timer>();
  t->kind = Timer::timeout;
  t->fn = std::move(fn);
  t->interval = XtAppAddTimeOut(context_, ms, timeoutCB, reinterpret_cast<XtPointer>(id));
  timers_[id] = std::move(t);
  OI_TimerHandle h;
  h.id_ = id;
  return h;
}

OI_TimerHandle OI_Application::addIdleTimeOut(unsigned long ms, std::function<void()> fn) {
  unsigned long id = nextTimer_++;
  auto t = std::make_unique<Timer>();
  t->kind = Timer::idle;
  t->ms = ms;
  t->fn = std::move(fn);
  t->interval = XtAppAddTimeOut(context_, ms, timeoutCB, reinterpret_cast<XtPointer>(id));
  timers_[id] = std::move(t);
  OI_TimerHandle h;
  h.id_ = id;
  return h;
}

OI_TimerHandle OI_Application::addWorkProc(std::function<bool()> fn) {
  unsigned long id = nextTimer_++;
  auto t = std::make_unique<Timer>();
  t->kind = Timer::work;
  t->workFn = std::move(fn);
  t->workId = XtAppAddWorkProc(context_, workProcCB, reinterpret_cast<XtPointer>(id));
  timers_[id] = std::move(t);
  OI_TimerHandle h;
  h.id_ = id;
  return h;
}

void OI_Application::timeoutCB(XtPointer client, XtIntervalId*) {
  if (!theApp) return;
  auto id = reinterpret_cast<unsigned long>(client);
  auto it = theApp->timers_.find(id);
  if (it == theApp->timers_.end()) return;
  Timer& t = *it->second;
  t.interval = 0;
  if (t.kind == Timer::idle) {
    long long quiet = oiNowMs() - theApp->lastActivity_;
    if (quiet < static_cast<long long>(t.ms)) {
      t.interval = XtAppAddTimeOut(theApp->context_, t.ms - static_cast<unsigned long>(quiet), timeoutCB, client);
      return;
    }
  }
  std::function<void()> fn = std::move(t.fn);
  theApp->timers_.erase(it);
  oiGuard("time-out", fn);
}

Boolean OI_Application::workProcCB(XtPointer client) {
  if (!theApp) return True;
  auto id = reinterpret_cast<unsigned long>(client);
  auto it = theApp->timers_.find(id);
  if (it == theApp->timers_.end()) return True;
  bool done = true;
  std::function<bool()> fn = it->second->workFn;
  oiGuard("idle work", [&] { done = fn(); });
  if (done) {
    it = theApp->timers_.find(id);
    if (it != theApp->timers_.end()) {
      it->second->workId = 0;
      theApp->timers_.erase(it);
    }
  }
  return done ? True : False;
}

void OI_Application::cancelTimer(unsigned long id) {
  auto it = timers_.find(id);
  if (it == timers_.end()) return;
  if (it->second->interval) XtRemoveTimeOut(it->second->interval);
  if (it->second->workId) XtRemoveWorkProc(it->second->workId);
  timers_.erase(it);
}

bool OI_Application::timerPending(unsigned long id) const { return timers_.count(id) != 0; }

void OI_Application::addAction(const char* name, XtActionProc proc) {
  // Xt keeps pointers into the table, so each record lives for the whole run.
  static std::deque<std::string> names;
  static std::deque<XtActionsRec> records;
  names.push_back(name);
  records.push_back(XtActionsRec{oiStr(names.back().c_str()), proc});
  XtAppAddActions(context_, &records.back(), 1);
}

bool OI_Application::firstTime(const std::string& what) {
  if (std::find(doneOnce_.begin(), doneOnce_.end(), what) != doneOnce_.end()) return false;
  doneOnce_.push_back(what);
  return true;
}

void OI_Application::applyBusyCursor(Widget shell, bool busy) {
  if (!XtIsRealized(shell)) return;
  if (busy) XDefineCursor(display_, XtWindow(shell), busyCursor_);
  else XUndefineCursor(display_, XtWindow(shell));
}

void OI_Application::beginBusyPointer() {
  if (busyCount_++ == 0) {
    for (Widget w : topLevels_) applyBusyCursor(w, true);
    XFlush(display_);
  }
}

void OI_Application::endBusyPointer() {
  if (busyCount_ == 0) return;
  if (--busyCount_ == 0) {
    for (Widget w : topLevels_) applyBusyCursor(w, false);
    XFlush(display_);
  }
}

void OI_Application::addTopLevel(Widget shell) {
  topLevels_.push_back(shell);
  if (busyCount_ > 0) applyBusyCursor(shell, true);
}

void OI_Application::removeTopLevel(Widget shell) {
  std::erase(topLevels_, shell);
}
