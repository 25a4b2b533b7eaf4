// The neutral import model, reading compressed or plain inputs, and format detection.
#include "tools/import/coverage_import.h"

#include <sys/stat.h>
#include <zlib.h>

#include <algorithm>
#include <cerrno>
#include <cstdint>
#include <cstring>

ImportedFunction& ImportedFile::function(const std::string& name) {
  auto it = functionIndex.find(name);
  if (it != functionIndex.end()) return functions[it->second];
  functionIndex.emplace(name, functions.size());
  functions.push_back(ImportedFunction{name, 0, 0, 0});
  return functions.back();
}

void ImportedFile::addLine(std::uint32_t line, std::uint64_t hits) {
  auto [it, inserted] = lines.emplace(line, hits);
  if (!inserted) it->second = addCounts(it->second, hits);
}

ImportedFile& ImportedData::file(const std::string& path) {
  auto it = fileIndex.find(path);
  if (it != fileIndex.end()) return files[it->second];
  fileIndex.emplace(path, files.size());
  files.emplace_back();
  files.back().path = path;
  return files.back();
}

std::string ImportError::text() const {
  if (line == 0) return file + ": " + message;
  return file + ":" + std::to_string(line) + ": " + message;
}

namespace {
constexpr std::uint64_t kInflationRatio = 64;
constexpr std::uint64_t kInflationFloor = std::uint64_t{64} << 20;
constexpr std::uint64_t kMaxInflated = std::uint64_t{4} << 30;
}  // namespace

bool readInputText(const std::string& path, std::string& text, ImportError& error) {
  error.file = path;
  error.line = 0;
  // A compressed input may inflate to no more than this: real coverage reports compress
  // perhaps thirty-fold, a crafted one a thousand-fold and more, to fill the memory.
  struct stat st;
  std::uint64_t ceiling = kMaxInflated;
  if (stat(path.c_str(), &st) == 0 && S_ISREG(st.st_mode))
    ceiling = std::clamp<std::uint64_t>(std::uint64_t(st.st_size) * kInflationRatio,
                                        kInflationFloor, kMaxInflated);
  // gzread passes plain files through unchanged, so one reader serves both.
  gzFile f = gzopen(path.c_str(), "rb");
  if (!f) {
    error.message = std::string("cannot open: ") + strerror(errno ? errno : ENOENT);
    return false;
  }
  text.clear();
  char buf[1 << 16];
  for (;;) {
    int n = gzread(f, buf, sizeof buf);
    if (n < 0) {
      int code = 0;
      const char* msg = gzerror(f, &code);
      error.message = std::string("cannot read: ") +
                      (code == Z_ERRNO ? strerror(errno) : (msg ? msg : "corrupt compressed data"));
      gzclose(f);
      return false;
    }
    if (n == 0) break;
    text.append(buf, static_cast<size_t>(n));
    if (text.size() > ceiling && !gzdirect(f)) {
      error.message = "cannot read: it inflates to more than " + std::to_string(ceiling) +
                      " bytes (" + std::to_string(kInflationRatio) +
                      " times its compressed size); refused as a likely gzip bomb";
      gzclose(f);
      text.clear();
      text.shrink_to_fit();
      return false;
    }
  }
  int rc = gzclose(f);
  if (rc != Z_OK && rc != Z_BUF_ERROR) {
    error.message = "cannot read: the compressed data are truncated or corrupt";
    return false;
  }
  if (rc == Z_BUF_ERROR) {
    error.message = "cannot read: the compressed data are truncated";
    return false;
  }
  return true;
}

InputFormat detectFormat(const std::string& text) {
  size_t i = text.find_first_not_of(" \t\r\n");
  if (i == std::string::npos) return InputFormat::unknown;
  if (text[i] == '{') return InputFormat::gcovJson;
  static const char* const kKeys[] = {"TN:", "SF:", "VER:", "#"};
  for (const char* k : kKeys)
    if (text.compare(i, strlen(k), k) == 0) return InputFormat::lcov;
  return InputFormat::unknown;
}
