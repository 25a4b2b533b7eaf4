// The line states of one source file. A file's data can name any line up to 2^28, while
// only the lines its map names (and the ranges its adjustments mark) carry anything. The
// states are kept as segments covering lines 1..size(): a line the map names is a segment of
// its own, and every stretch between them is one segment whose lines share one state. Memory
// follows the size of the data, never the largest line number.
#pragma once

#include <cstddef>
#include <cstdint>
#include <vector>

#include "coverage/line_state.h"

// The actual and adjusted class of every line from its flags and count: lines between two
// relevant lines of one class inside a function take the between class. (The summary does this
// for every file; an editor of adjustments redoes it for its copy of a file's lines.)
void classifyLines(std::vector<LineState>& states);
// The same over lines given one by one (a line may stand for a run of alike lines).
void classifyLineUnits(std::vector<LineState*>& units);

class LineStates {
 public:
  LineStates() = default;

  // Lines 1..lineCount in segments: each of `singles` (1-based; others ignored) alone, the
  // rest split at every boundary in `boundaries` (the first line of a new segment), or
  // simply a segment per line where the data name most lines. All states cleared; both
  // vectors may be changed.
  void reset(std::uint32_t lineCount, std::vector<std::uint32_t>& singles, std::vector<std::uint32_t>& boundaries);
  void clear();

  std::uint32_t size() const { return lineCount_; }
  bool empty() const { return lineCount_ == 0; }
  // index 0 = line 1.
  const LineState& operator[](std::size_t index) const;
  // As operator[], checking the index (std::out_of_range).
  const LineState& at(std::size_t index) const;
  // The state of a line that is a segment of its own; null for any other line.
  LineState* single(std::uint32_t line) {
    if (line == 0 || line > lineCount_) return nullptr;
    if (segs_.size() == lineCount_) return &segs_[line - 1].state;  // a segment per line
    return singleInSegments(line);
  }
  std::size_t segments() const { return segs_.size(); }

  // Calls fn(first, last, state) for every segment in order (mutable, for building).
  template <class Fn>
  void forEachSegment(Fn fn) {
    for (std::size_t k = 0; k < segs_.size(); ++k) fn(segs_[k].first, lastOf(k), segs_[k].state);
  }
  // Calls fn(line, state) for every line with code from first to last, in order.
  template <class Fn>
  void forEachCodeLine(std::uint32_t first, std::uint32_t last, Fn fn) const {
    if (first == 0 || segs_.empty()) return;
    for (std::size_t k = indexOf(first); k < segs_.size() && segs_[k].first <= last; ++k)
      if (segs_[k].state.flags & LineHasCode) fn(segs_[k].first, segs_[k].state);
  }

  // The two class passes over all lines (see classifyLines).
  void classify();

  // Lines 1..min(lines, size()) as one array, for a window showing that many lines.
  std::vector<LineState> dense(std::uint32_t lines) const;

 private:
  struct Segment {
    std::uint32_t first;
    LineState state;
  };
  std::size_t indexOf(std::uint32_t line) const;  // the segment holding the line
  LineState* singleInSegments(std::uint32_t line);
  std::uint32_t lastOf(std::size_t k) const {
    return k + 1 < segs_.size() ? segs_[k + 1].first - 1 : lineCount_;
  }

  std::uint32_t lineCount_ = 0;
  std::vector<Segment> segs_;
  mutable std::size_t cursor_ = 0;
};
