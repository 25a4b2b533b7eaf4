// The neutral import model, reading compressed or plain inputs, and format detection.
#include "tools/import/coverage_import.h"

#include <zlib.h>

#include <cerrno>
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

bool readInputText(const std::string& path, std::string& text, ImportError& error) {
  error.file = path;
  error.line = 0;
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
