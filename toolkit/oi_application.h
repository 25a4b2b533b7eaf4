// The application: display connection, resource database, event loop, time-outs, idle work,
// action procedures and the busy pointer.
#pragma once

#include <X11/Intrinsic.h>

#include <functional>
#include <map>
#include <memory>
#include <string>
#include <vector>

class OI_Application;

// Names a pending time-out or idle procedure so that it can be cancelled. Dropping the handle
// leaves the timer running (fire and forget); owners that go away first cancel explicitly.
class OI_TimerHandle {
 public:
  OI_TimerHandle() = default;
  ~OI_TimerHandle() = default;
  OI_TimerHandle(OI_TimerHandle&& o) noexcept;
  OI_TimerHandle& operator=(OI_TimerHandle&& o) noexcept;
  OI_TimerHandle(const OI_TimerHandle&) = delete;
  OI_TimerHandle& operator=(const OI_TimerHandle&) = delete;
  void cancel();
  bool pending() const;

 private:
  friend class OI_Application;
  unsigned long id_ = 0;
};

class OI_Application {
 public:
  static constexpr const char* appClass = "Kestrelgauge";
  static constexpr const char* appName = "kestrel";

  // The one application of the process (null before `open`).
  static OI_Application* instance();

  // Opens the display, taking the X options (-display, -xrm, -name, -geometry, ...) out of
  // argc/argv. False, with a message in `error`, when the display cannot be opened.
  static bool open(int& argc, char** argv, std::string& error, const char* const* fallbacks = nullptr);
  // Closes the display and forgets the application.
  static void close();
  ~OI_Application();

  Display* display() const { return display_; }
  XtAppContext context() const { return context_; }
  // The application shell ("kestrel" of class "Kestrelgauge"); top-level windows are its popups.
  Widget shell() const { return shell_; }

  // The server's resource property (as xrdb loaded it); empty when it has none.
  std::string displayResources() const;
  // The resource lines the command line gave: each -xrm line, and -geometry, -title, -bg, -fg
  // and -iconic as the lines they stand for.
  const std::vector<std::string>& commandLineResources() const { return commandLineXrm_; }
  // Makes `db` the display's resource database; widgets made afterwards take their resources
  // from it. With `commandLineOnTop` the command line's lines are put over it (for a database
  // that does not hold them already). The display owns `db` from then on.
  void installDatabase(XrmDatabase db, bool commandLineOnTop = false);
  XrmDatabase database() const;

  // Runs the event loop until `quit`.
  void run();
  void quit();
  bool quitting() const;
  // Makes a waiting processOne return (after a timer or signal changed what it waits for).
  void wake();
  // Handles one event, timer, input or signal (waiting for one when none is pending).
  void processOne();
  // Handles everything now pending, without waiting.
  void processPending();

  // Calls `fn` once after `ms` milliseconds.
  OI_TimerHandle addTimeOut(unsigned long ms, std::function<void()> fn);
  // Calls `fn` when the event loop has nothing else to do, until it returns true.
  OI_TimerHandle addWorkProc(std::function<bool()> fn);
  // Calls `fn` once after the user has been idle (no key or button) for `ms` milliseconds.
  OI_TimerHandle addIdleTimeOut(unsigned long ms, std::function<void()> fn);
  // Marks the user as active now (every key and button event does).
  void noteUserActivity();

  // Registers an action procedure by name for translation tables.
  void addAction(const char* name, XtActionProc proc);
  // True the first time it is asked about `what` in this application (one-time set-ups such as
  // registering a group of actions).
  bool firstTime(const std::string& what);

  // The busy pointer, counted: shown on every top-level window from the first begin, taken away
  // when the count returns to 0.
  void beginBusyPointer();
  void endBusyPointer();
  int busyCount() const { return busyCount_; }

  // Whether any of the registered top-level windows is on the screen (not iconified or
  // withdrawn).
  bool anyWindowOpen() const;
  // A menu posted or a dialog showing anywhere under the application's windows, that is,
  // the user is in the middle of something: that shell, or null. Menu bars belong to their
  // windows and do not count; only their posted pulldowns do.
  Widget guiActionInProgress() const;

  // Top-level windows register themselves so that the busy pointer and the test hook find them.
  void addTopLevel(Widget shell);
  void removeTopLevel(Widget shell);
  const std::vector<Widget>& topLevels() const { return topLevels_; }

 private:
  OI_Application() = default;
  struct Timer;
  static void timeoutCB(XtPointer client, XtIntervalId* id);
  static Boolean workProcCB(XtPointer client);
  void applyBusyCursor(Widget shell, bool busy);
  friend class OI_TimerHandle;
  void cancelTimer(unsigned long id);
  bool timerPending(unsigned long id) const;

  XtAppContext context_ = nullptr;
  Display* display_ = nullptr;
  Widget shell_ = nullptr;
  std::vector<std::string> commandLineXrm_;
  std::map<unsigned long, std::unique_ptr<Timer>> timers_;
  unsigned long nextTimer_ = 1;
  int busyCount_ = 0;
  Cursor busyCursor_ = None;
  std::vector<Widget> topLevels_;
  std::vector<std::string> doneOnce_;
  long long lastActivity_ = 0;
};

long long oiNowMs();
