// Coverage from other tools (lcov tracefiles, gcov JSON) in a neutral form: per source
// file its functions with their lines and calls, and the hit count of every instrumented line.
#pragma once

#include <cstdint>
#include <map>
#include <string>
#include <unordered_map>
#include <vector>

struct ImportedFunction {
  std::string name;
  std::uint32_t startLine = 0;
  std::uint32_t endLine = 0;  // 0 when the input does not say
  std::uint64_t calls = 0;
};

struct ImportedFile {
  std::string path;
  std::vector<ImportedFunction> functions;              // in order of first appearance
  std::unordered_map<std::string, size_t> functionIndex;  // by name
  std::map<std::uint32_t, std::uint64_t> lines;         // line -> hits
  std::uint64_t runs = 0;                               // 0 when the input does not say

  ImportedFunction& function(const std::string& name);
  void addLine(std::uint32_t line, std::uint64_t hits);
};

struct ImportedData {
  std::vector<ImportedFile> files;  // in order of first appearance
  std::unordered_map<std::string, size_t> fileIndex;

  ImportedFile& file(const std::string& path);
};

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

// Each adds what the input holds to `data` (several inputs add up). The directory makes
// relative source paths absolute when the input gives one (gcov's working directory).
bool readLcovTracefile(const std::string& name, const std::string& text, ImportedData& data,
                       ImportError& error);
bool readGcovJson(const std::string& name, const std::string& text, ImportedData& data,
                  ImportError& error);

// Saturating addition for counts kept in 64 bits.
inline std::uint64_t addCounts(std::uint64_t a, std::uint64_t b) {
  return a > UINT64_MAX - b ? UINT64_MAX : a + b;
}
