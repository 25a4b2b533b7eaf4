// The console export: notes on standard error, the report on standard output.
#include "startup/export_mode.h"

#include <cstdio>

#include "adjust/export_report.h"
#include "startup/console_report.h"
#include "support/message_sink.h"

ErrorCode runExportMode(StartupSummary& prepared) {
  if (prepared.loadStatus == mergeIgnored) reportOutOfDate(prepared.ignored);
  reportAdjustmentProblems(prepared.adjustmentProblems);
  ConsoleMessages console(true);
  ErrorCode rc = writeExport(stdout, *prepared.summary, console);
  if (rc != allOK) {
    reportError(rc, "Couldn't export\n%s\n", errorMessage(rc).c_str());
    return rc;
  }
  return allOK;
}
