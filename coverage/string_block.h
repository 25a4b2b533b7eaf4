// A table of strings gathered while open, then frozen into one sorted area of distinct
// names and searched by binary search.
#pragma once

#include <cstdint>
#include <deque>
#include <string>
#include <string_view>
#include <vector>

#include "support/errors.h"

class StringBlock {
 public:
  // Adds a copy of the string; only while open (else blockFroze).
  ErrorCode add(std::string_view s);
  // Adds a string that the caller keeps alive until the block is frozen.
  ErrorCode addBorrowed(std::string_view s);

  // Sorts, keeps one of each run of equal strings, lays them out each with its NUL and
  // pads to 4 bytes; the area goes to the caller. Only once (blockFroze); with no strings
  // blockEmpty.
  ErrorCode freeze(std::vector<char>& area, std::uint32_t& count, std::uint32_t& words);

  // Byte offset in the area and position in sorted order. Only when frozen (blockMelted);
  // stringNotInBlk when absent.
  ErrorCode find(std::string_view s, std::uint32_t& offset, std::uint32_t& position) const;

  bool frozen() const { return frozen_; }
  // After freezing: the offsets of the distinct strings in sorted order.
  const std::vector<std::uint32_t>& sortedOffsets() const { return offsets_; }

 private:
  bool frozen_ = false;
  std::deque<std::string> owned_;
  std::vector<std::string_view> pending_;
  std::vector<char> area_;                // the frozen area; the caller gets a copy
  std::vector<std::string_view> sorted_;  // views into area_
  std::vector<std::uint32_t> offsets_;
};
