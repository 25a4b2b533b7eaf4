// Start-up's console reporting: the "Kestrelgauge: " messages of failures and notes, the
// usage error, the exit with the status of a result code, and the lock-wait lines.
#pragma once

#include <string>
#include <vector>

#include "support/errors.h"

// Console report: "Kestrelgauge: " + text, a newline if missing, then an empty line.
void reportError(ErrorCode code, const char* fmt, ...) __attribute__((format(printf, 2, 3)));

// The note that data were set aside as out of date, naming the source files concerned;
// the code's message when none are known.
void reportOutOfDate(const std::vector<std::string>& ignored);
// "Problems reading adjustments:" and the messages; nothing when there are none.
void reportAdjustmentProblems(const std::vector<std::string>& problems);

// How the product's command must be started; printed when the installation directory is missing.
extern const char* const kUsageErrorText;
// Prints the usage error and exits with status 11.
[[noreturn]] void usageError();

// The process exit status of a result code: 1 -> 0, 0 -> 3, any other code as it is.
int exitStatusFor(ErrorCode code);
// Flushes the standard streams and ends the process with the status of the code.
[[noreturn]] void exitWithCode(ErrorCode code);

// The lock-wait reporter of the console modes: the waiting lines on every fifth wait, the
// breaking lines; always goes on waiting.
bool consoleLockReporter(int event, const std::string& path, const std::string& lockName);
void resetConsoleLockReporter();  // the count of waits starts again (for a new run)
