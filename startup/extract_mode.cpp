// The console extraction: every source file scanned without asking, the result lines on
// standard output.
#include "startup/extract_mode.h"

#include <cstdio>

#include "adjust/adjustments_file.h"
#include "adjust/extraction.h"
#include "startup/console_report.h"
#include "support/message_sink.h"

ErrorCode runExtractMode(StartupSummary& prepared) {
  if (prepared.loadStatus == mergeIgnored) reportOutOfDate(prepared.ignored);
  reportAdjustmentProblems(prepared.adjustmentProblems);
  AlwaysContinue goOn;
  ConsoleMessages console(true);
  ExtractionOutcome outcome = extractAllAdjustments(*prepared.summary, "", goOn, console);
  for (const std::string& line : outcome.lines) {
    fputs(line.c_str(), stdout);
    fputc('\n', stdout);
  }
  fflush(stdout);
  if (outcome.writeStatus != allOK) {
    reportError(outcome.writeStatus, "Couldn't write the adjustments file %s.\n%s\n",
                adjustmentsFilePath().c_str(), errorMessage(outcome.writeStatus).c_str());
    return outcome.writeStatus;
  }
  if (outcome.recomputeStatus != allOK) {
    reportError(outcome.recomputeStatus, "Couldn't summarize information:\n%s\n",
                errorMessage(outcome.recomputeStatus).c_str());
    return outcome.recomputeStatus;
  }
  return allOK;
}
