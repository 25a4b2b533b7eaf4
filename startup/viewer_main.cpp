// kestrel-viewer: the program behind "kestrel -view|-export|-merge=F|-extract".
#include <X11/Xlib.h>

#include <cerrno>
#include <cstdlib>
#include <cstring>

#include "startup/console_report.h"
#include "startup/startup.h"
#include "summary/sum_frame.h"
#include "support/diagnostic.h"
#include "support/errors.h"

namespace {

// Until the toolkit takes over, the display is opened with Xlib to see that it can be.
ErrorCode checkDisplay(int& argc, char** argv) {
  // "-display NAME" belongs to the X layer: take it out as the toolkit would.
  const char* name = nullptr;
  for (int i = 1; i + 1 < argc; ++i) {
    if (argv[i] && strcmp(argv[i], "-display") == 0) {
      name = argv[i + 1];
      // The toolkit opens its display from DISPLAY later: keep the choice there.
      setenv("DISPLAY", name, 1);
      for (int j = i; j + 2 <= argc; ++j) argv[j] = argv[j + 2];
      argc -= 2;
      break;
    }
  }
  const char* env = getenv("DISPLAY");
  if (!name && (!env || !*env)) {
    errno = 0;
    kgFatal("The DISPLAY environment variable is not set.\nPlease set DISPLAY before running %s.\nExiting.\n",
            "Kestrelgauge");
  }
  Display* d = XOpenDisplay(name);
  if (!d) {
    reportError(displayNotOpened, "%s", errorMessage(displayNotOpened).c_str());
    return displayNotOpened;
  }
  XCloseDisplay(d);
  return allOK;
}

}  // namespace

int main(int argc, char** argv) {
  kgInstallSignalHandlers();
  exitWithCode(runProgram(argc, argv, checkDisplay, runMainWindow));
}
