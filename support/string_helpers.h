// String helpers: printf-style formatting into a std::string, and the one comparison of
// option-like names.
#pragma once

#include <string>

std::string stringPrintf(const char* fmt, ...) __attribute__((format(printf, 1, 2)));

// Names match ignoring case and any runs of '-' and '_' ("-force-merge" is "FORCE_MERGE").
bool optionNamesMatch(const char* a, const char* b);
