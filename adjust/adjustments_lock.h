// The lock taken around every read and write of the adjustments file: the same lock
// directory scheme as the data files use, switched over in this one place.
#pragma once

#include <string>

#include "support/errors.h"

ErrorCode lockAdjustmentsFile(const std::string& path);
ErrorCode unlockAdjustmentsFile(const std::string& path);
