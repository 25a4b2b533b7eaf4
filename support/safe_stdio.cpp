// Checked standard I/O with descriptor names for the messages.
#include "support/safe_stdio.h"

#include <cerrno>
#include <string>

#include "support/diagnostic.h"

namespace {
std::string gNames[64];
}

const char* descriptorName(int fd) {
  if (fd >= 0 && fd < 64 && !gNames[fd].empty()) return gNames[fd].c_str();
  return "<unknown>";
}

FILE* safeFopen(const char* name, const char* mode) {
  if (!name || !*name || !mode || !*mode) {
    errno = 0;
    kgInternalError("safeFopen: empty file name or mode.");
    return nullptr;
  }
  FILE* f = fopen(name, mode);
  if (!f) kgFatal("Couldn't open %s for mode %s.", name, mode);
  int fd = fileno(f);
  if (fd >= 0 && fd < 64) gNames[fd] = name;
  return f;
}

void safeFclose(FILE* f) {
  if (!f) return;
  int fd = fileno(f);
  std::string name = descriptorName(fd);
  if (fd >= 0 && fd < 64) gNames[fd].clear();
  if (fclose(f) != 0) kgFatal("Couldn't close file %s.", name.c_str());
}

size_t safeFread(void* buf, size_t size, FILE* f) {
  size_t n = fread(buf, 1, size, f);
  if (n == 0 && size != 0 && !ferror(f)) return 0;
  if (n != size)
    kgFatal("Read only %d bytes, out of %d, from file %s.", static_cast<int>(n),
            static_cast<int>(size), descriptorName(fileno(f)));
  return n;
}

void safeFwrite(const void* buf, size_t size, FILE* f) {
  size_t n = fwrite(buf, 1, size, f);
  if (n != size)
    kgFatal("Wrote only %d bytes, out of %d, into file %s.\n", static_cast<int>(n),
            static_cast<int>(size), descriptorName(fileno(f)));
}

void safeFseek(FILE* f, long offset, int whence) {
  if (fseek(f, offset, whence) != 0) {
    const char* from = whence == SEEK_SET   ? "start"
                       : whence == SEEK_CUR ? "current position"
                       : whence == SEEK_END ? "end"
                                            : "<invalid from>";
    kgFatal("Couldn't seek to offset %#lx (from %s) on file %s.", static_cast<unsigned long>(offset),
            from, descriptorName(fileno(f)));
  }
}
