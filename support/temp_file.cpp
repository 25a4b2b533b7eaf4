// The temporary directory and safely created temporary files.
#include "support/temp_file.h"

#include <unistd.h>

#include <cerrno>
#include <cstdlib>
#include <vector>

#include "support/cleanup_paths.h"

namespace {
bool gTempComputed = false;
std::string gTempDir;
}  // namespace

const char* kgTempDirectory() {
  if (!gTempComputed) {
    const char* t = getenv("TMPDIR");
    gTempDir = t ? t : "/tmp";
    gTempComputed = true;
  }
  return gTempDir.c_str();
}

void kgResetTempDirectory() { gTempComputed = false; }

FILE* createTemporaryFile(const char* prefix, std::string& path) {
  std::string dir = kgTempDirectory();
  if (dir.empty()) dir = ".";
  std::string templ = dir + (dir.back() == '/' ? "" : "/") + prefix + "XXXXXX";
  std::vector<char> buf(templ.begin(), templ.end());
  buf.push_back('\0');
  int fd = mkstemp(buf.data());
  if (fd < 0) {
    path = templ;
    return nullptr;
  }
  path = buf.data();
  FILE* f = fdopen(fd, "w+");
  if (!f) {
    int err = errno;
    close(fd);
    unlink(path.c_str());
    errno = err;
  }
  return f;
}

bool TemporaryFile::create(const char* prefix) {
  remove();
  stream_ = createTemporaryFile(prefix, path_);
  if (stream_) cleanupSlot_ = registerCleanupPath(path_, CleanupPathKind::file);
  return stream_ != nullptr;
}

void TemporaryFile::remove() {
  if (stream_) {
    fclose(stream_);
    stream_ = nullptr;
    unlink(path_.c_str());
  }
  unregisterCleanupPath(cleanupSlot_);
  cleanupSlot_ = -1;
  path_.clear();
}
