// printf-style formatting into a std::string, for the fixed message texts of this folder.
#pragma once

#include <string>

std::string stringPrintf(const char* fmt, ...) __attribute__((format(printf, 1, 2)));
