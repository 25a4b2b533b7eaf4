// kestrel -merge=OUT [OPTIONS] FILE...: loads and merges the files as start-up does and
// writes the result to OUT, which may be one of the files.
#pragma once

#include <string>
#include <vector>

#include "startup/startup.h"
#include "support/errors.h"

// Runs after the common start-up steps (options parsed, file list built). OUT's lock is
// held from before the files are read until the result is in place, so runs added to OUT
// meanwhile by other processes are not lost. Out-of-date data are noted on standard error
// and are no failure: the result is 1 then. Failures are reported on the console and
// returned.
ErrorCode runMergeMode(StartupState& s);
