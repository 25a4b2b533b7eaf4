// Start-up's console reporting.
#include "startup/console_report.h"

#include <cstdarg>
#include <cstdio>
#include <cstdlib>

#include "coverage/kgv_lock.h"

void reportError(ErrorCode, const char* fmt, ...) {
  fflush(stdout);
  fputs("Kestrelgauge: ", stderr);
  va_list ap;
  va_start(ap, fmt);
  char* text = nullptr;
  int n = vasprintf(&text, fmt, ap);
  va_end(ap);
  if (n >= 0 && text) {
    fputs(text, stderr);
    if (n == 0 || text[n - 1] != '\n') fputc('\n', stderr);
    free(text);
  } else {
    fputc('\n', stderr);
  }
  fputc('\n', stderr);
  fflush(stderr);
}

void reportOutOfDate(const std::vector<std::string>& ignored) {
  if (ignored.empty()) {
    reportError(mergeIgnored, "%s", errorMessage(mergeIgnored).c_str());
    return;
  }
  std::string text = ignored.size() == 1 ? "Some coverage for this file was out of date:"
                                         : "Some coverage for these files was out of date:";
  for (const auto& name : ignored) text += "\n" + name;
  reportError(mergeIgnored, "%s", text.c_str());
}

void reportAdjustmentProblems(const std::vector<std::string>& problems) {
  if (problems.empty()) return;
  std::string text = "Problems reading adjustments:";
  for (const auto& p : problems) text += "\n" + p;
  reportError(errorOccured, "%s", text.c_str());
}

const char* const kUsageErrorText =
    "Kestrelgauge must be invoked in one of these forms:\n"
    "    kestrel -view\n"
    "    kestrel -export\n"
    "    kestrel -merge=<file>\n"
    "    kestrel -extract\n"
    "For additional information, use 'kestrel -help'.\n";

void usageError() {
  reportError(driverError, "%s", kUsageErrorText);
  exitWithCode(driverError);
}

int exitStatusFor(ErrorCode code) {
  if (code == allOK) return 0;
  if (code == fatalInternalError) return 3;
  // A status has 8 bits; a code that does not fit must not read as success.
  return code > 255 ? 3 : static_cast<int>(code);
}

void exitWithCode(ErrorCode code) {
  fflush(stdout);
  fflush(stderr);
  exit(exitStatusFor(code));
}

namespace {
unsigned gConsoleWaits = 0;
}  // namespace

bool consoleLockReporter(int event, const std::string& path, const std::string& lockName) {
  if (event == LockEventWait) {
    if (++gConsoleWaits % 5 != 0) return true;
    fflush(stdout);
    fprintf(stderr, "Kestrelgauge: Waiting for lock on %s\n", path.c_str());
    fprintf(stderr, "Kestrelgauge: (Will break lock if it gets older than %d seconds.)\n",
            lockBreakAge());
    fprintf(stderr, "Kestrelgauge: (lock name: %s)\n", lockName.c_str());
  } else if (event == LockEventBreak) {
    fflush(stdout);
    fprintf(stderr, "Kestrelgauge: Breaking old lock on %s\n", path.c_str());
    fprintf(stderr, "Kestrelgauge: (lock name: %s)\n", lockName.c_str());
  }
  fflush(stderr);
  return true;
}

void resetConsoleLockReporter() { gConsoleWaits = 0; }
