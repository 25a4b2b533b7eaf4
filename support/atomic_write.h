// Writing a user's file safely: a new file beside the target, renamed over it only when
// everything was written, so a failure never destroys what was there.
#pragma once

#include <cstdio>
#include <functional>
#include <string>

#include "support/errors.h"

class AtomicFileWriter {
 public:
  AtomicFileWriter() = default;
  ~AtomicFileWriter();
  AtomicFileWriter(const AtomicFileWriter&) = delete;
  AtomicFileWriter& operator=(const AtomicFileWriter&) = delete;

  // Creates the temporary file in the target's directory. An existing target's permission
  // bits are kept, and its owner and group as far as the system allows; a new file gets
  // 0666 less the umask. Failure: writeError (19), with the system error recorded. Until it
  // is committed or abandoned, a stopping signal removes the temporary file.
  ErrorCode open(const std::string& target);
  FILE* stream() const { return stream_; }
  const std::string& target() const { return target_; }
  const std::string& temporaryPath() const { return temp_; }

  // Flushes, syncs, closes and renames over the target. Any failure removes the temporary
  // file, leaves the target untouched and gives fileWriteFailed (21) with the system error.
  // A check run just before the rename may refuse it: its code is then the result.
  ErrorCode commit(const std::function<ErrorCode()>& beforeRename = {});
  // Drops the temporary file; the target stays as it was.
  void abandon();

 private:
  void forgetTemporary();

  std::string target_;
  std::string temp_;
  FILE* stream_ = nullptr;
  int cleanupSlot_ = -1;
};

// Where writing to `path` must go so that a symbolic link keeps pointing at the new file:
// the link's real target, or the path itself.
std::string writeTargetFor(const std::string& path);
