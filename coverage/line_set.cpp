// Line sets as sorted maximal runs: updates merge or split runs in place.
#include "coverage/line_set.h"

#include <algorithm>

bool LineSet::test(std::uint32_t line) const {
  if (line >= capacity_) return false;
  // The last run that starts at or before the line.
  auto it = std::upper_bound(runs_.begin(), runs_.end(), line,
                             [](std::uint32_t l, const Run& r) { return l < r.first; });
  return it != runs_.begin() && std::prev(it)->second >= line;
}

bool LineSet::set(std::uint32_t line) { return line != 0 && setRange(line, line); }

void LineSet::clear(std::uint32_t line) { clearRange(line, line); }

bool LineSet::setRange(std::uint32_t first, std::uint32_t last) {
  if (first == 0) first = 1;  // line 0 is never used
  if (first > last) return false;
  while (last >= capacity_) capacity_ *= 2;
  // Runs that overlap or touch [first, last] merge with it.
  auto lo = std::lower_bound(runs_.begin(), runs_.end(), first, [](const Run& r, std::uint32_t f) {
    return static_cast<std::uint64_t>(r.second) + 1 < f;
  });
  auto hi = lo;
  while (hi != runs_.end() && hi->first <= static_cast<std::uint64_t>(last) + 1) ++hi;
  if (lo != hi) {
    first = std::min(first, lo->first);
    last = std::max(last, std::prev(hi)->second);
    lo = runs_.erase(lo, hi);
  }
  runs_.insert(lo, Run{first, last});
  return true;
}

void LineSet::clearRange(std::uint32_t first, std::uint32_t last) {
  if (first > last || first >= capacity_) return;
  if (last >= capacity_) last = static_cast<std::uint32_t>(capacity_ - 1);
  auto lo = std::lower_bound(runs_.begin(), runs_.end(), first,
                             [](const Run& r, std::uint32_t f) { return r.second < f; });
  std::vector<Run> keep;
  auto hi = lo;
  while (hi != runs_.end() && hi->first <= last) {
    if (hi->first < first) keep.push_back({hi->first, first - 1});
    if (hi->second > last) keep.push_back({last + 1, hi->second});
    ++hi;
  }
  lo = runs_.erase(lo, hi);
  runs_.insert(lo, keep.begin(), keep.end());
}

bool LineSet::forEachRun(const std::function<bool(std::uint32_t, std::uint32_t)>& fn) const {
  for (const Run& r : runs_) {
    if (!fn(r.first, r.second)) return false;
  }
  return true;
}
