// kestrel -export [OPTIONS] FILE...: the start-up path without a display, then the export
// report on standard output.
#pragma once

#include "startup/startup.h"
#include "support/errors.h"

// Runs after the summary is built: reports data set aside and problems with the
// adjustments file on standard error, then writes the report to standard output. A reader
// that stops early is no failure. Returns the code for the exit status.
ErrorCode runExportMode(StartupSummary& prepared);
