// The console merge: load, merge, write the result under the target's lock.
#include "startup/merge_mode.h"

#include "coverage/kgv_file.h"
#include "coverage/kgv_load.h"
#include "coverage/kgv_lock.h"
#include "startup/console_report.h"
#include "startup/load_files.h"

ErrorCode runMergeMode(StartupState& s) {
  const std::string& target = s.mergeTarget;
  // The loader's settings apply to the target's lock too.
  setLockWaitCallback(consoleLockReporter);
  setLockTimes(45, 0, 0);
  setLockingEnabled(s.lockingEnabled);
  ErrorCode rc = refuseNonRegularDataFile(target);
  if (rc == allOK) rc = lockKgvFile(target);
  if (rc == lockAborted) return rc;
  if (rc != allOK) {
    reportError(rc, "Couldn't write the file %s.\n%s\n", target.c_str(), errorMessage(rc).c_str());
    return rc;
  }

  std::unique_ptr<KgvData> data;
  std::vector<std::string> ignored;
  rc = loadStartupFiles(s, data, ignored);
  if (rc == mergeIgnored) reportOutOfDate(ignored);
  if (rc == allOK || rc == mergeIgnored) {
    rc = writeKgvFile(target, *data);
    if (rc != allOK)
      reportError(rc, "Couldn't write the file %s.\n%s\n", target.c_str(), errorMessage(rc).c_str());
  }
  ErrorCode unlocked = unlockKgvFile(target);
  if (rc == allOK && unlocked != allOK) {
    reportError(unlocked, "Couldn't write the file %s.\n%s\n", target.c_str(),
                errorMessage(unlocked).c_str());
    rc = unlocked;
  }
  return rc;
}
