// Adjustments-file locking. The data-file lock functions are not part of the engine yet;
// until they are, these succeed without locking (as with locking switched off).
#include "adjust/adjustments_lock.h"

ErrorCode lockAdjustmentsFile(const std::string& /*path*/) { return allOK; }

ErrorCode unlockAdjustmentsFile(const std::string& /*path*/) { return allOK; }
