// Temporary file beside the target, renamed over it on success.
#include "support/atomic_write.h"

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <cstdlib>
#include <vector>

#include "support/cleanup_paths.h"

AtomicFileWriter::~AtomicFileWriter() { abandon(); }

ErrorCode AtomicFileWriter::open(const std::string& target) {
  abandon();
  target_ = target;
  size_t slash = target.find_last_of('/');
  std::string dir = slash == std::string::npos ? std::string() : target.substr(0, slash + 1);
  std::string base = slash == std::string::npos ? target : target.substr(slash + 1);
  std::string templ = dir + "." + base + ".new.XXXXXX";
  std::vector<char> buf(templ.begin(), templ.end());
  buf.push_back('\0');
  int fd = mkstemp(buf.data());
  if (fd < 0) {
    recordSystemError(errno, "Creating a new file beside %s", target.c_str());
    return writeError;
  }
  temp_ = buf.data();
  cleanupSlot_ = registerCleanupPath(temp_, CleanupPathKind::file);
  mode_t mode;
  struct stat st;
  if (stat(target.c_str(), &st) == 0) {
    mode = st.st_mode & 07777;
    // Another user's file stays theirs where the system lets us; otherwise its group at
    // least, and failing both the new copy is ours, as any editor would leave it.
    if ((st.st_uid != geteuid() || st.st_gid != getegid()) && fchown(fd, st.st_uid, st.st_gid) != 0)
      (void)!fchown(fd, static_cast<uid_t>(-1), st.st_gid);
  } else {
    mode_t mask = umask(0);
    umask(mask);
    mode = 0666 & ~mask;
  }
  if (fchmod(fd, mode) != 0) {
    int err = errno;
    close(fd);
    forgetTemporary();
    recordSystemError(err, "Setting the permissions of %s", target.c_str());
    return writeError;
  }
  stream_ = fdopen(fd, "w");
  if (!stream_) {
    int err = errno;
    close(fd);
    forgetTemporary();
    recordSystemError(err, "Opening a new file beside %s", target.c_str());
    return writeError;
  }
  return allOK;
}

ErrorCode AtomicFileWriter::commit(const std::function<ErrorCode()>& beforeRename) {
  if (!stream_) return fileWriteFailed;
  int err = 0;
  if (fflush(stream_) != 0 || ferror(stream_)) err = errno ? errno : EIO;
  if (!err && fsync(fileno(stream_)) != 0 && errno != EINVAL) err = errno;
  if (fclose(stream_) != 0 && !err) err = errno ? errno : EIO;
  stream_ = nullptr;
  if (!err && beforeRename) {
    ErrorCode refused = beforeRename();
    if (refused != allOK) {
      forgetTemporary();
      return refused;
    }
  }
  if (!err && rename(temp_.c_str(), target_.c_str()) != 0) err = errno;
  if (err) {
    forgetTemporary();
    recordSystemError(err, "while writing into %s", target_.c_str());
    return fileWriteFailed;
  }
  unregisterCleanupPath(cleanupSlot_);
  cleanupSlot_ = -1;
  temp_.clear();
  return allOK;
}

void AtomicFileWriter::abandon() {
  if (stream_) {
    fclose(stream_);
    stream_ = nullptr;
  }
  forgetTemporary();
}

void AtomicFileWriter::forgetTemporary() {
  if (!temp_.empty()) unlink(temp_.c_str());
  temp_.clear();
  unregisterCleanupPath(cleanupSlot_);
  cleanupSlot_ = -1;
}

std::string writeTargetFor(const std::string& path) {
  struct stat st;
  if (lstat(path.c_str(), &st) == 0 && S_ISLNK(st.st_mode)) {
    char* real = realpath(path.c_str(), nullptr);
    if (real) {
      std::string r = real;
      free(real);
      return r;
    }
  }
  return path;
}
