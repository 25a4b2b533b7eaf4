// The two-phase string table: gather, freeze into a sorted area, search.
#include "coverage/string_block.h"

#include <algorithm>
#include <cstring>

ErrorCode StringBlock::add(std::string_view s) {
  if (frozen_) return blockFroze;
  owned_.emplace_back(s);
  pending_.push_back(owned_.back());
  return allOK;
}

ErrorCode StringBlock::addBorrowed(std::string_view s) {
  if (frozen_) return blockFroze;
  pending_.push_back(s);
  return allOK;
}

ErrorCode StringBlock::freeze(std::vector<char>& area, std::uint32_t& count, std::uint32_t& words) {
  if (frozen_) return blockFroze;
  if (pending_.empty()) return blockEmpty;
  std::sort(pending_.begin(), pending_.end());
  pending_.erase(std::unique(pending_.begin(), pending_.end()), pending_.end());
  size_t bytes = 0;
  for (auto s : pending_) bytes += s.size() + 1;
  bytes = (bytes + 3) & ~size_t(3);
  area_.assign(bytes, '\0');
  offsets_.clear();
  offsets_.reserve(pending_.size());
  size_t at = 0;
  for (auto s : pending_) {
    if (!s.empty()) std::memcpy(area_.data() + at, s.data(), s.size());
    offsets_.push_back(static_cast<std::uint32_t>(at));
    at += s.size() + 1;
  }
  sorted_.clear();
  sorted_.reserve(offsets_.size());
  for (auto off : offsets_) sorted_.emplace_back(area_.data() + off);
  count = static_cast<std::uint32_t>(pending_.size());
  words = static_cast<std::uint32_t>(bytes / 4);
  area = area_;
  pending_.clear();
  owned_.clear();
  frozen_ = true;
  return allOK;
}

ErrorCode StringBlock::find(std::string_view s, std::uint32_t& offset,
                            std::uint32_t& position) const {
  if (!frozen_) return blockMelted;
  auto it = std::lower_bound(sorted_.begin(), sorted_.end(), s);
  if (it == sorted_.end() || *it != s) return stringNotInBlk;
  position = static_cast<std::uint32_t>(it - sorted_.begin());
  offset = offsets_[position];
  return allOK;
}
