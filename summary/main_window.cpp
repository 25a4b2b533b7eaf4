// The hand-over from start-up: the toolkit, the resource database, a polite end on SIGTERM,
// the source search path, then the main window and its event loop.
#include "summary/main_window.h"

#include <fnmatch.h>

#include <csignal>

#include "adjust/source_search_path.h"
#include "coverage/kgv_lock.h"
#include "outline/qr_oi_multi_text.h"
#include "settings/resource_database.h"
#include "summary/sum_dialogs.h"
#include "summary/sum_frame.h"
#include "toolkit/oi_application.h"

namespace {

XtSignalId gTermSignal = 0;

// Toolkit warnings that say nothing a user can act on are not shown.
const char* const kFilteredMessages[] = {"*invalid size*", "*specified location is invalid*"};

bool filteredMessage(const char* message) {
  for (const char* pattern : kFilteredMessages) {
    if (fnmatch(pattern, message ? message : "", 0) == 0) return true;
  }
  return false;
}

XtErrorHandler gPreviousWarningHandler = nullptr;

void filteringWarningHandler(String message) {
  if (filteredMessage(message)) return;
  if (gPreviousWarningHandler != nullptr) gPreviousWarningHandler(message);
}

void termHandler(int) {
  if (gTermSignal != 0) XtNoticeSignal(gTermSignal);
}

}  // namespace

ErrorCode runMainWindow(MainWindowInput& input, std::string& failure) {
  std::string error;
  std::string programName = "kestrel";
  char* argv[] = {programName.data(), nullptr};
  int argc = 1;
  // Start-up may have opened the toolkit already at its display step (taking the X options
  // out of the command line then); otherwise it opens here on DISPLAY.
  if (OI_Application::instance() == nullptr && !OI_Application::open(argc, argv, error)) {
    failure = error + "\n";
    return displayNotOpened;
  }
  OI_Application* app = OI_Application::instance();
  QR_OI_Init();
  gPreviousWarningHandler = XtAppSetWarningHandler(app->context(), filteringWarningHandler);
  if (XrmDatabase db = resourceDatabase()) {
    app->installDatabase(db, true);
    handOverResourceDatabase();
  }
  // A polite end on SIGTERM: the windows go down in order and the event loop returns.
  gTermSignal = XtAppAddSignal(app->context(), [](XtPointer, XtSignalId*) { OI_Application::instance()->quit(); },
                               nullptr);
  struct sigaction sa {};
  sa.sa_handler = termHandler;
  sigemptyset(&sa.sa_mask);
  struct sigaction old {};
  sigaction(SIGTERM, &sa, &old);

  // Source files are looked for along -userpath's directories, then ".".
  initSourceSearchPath(input.userPath ? &*input.userPath : nullptr);

  ErrorCode result = allOK;
  {
    KG_SumFrame frame(input);
    ErrorCode rc = frame.build(error);
    if (rc != allOK) {
      failure = "Couldn't construct viewer window:\n" + error + "\n";
      result = rc;
    } else {
      LockWaitCallback previous = setLockWaitCallback(windowLockReporter);
      frame.showData(std::move(input.data), std::move(input.summary));
      frame.show();
      showLoadResult(input.loadStatus, input.ignored);
      if (!input.adjustmentProblems.empty()) noteList("Problems reading adjustments:", input.adjustmentProblems);
      if (input.dataWatcher) input.dataWatcher->start(frame);
      app->run();
      if (input.dataWatcher) input.dataWatcher->stop();
      // The other windows go before the main window and the display they live on.
      if (input.scripts) input.scripts->closeAll();
      if (input.sourceWindows) input.sourceWindows->closeAll();
      setLockWaitCallback(previous);
    }
  }
  sigaction(SIGTERM, &old, nullptr);
  gTermSignal = 0;
  OI_Application::close();
  return result;
}
