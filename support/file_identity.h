// Which file a name stands for right now. Device and inode alone are not enough: a
// directory removed and made again at once often gets the same inode number, so the birth
// time tells them apart where the file system records it.
#pragma once

#include <sys/types.h>

#include <cstdint>

struct FileIdentity {
  dev_t dev = 0;
  ino_t ino = 0;
  bool hasBirth = false;
  std::int64_t birthSeconds = 0;
  std::uint32_t birthNanoseconds = 0;
};

// The identity of the name itself (a symbolic link is not followed). False when it cannot
// be examined. Async-signal-safe.
bool fileIdentityOf(const char* path, FileIdentity& id);
// Same device and inode, and the same birth when both know theirs.
bool sameFile(const FileIdentity& a, const FileIdentity& b);
