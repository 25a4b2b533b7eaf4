// Combining coverage data: records of the same source file and version add their counts;
// different versions keep the newest (mode 1) or are merged line by line (mode 2).
#pragma once

#include <memory>
#include <string>
#include <string_view>
#include <unordered_map>
#include <vector>

#include "coverage/kgv_data.h"
#include "support/errors.h"
#include "support/message_sink.h"

constexpr std::uint32_t kMergeNewestWins = 1;
constexpr std::uint32_t kMergeForce = 2;

// Merges B into A in place; of B only counts at block-line positions may be filled in.
// 1, 36 (some data set aside: an older version, or Java and C/C++ data mixed) or 12. The
// source files of older versions set aside go to `ignored`; mixed languages are a warning.
ErrorCode mergeKgvData(std::uint32_t mode, KgvData& a, KgvData& b,
                       std::vector<std::string>* ignored, MessageSink& messages);
// A deep copy of A with B merged into it; A is unchanged. No data on a code other than 1/36.
ErrorCode mergeKgvDataCopy(std::uint32_t mode, const KgvData& a, KgvData& b,
                           std::vector<std::string>* ignored, MessageSink& messages,
                           std::unique_ptr<KgvData>& out);

// Count merge of two records of one version: X changes, R not.
void countMergeRecords(ObjRecord& x, const ObjRecord& r, bool hitFlagsOnly);
// The same with R's header, map and counts given where they lie.
void countMergeArrays(ObjRecord& x, const ObjHeader& rh, const std::uint32_t* rmap,
                      const std::uint16_t* rcounts, std::size_t n, bool hitFlagsOnly);
// Structural merge of two versions of one source file into a new record.
std::unique_ptr<ObjRecord> structuralMergeRecords(const ObjRecord& x, const ObjRecord& r,
                                                  bool hitFlagsOnly);

struct KgvRecordBytes;

// Merges file after file into one accumulated body without copying it each time: records
// are found by file name through a hash index (the first record of a name wins).
class KgvMerger {
 public:
  // Warnings about data set aside go to `messages`.
  KgvMerger(KgvData& into, MessageSink& messages);
  // One body merged in. With consume, B's records are moved instead of copied (B is
  // spent). With rebuildSizes false the caller rebuilds recordSizes when done.
  ErrorCode merge(std::uint32_t mode, KgvData& b, std::vector<std::string>* ignored, bool consume,
                  bool rebuildSizes);

  // The same, record by record while a file is read: begin is false when Java and C/C++
  // data meet (the file is then set aside: warnMixedLanguages, and 36); add for each record;
  // finish gives 1, or 36 when records were set aside.
  bool begin(const KgvHeader& b);
  ErrorCode add(std::uint32_t mode, const KgvRecordBytes& record, std::vector<std::string>* ignored);
  ErrorCode finish(std::uint32_t mode, const KgvHeader& b, bool rebuildSizes);
  // The warning that a file of the other language was set aside.
  void warnMixedLanguages();

  bool mergedAny() const { return mergedAny_; }

 private:
  template <class Source>
  void mergeOne(std::uint32_t mode, Source& src, std::vector<std::string>* ignored);
  void replace(size_t at, std::unique_ptr<ObjRecord> record);
  KgvData& a_;
  MessageSink& messages_;
  std::unordered_map<std::string_view, size_t> index_;
  bool mergedAny_ = false;
  bool hitFlags_ = false;
  bool ignoredNow_ = false;
};
