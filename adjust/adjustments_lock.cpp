// Adjustments-file locking: the same lock directories as the data files, so other viewers
// of the same user never read a half-written file.
#include "adjust/adjustments_lock.h"

#include "coverage/kgv_lock.h"

ErrorCode lockAdjustmentsFile(const std::string& path) { return lockKgvFile(path); }

ErrorCode unlockAdjustmentsFile(const std::string& path) { return unlockKgvFile(path); }
