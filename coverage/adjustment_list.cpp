// Lookup, storing and merging of per-file adjustment entries.
#include "coverage/adjustment_list.h"

#include <ctime>
#include <utility>

AdjustEntry::AdjustEntry(KgvFileRef ref, CvgAdjustSetPtr set) : ref_(std::move(ref)) {
  setSet(std::move(set));
}

void AdjustEntry::setSet(CvgAdjustSetPtr set) {
  set_ = std::move(set);
  ref_.payload = set_.get();
}

CvgAdjustSetPtr AdjustEntry::takeSet() {
  ref_.payload = nullptr;
  return std::move(set_);
}

int AdjustmentList::position(const std::string& path) const {
  auto it = index_.find(path);
  return it == index_.end() ? -1 : static_cast<int>(it->second);
}

void AdjustmentList::reindex() {
  index_.clear();
  for (std::size_t i = 0; i < entries_.size(); ++i) index_.emplace(entries_[i].resolvedName(), i);
}

AdjustEntry* AdjustmentList::findEntry(const std::string& path) {
  int i = position(path);
  return i < 0 ? nullptr : &entries_[static_cast<std::size_t>(i)];
}

CvgAdjustSet* AdjustmentList::findSet(const std::string& path, int* pos) {
  int i = position(path);
  // Data may name a source relatively or through a symbolic link, while entries read from
  // the file carry resolved paths: the same file either way.
  if (i < 0 && !entries_.empty()) {
    const std::string resolved = resolveFilePath(path);
    if (resolved != path) i = position(resolved);
  }
  if (pos) *pos = i;
  return i < 0 ? nullptr : entries_[static_cast<std::size_t>(i)].set();
}

CvgAdjustSet* AdjustmentList::findSet(const std::string& dirName, const std::string& fileName) {
  return findSet(dirName + fileName);
}

void AdjustmentList::append(AdjustEntry entry) {
  index_.emplace(entry.resolvedName(), entries_.size());
  entries_.push_back(std::move(entry));
}

bool AdjustmentList::storeSet(CvgAdjustSetPtr set, const std::string& path, std::uint32_t now) {
  AdjustEntry entry(makeKgvFileRef(path, path), std::move(set));
  entry.setLoadTime(now);
  int i = position(path);
  if (i >= 0) {
    AdjustEntry& old = entries_[static_cast<std::size_t>(i)];
    if (adjustSetsEqual(old.set(), entry.set())) return false;
    old = std::move(entry);  // same resolved name: the index stays right
    return true;
  }
  append(std::move(entry));
  return true;
}

CvgAdjustSet* AdjustmentList::setForPath(const std::string& path, CvgAdjustSetPtr set,
                                         std::uint32_t now) {
  if (!set) set = std::make_unique<CvgAdjustSet>();
  storeSet(std::move(set), path, now);
  return findSet(path);
}

void AdjustmentList::removeEntry(int pos) {
  if (pos < 0 || static_cast<std::size_t>(pos) >= entries_.size()) return;
  entries_.erase(entries_.begin() + pos);
  reindex();
}

AdjustmentList AdjustmentList::merge(AdjustmentList old, AdjustmentList fresh) {
  for (AdjustEntry& e : old.entries_) {
    if (fresh.position(e.resolvedName()) < 0) fresh.append(std::move(e));
  }
  return fresh;
}

AdjustmentList& adjustmentList() {
  static AdjustmentList list;
  return list;
}

std::uint32_t adjustmentTimeNow() { return static_cast<std::uint32_t>(time(nullptr)); }
