// How an imported source file becomes one data record: its functions in order, each with
// its first line, call count and the instrumented lines that belong to it.
#pragma once

#include <cstdint>
#include <string>
#include <vector>

#include "tools/import/coverage_import.h"

constexpr std::uint16_t kImportCountLimit = 10000;

inline std::uint16_t saturatedCount(std::uint64_t v) {
  return v > kImportCountLimit ? kImportCountLimit : static_cast<std::uint16_t>(v);
}

struct LaidOutLine {
  std::uint32_t line;
  std::uint16_t hits;
};

struct LaidOutFunction {
  std::string name;
  std::uint32_t firstLine;
  std::uint16_t calls;
  std::vector<LaidOutLine> lines;  // ascending
};

struct LaidOutRecord {
  std::string path;
  std::uint16_t sessions;
  std::vector<LaidOutFunction> functions;
  std::uint32_t signature;  // non-zero hash of names and lines
};

// The name of the function that holds the lines outside every function.
extern const char* const kFileScopeName;

// Functions ordered by first line (then name); each line goes to the innermost function
// whose range holds it (a function without a known end reaches to the next function's
// start); lines in no function go to a last function named "(file scope)".
LaidOutRecord layOutRecord(const ImportedFile& file);
