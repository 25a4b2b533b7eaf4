// A growable set of source line numbers kept as a bit array indexed by the line number.
#pragma once

#include <cstdint>
#include <functional>
#include <vector>

class LineSet {
 public:
  static constexpr std::uint32_t kInitialCapacity = 2048;
  // Lines above this are refused: a set holding them would need hundreds of megabytes,
  // and no source file has that many lines.
  static constexpr std::uint32_t kMaxLine = (1u << 24) - 1;

  LineSet();

  // Capacity in lines; doubles (repeatedly) when a line at or beyond it is set.
  std::uint32_t capacity() const { return capacity_; }

  bool test(std::uint32_t line) const;
  // False (and nothing set) for line 0 or a line above kMaxLine.
  bool set(std::uint32_t line);
  void clear(std::uint32_t line);
  // Every line from first to last inclusive (first <= last); false when last > kMaxLine.
  bool setRange(std::uint32_t first, std::uint32_t last);
  // Clears first..last, bounded by the capacity.
  void clearRange(std::uint32_t first, std::uint32_t last);
  bool empty() const;

  // Same capacity and same contents.
  bool operator==(const LineSet& other) const = default;

  // Calls fn(first, last) for each maximal run of present lines in ascending order; stops
  // and returns false when fn does.
  bool forEachRun(const std::function<bool(std::uint32_t, std::uint32_t)>& fn) const;

 private:
  void grow(std::uint32_t line);
  std::uint32_t findBit(std::uint32_t pos, bool value) const;

  std::uint32_t capacity_;
  std::vector<std::uint64_t> words_;
};
