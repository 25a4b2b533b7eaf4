// The temporary directory and temporary files made safely inside it.
#pragma once

#include <cstdio>
#include <string>

// TMPDIR when set (even empty), else "/tmp"; computed once.
const char* kgTempDirectory();
// Forgets the computed value (tests change TMPDIR between cases).
void kgResetTempDirectory();

// A temporary file in the temporary directory, created safely with a unique name that
// begins with the prefix, open for reading and writing. nullptr on failure (errno set;
// path then holds the name pattern).
FILE* createTemporaryFile(const char* prefix, std::string& path);

// A temporary file made by createTemporaryFile, closed and removed when it goes, or by a
// stopping signal.
class TemporaryFile {
 public:
  TemporaryFile() = default;
  ~TemporaryFile() { remove(); }
  TemporaryFile(const TemporaryFile&) = delete;
  TemporaryFile& operator=(const TemporaryFile&) = delete;

  // Closes and removes any earlier one first. False with errno set; path() is then the
  // name pattern that could not be created.
  bool create(const char* prefix);
  FILE* stream() const { return stream_; }
  const std::string& path() const { return path_; }
  explicit operator bool() const { return stream_ != nullptr; }
  // Closes and removes the file; the path is forgotten.
  void remove();

 private:
  FILE* stream_ = nullptr;
  std::string path_;
  int cleanupSlot_ = -1;
};
