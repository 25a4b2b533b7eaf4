// The in-memory coverage data: file header, object records with their tagged maps, and
// the count arithmetic shared by reading, merging and summarising.
#pragma once

#include <cstdint>
#include <cstring>
#include <memory>
#include <string>
#include <string_view>
#include <vector>

#include "support/errors.h"

constexpr std::uint32_t kKgvMagic = 0xACC01ADE;
constexpr std::uint32_t kKgvMagic2 = 0xB01DFACE;
constexpr std::uint32_t kKgvFileKind = 1;
constexpr std::uint32_t kKgvFormatVersion = 5;  // what this program writes into new files
constexpr std::uint32_t kKgvOldestReader = 4;
constexpr std::uint32_t kKgvReaderVersion = 5;  // the newest format this reader understands
constexpr std::uint16_t kCountLimit = 10000;    // combined counts stop here

// 88 bytes, in the order of the file.
struct KgvHeader {
  std::uint32_t magic = kKgvMagic;
  std::uint32_t fileKind = kKgvFileKind;
  std::uint32_t formatVersion = kKgvFormatVersion;
  std::uint32_t oldestReader = kKgvOldestReader;
  std::uint32_t magic2 = kKgvMagic2;
  std::uint32_t saveTime = 0;
  std::uint32_t recordCount = 0;
  std::uint32_t clockTime = 0;  // tenths of a second, summed over sessions
  std::uint32_t cpuTime = 0;
  std::uint32_t isJava = 0;
  std::uint32_t hitFlagsOnly = 0;
  std::uint8_t reserved[44] = {};
};
static_assert(sizeof(KgvHeader) == 88);

// 64 bytes at the start of every record.
struct ObjHeader {
  std::uint32_t signature = 0;
  std::uint32_t buildTime = 0;
  std::uint32_t firstTime = 0;
  std::uint32_t lastTime = 0;
  std::uint32_t stringWords = 0;
  std::uint32_t mapCount = 0;
  std::uint8_t reserved[40] = {};
};
static_assert(sizeof(ObjHeader) == 64);

// Map entries: the tag in the top 4 bits, the value in the low 28.
enum MapTag : std::uint32_t {
  TagEmpty = 0x0,
  TagFile = 0x2,
  TagFunction = 0x3,
  TagFuncLine = 0x4,
  TagBlock = 0x6,
  TagBlockLine = 0x7,
};
constexpr std::uint32_t kMapValueMask = 0x0FFFFFFF;
constexpr std::uint32_t mapTag(std::uint32_t entry) { return entry >> 28; }
constexpr std::uint32_t mapValue(std::uint32_t entry) { return entry & kMapValueMask; }
constexpr std::uint32_t makeMapEntry(std::uint32_t tag, std::uint32_t value) {
  return (tag << 28) | (value & kMapValueMask);
}

// The data of one compiled object file (one source file).
struct ObjRecord {
  ObjHeader objHeader;
  std::vector<char> strings;          // NUL-terminated names, padded to 4 bytes
  std::vector<std::uint32_t> map;     // objHeader.mapCount entries
  std::vector<std::uint16_t> counts;  // parallel to map
  std::uint32_t fileNameOffset = 0;   // where the TagFile name lies in strings
  // Bytes of the record as read beyond its parts (the odd-count padding and any excess
  // the index granted); written back unchanged so a read file round-trips exactly.
  std::vector<std::uint8_t> tail;
  bool fromFile = false;
  // After a structural merge: the offsets of the distinct names in sorted order.
  std::vector<std::uint32_t> nameIndex;

  const char* fileName() const { return strings.data() + fileNameOffset; }
  std::string_view fileNameView() const { return std::string_view(fileName()); }
  // The NUL-terminated name at an offset of the string area ("" when out of range).
  const char* nameAt(std::uint32_t offset) const {
    return offset < strings.size() ? strings.data() + offset : "";
  }
};

// One body of coverage data: from one file, or merged from several.
struct KgvData {
  KgvHeader header;
  std::vector<std::uint32_t> recordSizes;  // words per record, in list order
  std::vector<std::unique_ptr<ObjRecord>> records;
  std::uint32_t mergeMode = 1;  // 1: newest version wins; 2: force merge
};

// Size of a record in 4-byte words as it would be written from memory.
std::uint32_t recordWords(const ObjRecord& r);
void rebuildRecordSizes(KgvData& d);

std::unique_ptr<ObjRecord> copyObjRecord(const ObjRecord& r);
std::unique_ptr<KgvData> copyKgvData(const KgvData& d);

// How merged counts combine: hit flags or with the limit of 10000. The process-wide mode is
// set by a merge from the data merged into.
void setHitFlagsMode(bool hitFlagsOnly);
bool hitFlagsMode();
inline std::uint16_t combineCounts(std::uint16_t a, std::uint16_t b, bool hitFlagsOnly) {
  if (hitFlagsOnly) return (a != 0 || b != 0) ? 1 : 0;
  std::uint32_t sum = std::uint32_t(a) + b;
  return static_cast<std::uint16_t>(sum > kCountLimit ? kCountLimit : sum);
}
std::uint16_t combineCounts(std::uint16_t a, std::uint16_t b);

bool sameVersion(const ObjRecord& a, const ObjRecord& b);
bool isNewer(const ObjRecord& a, const ObjRecord& b);
bool isNewerHeader(const ObjHeader& a, const ObjHeader& b);
