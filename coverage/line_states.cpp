// Line states kept as segments of alike lines.
#include "coverage/line_states.h"

#include <algorithm>
#include <stdexcept>

#include "coverage/summary_build.h"

void LineStates::clear() {
  lineCount_ = 0;
  segs_.clear();
  segs_.shrink_to_fit();
  cursor_ = 0;
}

void LineStates::reset(std::uint32_t lineCount, std::vector<std::uint32_t> singles,
                       std::vector<std::uint32_t> boundaries) {
  clear();
  lineCount_ = lineCount;
  if (lineCount == 0) return;
  boundaries.push_back(1);
  for (std::uint32_t l : singles) {
    if (l == 0 || l > lineCount) continue;
    boundaries.push_back(l);
    boundaries.push_back(l + 1);
  }
  std::erase_if(boundaries, [&](std::uint32_t b) { return b == 0 || b > lineCount; });
  std::sort(boundaries.begin(), boundaries.end());
  boundaries.erase(std::unique(boundaries.begin(), boundaries.end()), boundaries.end());
  segs_.reserve(boundaries.size());
  for (std::uint32_t b : boundaries) segs_.push_back(Segment{b, LineState{}});
}

std::size_t LineStates::indexOf(std::uint32_t line) const {
  const std::size_t n = segs_.size();
  // Most readers go line by line: the last answer or the one after it usually holds.
  if (cursor_ < n && line >= segs_[cursor_].first) {
    if (line <= lastOf(cursor_)) return cursor_;
    if (cursor_ + 1 < n && line <= lastOf(cursor_ + 1)) return ++cursor_;
  }
  auto it = std::upper_bound(segs_.begin(), segs_.end(), line,
                             [](std::uint32_t l, const Segment& s) { return l < s.first; });
  cursor_ = it == segs_.begin() ? 0 : static_cast<std::size_t>(it - segs_.begin()) - 1;
  return cursor_;
}

const LineState& LineStates::operator[](std::size_t index) const {
  return segs_[indexOf(static_cast<std::uint32_t>(index + 1))].state;
}

const LineState& LineStates::at(std::size_t index) const {
  if (index >= lineCount_) throw std::out_of_range("line state");
  return (*this)[index];
}

LineState* LineStates::single(std::uint32_t line) {
  if (line == 0 || line > lineCount_) return nullptr;
  const std::size_t k = indexOf(line);
  return segs_[k].first == line && lastOf(k) == line ? &segs_[k].state : nullptr;
}

void LineStates::classify() {
  // All lines of a segment behave alike in both passes, so each takes part as one line.
  std::vector<LineState*> units;
  units.reserve(segs_.size());
  for (Segment& s : segs_) units.push_back(&s.state);
  classifyLineUnits(units);
}

std::vector<LineState> LineStates::dense(std::uint32_t lines) const {
  const std::uint32_t n = std::min(lines, lineCount_);
  std::vector<LineState> out;
  out.reserve(n);
  for (std::size_t k = 0; k < segs_.size() && segs_[k].first <= n; ++k)
    out.insert(out.end(), std::min(lastOf(k), n) - segs_[k].first + 1, segs_[k].state);
  return out;
}
