// How an imported source file becomes one data record: its functions in order, each with
// its first line, call count and the instrumented lines that belong to it, each line with
// the taken counts of its branch outcomes.
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
  // One per branch outcome, never above the line's hits: the outcomes follow the line's
  // own block, and the line's count is the largest of its blocks.
  std::vector<std::uint16_t> branches;
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
  std::uint32_t signature;  // non-zero hash of the path and the line set
};

// Where the lines of a file go, as layOutRecord lays them out: the importer builds its
// records from this directly, without the copies a LaidOutRecord holds.
struct LayoutPlan {
  std::vector<const ImportedFunction*> functions;  // in the record's order
  // For each line of the file, in order: the index of its function, or functions.size()
  // for the lines outside every function.
  std::vector<std::uint32_t> owner;
  size_t fileScopeLines = 0;
  std::uint32_t fileScopeFirst = 0;
  bool fileScopeRan = false;  // any line outside every function ran

  // Room reused from file to file.
  struct Range {
    std::uint32_t start, end;  // end inclusive
    size_t function;           // index into functions: the group's owner
  };
  std::vector<Range> ranges;
  std::vector<const Range*> open;
};
void planLayout(const ImportedFile& file, LayoutPlan& plan);

// The signature that stands for a source that cannot be read: its path and line set.
std::uint32_t lineSetSignature(const ImportedFile& file);

// The name of the function that holds the lines outside every function.
extern const char* const kFileScopeName;

// Functions ordered by first line, then name. Functions that start on one line form a group
// that the data cannot split (macro-generated functions, a destructor's variants): the
// group's lines all go to its last function (a destructor's base variant, D2), and the
// others keep only their first line and calls. Each line goes to the innermost
// group whose range holds it (a group whose ends are not all known reaches to the next
// function's start); lines in no function go to a last function named "(file scope)".
// Branch outcomes at lines without a line count are left out: they would add a line.
LaidOutRecord layOutRecord(const ImportedFile& file);
