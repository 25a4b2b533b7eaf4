// Coverage from other tools (lcov tracefiles, gcov JSON) in a neutral form: per source
// file its functions with their lines and calls, the hit count of every instrumented line
// and the taken count of every branch outcome.
#pragma once

#include <cstdint>
#include <map>
#include <string>
#include <unordered_map>
#include <vector>

struct ImportedFunction {
  std::string name;  // as shown: demangled, with its variant when two demangle alike
  std::string key;   // identity: the name as the input gives it (mangled for C++)
  std::uint32_t startLine = 0;
  std::uint32_t endLine = 0;  // 0 when the input does not say
  std::uint64_t calls = 0;
};

// A branch outcome within its line: lcov's block and branch numbers (gcov JSON's are 0 and
// the outcome's place in the line's list, as lcov makes them).
struct BranchKey {
  std::string block;
  std::string branch;
};

// Numbers in numeric order, then other words in byte order.
struct BranchOrder {
  bool operator()(const BranchKey& a, const BranchKey& b) const;
};

using LineBranches = std::map<BranchKey, std::uint64_t, BranchOrder>;

struct ImportedFile {
  std::string path;
  std::vector<ImportedFunction> functions;                // in order of first appearance
  std::unordered_map<std::string, size_t> functionIndex;  // by key
  std::map<std::uint32_t, std::uint64_t> lines;           // line -> hits
  std::map<std::uint32_t, LineBranches> branches;         // line -> outcome -> times taken
  std::uint64_t runs = 0;                                 // 0 when the input does not say
  bool namesDue = false;                                  // functions added since naming
  // Read from gcov, whose data lcov filters by the exclusion markers in the source; lcov's
  // tracefiles come filtered.
  bool fromGcov = false;

  // The function of that key, added when new.
  ImportedFunction& function(const std::string& key);
  void addLine(std::uint32_t line, std::uint64_t hits);
  void addBranch(std::uint32_t line, const BranchKey& key, std::uint64_t taken);
};

struct ImportedData {
  std::vector<ImportedFile> files;  // in order of first appearance
  std::unordered_map<std::string, size_t> fileIndex;
  // Where relative source paths of tracefiles (and of gcov JSON that names no working
  // directory) are taken from; empty: the current directory.
  std::string baseDirectory;

  ImportedFile& file(const std::string& path);
  // Gives the functions added since the last call their shown names; the readers call it
  // when they have read an input.
  void nameFunctions();
};

// Adds everything `from` holds to `into`, as reading its inputs after `into`'s would have.
void addImportedData(ImportedData& into, const ImportedData& from);

// Leaves out of the files read from gcov what lcov 1.16 (Debian 12) leaves out by the
// markers in their sources: lines marked LCOV_EXCL_LINE or between LCOV_EXCL_START and
// LCOV_EXCL_STOP (with their branches, and the functions that start there), and all
// branches of lines marked LCOV_EXCL_BR_LINE or LCOV_EXCL_EXCEPTION_BR_LINE or between the
// _START and _STOP of either. Sources that cannot be read are left as they are. A section
// left open is reported in `warnings`.
void applyExclusionMarkers(ImportedData& data, std::vector<std::string>& warnings);

// The name shown for a function: C++ names demangled, others as they are.
std::string demangledName(const std::string& key);

// The absolute, lexically normalised form of a source path ("." and ".." resolved, no
// doubled "/"); a relative path is taken from `base` (itself made absolute first).
std::string normalisedSourcePath(const std::string& path, const std::string& base);

// Where and why an input could not be read.
struct ImportError {
  std::string file;
  std::uint64_t line = 0;  // 0 when the problem is not at one line
  std::string message;
  std::string text() const;
};

// Reads a whole input, gzip-compressed or not. False with the error on failure.
bool readInputText(const std::string& path, std::string& text, ImportError& error);

enum class InputFormat { lcov, gcovJson, unknown };
InputFormat detectFormat(const std::string& text);

// Each adds what the input holds to `data` (several inputs add up). Relative source paths
// are taken from gcov's working directory when the input names one, else from
// data.baseDirectory.
bool readLcovTracefile(const std::string& name, const std::string& text, ImportedData& data,
                       ImportError& error);
bool readGcovJson(const std::string& name, const std::string& text, ImportedData& data,
                  ImportError& error);

// Saturating addition for counts kept in 64 bits.
inline std::uint64_t addCounts(std::uint64_t a, std::uint64_t b) {
  return a > UINT64_MAX - b ? UINT64_MAX : a + b;
}
