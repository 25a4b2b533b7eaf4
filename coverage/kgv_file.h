// Reading and writing coverage data files (.kgv) in either byte order.
#pragma once

#include <memory>
#include <string>

#include "adjust/errors.h"
#include "coverage/kgv_data.h"

// The header checks on the 88 header bytes as read from a file: 1, 25 (not a data file),
// 27 (version refused; the version detail is recorded) or 53 (the other product's file).
// Sets swapped when the file was written in the other byte order.
ErrorCode checkKgvHeader(const unsigned char* raw, bool* swapped = nullptr);

// Room for the bytes of a file while it is read; a caller reading many files keeps one so
// that each file does not need fresh memory.
class KgvReadBuffer {
 public:
  unsigned char* reserve(std::size_t n);  // contents not kept, not initialised
  void release() { data_.reset(); capacity_ = 0; }

 private:
  std::unique_ptr<unsigned char[]> data_;
  std::size_t capacity_ = 0;
};

// Reads a whole data file. On failure no data are returned. The caller holds the lock.
ErrorCode readKgvFile(const std::string& path, std::unique_ptr<KgvData>& out,
                      KgvReadBuffer* buffer = nullptr);

// Writes the data in this machine's byte order to a new file beside path, renamed over it
// only when everything was written; on failure the file that was there stays as it was.
// Sets saveTime, fills in unknown record times and rebuilds recordSizes. The caller holds
// the lock of path.
ErrorCode writeKgvFile(const std::string& path, KgvData& data);
