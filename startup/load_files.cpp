// Loading the command line's data files at start-up.
#include "startup/load_files.h"

#include <algorithm>

#include "coverage/kgv_load.h"
#include "coverage/kgv_lock.h"
#include "startup/console_report.h"
#include "support/message_sink.h"

ErrorCode loadStartupFiles(StartupState& s, std::unique_ptr<KgvData>& data,
                           std::vector<std::string>& ignored) {
  data.reset();
  ignored.clear();
  setLockWaitCallback(consoleLockReporter);
  setLockTimes(45, 0, 0);
  setLockingEnabled(s.lockingEnabled);

  size_t index = 0;
  ConsoleMessages console(s.mode != RunMode::view);
  ErrorCode rc = loadAllKgvFiles(s.loadedFiles, s.mergeMode, &ignored, console, data, index);
  if (rc != allOK && rc != mergeIgnored) {
    std::string name = index < s.loadedFiles.size() ? s.loadedFiles[index].givenName : "";
    reportError(rc, "Can't load file %s.\n%s\n", name.c_str(), errorMessage(rc).c_str());
    s.loadedFiles.clear();
    ignored.clear();
    data.reset();
    return rc;
  }
  if (ignored.size() > 1) {
    std::sort(ignored.begin(), ignored.end());
    ignored.erase(std::unique(ignored.begin(), ignored.end()), ignored.end());
  }
  s.isJava = kgvIsJava();
  return rc;
}
