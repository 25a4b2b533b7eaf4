// File identities by device, inode and birth time.
#include "support/file_identity.h"

#include <fcntl.h>
#include <sys/stat.h>
#include <sys/sysmacros.h>

bool fileIdentityOf(const char* path, FileIdentity& id) {
  struct statx sx;
  if (statx(AT_FDCWD, path, AT_SYMLINK_NOFOLLOW, STATX_INO | STATX_BTIME, &sx) != 0) return false;
  id.dev = makedev(sx.stx_dev_major, sx.stx_dev_minor);
  id.ino = sx.stx_ino;
  id.hasBirth = (sx.stx_mask & STATX_BTIME) != 0;
  id.birthSeconds = id.hasBirth ? sx.stx_btime.tv_sec : 0;
  id.birthNanoseconds = id.hasBirth ? sx.stx_btime.tv_nsec : 0;
  return true;
}

bool sameFile(const FileIdentity& a, const FileIdentity& b) {
  if (a.dev != b.dev || a.ino != b.ino) return false;
  if (!a.hasBirth || !b.hasBirth) return true;
  return a.birthSeconds == b.birthSeconds && a.birthNanoseconds == b.birthNanoseconds;
}
