// Reading and writing coverage data files (.kgv) in either byte order.
#pragma once

#include <memory>
#include <string>
#include <vector>

#include "coverage/kgv_data.h"
#include "support/errors.h"

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

// One record where it lies in the bytes read from a file, already checked. Map and counts
// are as in the file: reversed only when swapped says so. Valid during the visit only.
struct KgvRecordBytes {
  const unsigned char* data = nullptr;  // the record's bytes, as many as its index entry says
  std::size_t size = 0;
  bool swapped = false;
  ObjHeader header;  // in this machine's byte order; reserved bytes as in the file
  const char* strings = nullptr;
  std::size_t stringBytes = 0;
  const std::uint32_t* map = nullptr;
  const std::uint16_t* counts = nullptr;
  std::size_t mapCount = 0;
  std::uint32_t fileNameOffset = 0;
  const char* fileName() const { return strings + fileNameOffset; }
};

// A record copied out of the file's bytes, in this machine's byte order.
std::unique_ptr<ObjRecord> makeObjRecord(const KgvRecordBytes& bytes);

// Receives a file's header and index, then its records in order; a code other than 1 ends
// the read with that code.
class KgvRecordVisitor {
 public:
  virtual ~KgvRecordVisitor() = default;
  virtual ErrorCode header(const KgvHeader& header, const std::vector<std::uint32_t>& sizes) = 0;
  virtual ErrorCode record(const KgvRecordBytes& record) = 0;
};

// Reads a file with all the checks of readKgvFile, handing each record to the visitor as
// soon as it is checked.
ErrorCode readKgvRecords(const std::string& path, KgvReadBuffer* buffer, KgvRecordVisitor& visitor);

// Reads a whole data file. On failure no data are returned. The caller holds the lock.
ErrorCode readKgvFile(const std::string& path, std::unique_ptr<KgvData>& out,
                      KgvReadBuffer* buffer = nullptr);

// Writes the data in this machine's byte order to a new file beside path, renamed over it
// only when everything was written; on failure the file that was there stays as it was.
// Sets saveTime, fills in unknown record times and rebuilds recordSizes. The caller holds
// the lock of path: left-over new copies of killed writers are removed, and when the lock
// was broken meanwhile nothing is replaced (13). A path that is a symbolic link has the
// linked file replaced, its permissions kept.
ErrorCode writeKgvFile(const std::string& path, KgvData& data);
