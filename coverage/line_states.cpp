// Line states kept as segments of alike lines.
#include "coverage/line_states.h"

#include <algorithm>
#include <stdexcept>

namespace {

// The state of one class pass over a file's lines.
struct ClassPass {
  std::size_t previous = 0;  // 1-based position of the previous relevant line; 0 = none
  std::uint32_t previousClass = 0;
  bool inFunction = false;

  // The class of the line at position l; lines between two relevant lines of the same class
  // in a function are filled through `store` (at(k) gives the line at position k).
  template <typename At, typename Store>
  std::uint32_t step(At at, std::size_t l, std::uint32_t flags, bool relevant, bool good, Store store) {
    std::uint32_t cls = ClassNothing;
    if (flags & LineFuncStart) inFunction = true;
    if (relevant) {
      cls = good ? ClassUsed : ClassUnused;
      if (cls == previousClass && inFunction && previous != 0) {
        for (std::size_t k = previous + 1; k < l; ++k) store(at(k), good ? ClassBetweenUsed : ClassBetweenUnused);
      }
      previous = l;
      previousClass = cls;
    }
    if (flags & LineFuncEnd) {
      inFunction = false;
      previous = 0;
    }
    return cls;
  }
};

// Both passes in one walk: actual (relevant = has code, good = used) and adjusted
// (relevant = counts for adjusted coverage, good = adjusted used); at(l) is the line at
// position l (1-based).
template <typename At>
void classifyPasses(std::size_t count, At at) {
  ClassPass actual, adjusted;
  for (std::size_t l = 1; l <= count; ++l) {
    LineState& s = at(l);
    std::uint32_t flags = s.flags;
    bool code = (flags & LineHasCode) != 0;
    bool used = code && s.count != 0;
    bool adjRelevant = code, adjGood = used;
    // Lines without adjustments (nearly all) are decided here; the others by the predicates.
    if (flags & adjAnyMask) {
      adjRelevant = lineCountsForAdjusted(flags, s.count);
      adjGood = lineAdjustedUsed(flags, s.count);
    }
    s.actualClass = actual.step(at, l, flags, code, used, [](LineState& t, std::uint32_t c) { t.actualClass = c; });
    s.adjustedClass =
        adjusted.step(at, l, flags, adjRelevant, adjGood, [](LineState& t, std::uint32_t c) { t.adjustedClass = c; });
  }
}


}  // namespace

void classifyLines(std::vector<LineState>& states) {
  classifyPasses(states.size(), [&](std::size_t l) -> LineState& { return states[l - 1]; });
}

void classifyLineUnits(std::vector<LineState*>& units) {
  classifyPasses(units.size(), [&](std::size_t l) -> LineState& { return *units[l - 1]; });
}

void LineStates::clear() {
  lineCount_ = 0;
  segs_.clear();
  segs_.shrink_to_fit();
  cursor_ = 0;
}

void LineStates::reset(std::uint32_t lineCount, std::vector<std::uint32_t>& singles,
                       std::vector<std::uint32_t>& boundaries) {
  // Storage is kept: a caller building file after file reuses it.
  segs_.clear();
  cursor_ = 0;
  lineCount_ = lineCount;
  if (lineCount == 0) return;
  // Where the data name most lines anyway, every line is a segment of its own: no sorting,
  // and a line's segment is found by its number.
  const std::uint64_t named = singles.size() + boundaries.size();
  if (lineCount <= 8 * named + 1024) {
    segs_.resize(lineCount);
    for (std::uint32_t l = 0; l < lineCount; ++l) segs_[l] = Segment{l + 1, LineState{}};
    return;
  }
  boundaries.push_back(1);
  for (std::uint32_t l : singles) {
    if (l == 0 || l > lineCount) continue;
    boundaries.push_back(l);
    boundaries.push_back(l + 1);
  }
  std::erase_if(boundaries, [&](std::uint32_t b) { return b == 0 || b > lineCount; });
  if (!std::is_sorted(boundaries.begin(), boundaries.end())) std::sort(boundaries.begin(), boundaries.end());
  boundaries.erase(std::unique(boundaries.begin(), boundaries.end()), boundaries.end());
  segs_.reserve(boundaries.size());
  for (std::uint32_t b : boundaries) segs_.push_back(Segment{b, LineState{}});
}

std::size_t LineStates::indexOf(std::uint32_t line) const {
  const std::size_t n = segs_.size();
  if (n == lineCount_) return line == 0 ? 0 : std::min<std::size_t>(line, n) - 1;  // a line each
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

LineState* LineStates::singleInSegments(std::uint32_t line) {
  const std::size_t k = indexOf(line);
  return segs_[k].first == line && lastOf(k) == line ? &segs_[k].state : nullptr;
}

void LineStates::classify() {
  if (segs_.size() == lineCount_) {
    classifyPasses(segs_.size(), [this](std::size_t l) -> LineState& { return segs_[l - 1].state; });
    return;
  }
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
