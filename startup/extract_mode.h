// kestrel -extract [OPTIONS] FILE...: the start-up path without a display, then adjustments
// extracted from every source file of the data, the adjustments file rewritten and the
// result lines on standard output.
#pragma once

#include "startup/startup.h"
#include "support/errors.h"

// Runs after the summary is built. A failure to write the adjustments file is reported on
// standard error and its code returned; otherwise 1.
ErrorCode runExtractMode(StartupSummary& prepared);
