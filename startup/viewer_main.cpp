// kestrel-viewer: the program behind "kestrel -view|-export|-merge=F|-extract".
#include <X11/Xlib.h>

#include <cerrno>
#include <cstdlib>
#include <cstring>

#include "source_view/kg_detail.h"
#include "startup/console_report.h"
#include "startup/startup.h"
#include "summary/main_window.h"
#include "support/diagnostic.h"
#include "support/errors.h"
#include "toolkit/oi_application.h"
#include "updates/kg_file_monitor.h"
#include "updates/kg_scripts.h"

namespace {

// Start-up step 6: the toolkit opens the display and takes its own options (-display,
// -xrm, -geometry, -fg, -bg, -fn, -name, -title, -iconic, -synchronous, ...) out of the
// arguments, so that the viewer's options and files are what remains.
ErrorCode openDisplay(int& argc, char** argv, DisplayResources& resources) {
  bool named = false;
  for (int i = 1; i + 1 < argc; ++i)
    if (argv[i] && strcmp(argv[i], "-display") == 0) named = true;
  const char* env = getenv("DISPLAY");
  if (!named && (!env || !*env)) {
    errno = 0;
    kgFatal("The DISPLAY environment variable is not set.\nPlease set DISPLAY before running %s.\nExiting.\n",
            "Kestrelgauge");
  }
  std::string error;
  if (!OI_Application::open(argc, argv, error)) {
    reportError(displayNotOpened, "%s", errorMessage(displayNotOpened).c_str());
    return displayNotOpened;
  }
  resources.display = OI_Application::instance()->displayResources();
  resources.commandLine = OI_Application::instance()->commandLineResources();
  return allOK;
}

// Start-up step 16: the main window takes over the data and the file list.
ErrorCode showMainWindow(StartupState& s, StartupSummary& prepared) {
  MainWindowInput input;
  input.installDir = s.installDir;
  input.versionText = versionBanner(s);
  input.loadedFiles = std::move(s.loadedFiles);
  input.mergeMode = s.mergeMode;
  if (const ViewerOption* userpath = findGivenOption("userpath", s.options)) input.userPath = userpath->value;
  input.data = std::move(prepared.data);
  input.summary = std::move(prepared.summary);
  input.loadStatus = prepared.loadStatus;
  input.ignored = std::move(prepared.ignored);
  input.adjustmentProblems = std::move(prepared.adjustmentProblems);
  KG_DetailWindows sourceWindows;
  input.sourceWindows = &sourceWindows;
  KG_FileMonitor monitor;
  input.dataWatcher = &monitor;
  KG_Scripts scripts;
  input.scripts = &scripts;
  std::string failure;
  ErrorCode rc = runMainWindow(input, failure);
  if (rc != allOK && !failure.empty()) reportError(rc, "%s", failure.c_str());
  return rc;
}

}  // namespace

int main(int argc, char** argv) {
  kgInstallSignalHandlers();
  StartupSummary prepared;
  bool showWindow = false;
  ErrorCode rc = runProgram(argc, argv, openDisplay, prepared, showWindow);
  if (showWindow) rc = showMainWindow(startupState(), prepared);
  exitWithCode(rc);
}
