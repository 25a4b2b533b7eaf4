// Start-up's loading of the data files: the console lock reporter, the lock settings, then
// loading and merging every file of the list, with the console report of a failure.
#pragma once

#include <memory>
#include <string>
#include <vector>

#include "coverage/kgv_data.h"
#include "startup/startup.h"
#include "support/errors.h"

// Installs the console lock-wait reporter, sets the lock-breaking age to 45 seconds and
// locking on or off from s.lockingEnabled, then loads and merges s.loadedFiles with
// s.mergeMode. On failure prints "Can't load file %s.\n%s\n", empties s.loadedFiles and
// the ignored list, and returns the code. On success hands back the data and the ignored
// source files (sorted, without duplicates), sets s.isJava and returns 1 or 36.
ErrorCode loadStartupFiles(StartupState& s, std::unique_ptr<KgvData>& data,
                           std::vector<std::string>& ignored);
