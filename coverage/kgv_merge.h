// Combining coverage data: records of the same source file and version add their counts;
// different versions keep the newest (mode 1) or are merged line by line (mode 2).
#pragma once

#include <memory>
#include <string>
#include <string_view>
#include <unordered_map>
#include <vector>

#include "adjust/errors.h"
#include "coverage/kgv_data.h"

constexpr std::uint32_t kMergeNewestWins = 1;
constexpr std::uint32_t kMergeForce = 2;

// Merges B into A in place; of B only counts at block-line positions may be filled in.
// 1, 36 (some data set aside: an older version, or Java and C/C++ data mixed) or 12.
ErrorCode mergeKgvData(std::uint32_t mode, KgvData& a, KgvData& b,
                       std::vector<std::string>* ignored);
// A deep copy of A with B merged into it; A is unchanged. No data on a code other than 1/36.
ErrorCode mergeKgvDataCopy(std::uint32_t mode, const KgvData& a, KgvData& b,
                           std::vector<std::string>* ignored, std::unique_ptr<KgvData>& out);

// Count merge of two records of one version: X changes, R's block-line counts may be filled.
void countMergeRecords(ObjRecord& x, ObjRecord& r, bool hitFlagsOnly);
// Structural merge of two versions of one source file into a new record.
std::unique_ptr<ObjRecord> structuralMergeRecords(const ObjRecord& x, const ObjRecord& r,
                                                  bool hitFlagsOnly);

// Merges file after file into one accumulated body without copying it each time: records
// are found by file name through a hash index (the first record of a name wins).
class KgvMerger {
 public:
  explicit KgvMerger(KgvData& into);
  // One merge step. With consume, B's records are moved instead of copied (B is spent).
  // With rebuildSizes false the caller rebuilds recordSizes when done.
  ErrorCode merge(std::uint32_t mode, KgvData& b, std::vector<std::string>* ignored, bool consume,
                  bool rebuildSizes);
  bool mergedAny() const { return mergedAny_; }

 private:
  void replace(size_t at, std::unique_ptr<ObjRecord> record);
  KgvData& a_;
  std::unordered_map<std::string_view, size_t> index_;
  bool mergedAny_ = false;
};
