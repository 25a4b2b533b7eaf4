// Adding counts, and the rule by which an unused line counts under its adjustment.
#include "coverage/summary_types.h"

namespace {

// One unused line's part in the counts an adjustment changes.
struct UnusedLineShare {
  int adjLines = 0;
  int adjUnusedLines = 0;
  int deadLines = 0;
  int testedLines = 0;
  int inspectedLines = 0;
};

UnusedLineShare shareOf(CvgAdjust kind) {
  UnusedLineShare s;
  if (isDeadAdjustment(kind)) {
    s.deadLines = 1;
  } else if (isTestedAdjustment(kind)) {
    s.testedLines = 1;
    s.adjLines = 1;
  } else if (isInspectedAdjustment(kind)) {
    s.inspectedLines = 1;
    s.adjLines = 1;
  } else {
    s.adjLines = 1;
    s.adjUnusedLines = 1;
  }
  return s;
}

void step(std::uint32_t& v, int d) {
  if (d < 0 && v < static_cast<std::uint32_t>(-d)) {
    v = 0;
    return;
  }
  v = static_cast<std::uint32_t>(static_cast<long long>(v) + d);
}

bool isKind(CvgAdjust kind) {
  return isDeadAdjustment(kind) || isTestedAdjustment(kind) || isInspectedAdjustment(kind);
}

}  // namespace

SumCounts& SumCounts::operator+=(const SumCounts& o) {
  lines += o.lines;
  unusedLines += o.unusedLines;
  blocks += o.blocks;
  unusedBlocks += o.unusedBlocks;
  deadLines += o.deadLines;
  testedLines += o.testedLines;
  inspectedLines += o.inspectedLines;
  adjLines += o.adjLines;
  adjUnusedLines += o.adjUnusedLines;
  return *this;
}

void countUnusedLine(SumCounts& c, CvgAdjust dominantKind) {
  const UnusedLineShare s = shareOf(dominantKind);
  c.adjLines += s.adjLines;
  c.adjUnusedLines += s.adjUnusedLines;
  c.deadLines += s.deadLines;
  c.testedLines += s.testedLines;
  c.inspectedLines += s.inspectedLines;
}

void moveUnusedLine(SumCounts& c, CvgAdjust from, CvgAdjust to) {
  // A value that is none of the kinds changes nothing (0 is "no adjustment", a share of its own).
  if ((from != 0 && !isKind(from)) || (to != 0 && !isKind(to))) return;
  const UnusedLineShare a = shareOf(from);
  const UnusedLineShare b = shareOf(to);
  step(c.adjLines, b.adjLines - a.adjLines);
  step(c.adjUnusedLines, b.adjUnusedLines - a.adjUnusedLines);
  step(c.deadLines, b.deadLines - a.deadLines);
  step(c.testedLines, b.testedLines - a.testedLines);
  step(c.inspectedLines, b.inspectedLines - a.inspectedLines);
}
