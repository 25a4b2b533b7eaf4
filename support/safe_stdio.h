// Checked standard I/O: failures stop the process with a message naming the file.
#pragma once

#include <cstdio>

FILE* safeFopen(const char* name, const char* mode);
void safeFclose(FILE* f);
// Reads exactly `size` bytes; returns 0 at end of file, `size` otherwise; a short read is fatal.
size_t safeFread(void* buf, size_t size, FILE* f);
void safeFwrite(const void* buf, size_t size, FILE* f);
// whence: SEEK_SET, SEEK_CUR or SEEK_END.
void safeFseek(FILE* f, long offset, int whence);
// The name a descriptor was opened under, or "<unknown>".
const char* descriptorName(int fd);
