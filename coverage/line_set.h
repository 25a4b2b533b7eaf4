// A growable set of source line numbers. It behaves as a bit array indexed by the line
// number whose capacity starts at 2048 lines and doubles as needed, but is held as its
// maximal runs, so that a huge line number costs no more memory than a small one.
#pragma once

#include <cstdint>
#include <functional>
#include <utility>
#include <vector>

class LineSet {
 public:
  static constexpr std::uint64_t kInitialCapacity = 2048;

  // Capacity in lines; doubles (repeatedly) when a line at or beyond it is set.
  std::uint64_t capacity() const { return capacity_; }

  bool test(std::uint32_t line) const;
  // False (and nothing set) for line 0, which is never used.
  bool set(std::uint32_t line);
  void clear(std::uint32_t line);
  // Every line from first to last inclusive; false when first > last.
  bool setRange(std::uint32_t first, std::uint32_t last);
  // Clears first..last, bounded by the capacity.
  void clearRange(std::uint32_t first, std::uint32_t last);
  bool empty() const { return runs_.empty(); }

  // Same capacity and same contents.
  bool operator==(const LineSet& other) const = default;

  // Calls fn(first, last) for each maximal run of present lines in ascending order; stops
  // and returns false when fn does.
  bool forEachRun(const std::function<bool(std::uint32_t, std::uint32_t)>& fn) const;

 private:
  using Run = std::pair<std::uint32_t, std::uint32_t>;  // first, last
  std::uint64_t capacity_ = kInitialCapacity;
  std::vector<Run> runs_;  // ascending, disjoint, never adjacent
};
