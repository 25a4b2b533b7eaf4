// The adjustments of every source file the user has marked: one entry per resolved path.
#pragma once

#include <cstdint>
#include <string>
#include <unordered_map>
#include <vector>

#include "coverage/cvg_adjust_set.h"
#include "coverage/kgv_file_ref.h"

// A file reference whose payload is the file's adjustment set, owned here.
class AdjustEntry {
 public:
  explicit AdjustEntry(KgvFileRef ref, CvgAdjustSetPtr set = nullptr);
  AdjustEntry(AdjustEntry&&) = default;
  AdjustEntry& operator=(AdjustEntry&&) = default;

  const KgvFileRef& ref() const { return ref_; }
  const std::string& givenName() const { return ref_.givenName; }
  const std::string& resolvedName() const { return ref_.resolvedName; }
  std::uint32_t loadTime() const { return ref_.loadTime; }
  void setLoadTime(std::uint32_t t) { ref_.loadTime = t; }

  CvgAdjustSet* set() const { return set_.get(); }
  void setSet(CvgAdjustSetPtr set);
  CvgAdjustSetPtr takeSet();

 private:
  KgvFileRef ref_;
  CvgAdjustSetPtr set_;
};

class AdjustmentList {
 public:
  std::size_t size() const { return entries_.size(); }
  bool empty() const { return entries_.empty(); }
  const std::vector<AdjustEntry>& entries() const { return entries_; }
  AdjustEntry& at(std::size_t i) { return entries_.at(i); }

  // Position of the first entry whose resolved name is exactly the path, or -1.
  int position(const std::string& path) const;
  AdjustEntry* findEntry(const std::string& path);
  // The set stored for the path (nullptr when none); *position gets the entry's place or -1.
  CvgAdjustSet* findSet(const std::string& path, int* position = nullptr);
  // By the summary's directory name (ending in "/") and file name.
  CvgAdjustSet* findSet(const std::string& dirName, const std::string& fileName);

  void append(AdjustEntry entry);
  // Stores the set for the path, stamped with `now`. Returns whether the list changed: an
  // equal set already stored leaves it alone; a different one is replaced in place.
  bool storeSet(CvgAdjustSetPtr set, const std::string& path, std::uint32_t now);
  // The set the annotated source window edits for the path: the given one (or a new empty
  // one) when storing it changed the list, otherwise the one already stored.
  CvgAdjustSet* setForPath(const std::string& path, CvgAdjustSetPtr set, std::uint32_t now);
  void removeEntry(int position);
  void clear() {
    entries_.clear();
    index_.clear();
  }

  // Entries of the old list whose names the new list lacks move to its end; the new list,
  // thus completed, is the result.
  static AdjustmentList merge(AdjustmentList old, AdjustmentList fresh);

 private:
  void reindex();

  std::vector<AdjustEntry> entries_;
  // Resolved name -> position of the first entry with it, so that reading a file of many
  // entries stays linear.
  std::unordered_map<std::string, std::size_t> index_;
};

// The list of the process.
AdjustmentList& adjustmentList();

// Seconds since 1970 now, as stored in entries.
std::uint32_t adjustmentTimeNow();
