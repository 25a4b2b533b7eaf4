// Line predicates, the dominant adjustment and the count texts.
#include "coverage/line_state.h"

#include <cstdio>

#include "coverage/summary_types.h"

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

std::uint32_t dominantAdjustment(std::uint32_t flags) {
  // One-line markers win over ranges; dead code over inspected over tested.
  static const std::uint32_t order[] = {AdjDeadLine,  AdjInspectedLine,  AdjTestedLine,
                                        AdjDeadRange, AdjInspectedRange, AdjTestedRange};
  for (std::uint32_t k : order)
    if (flags & k) return k;
  return 0;
}

bool isDeadAdjustment(std::uint32_t k) { return k == AdjDeadLine || k == AdjDeadRange; }
bool isTestedAdjustment(std::uint32_t k) { return k == AdjTestedLine || k == AdjTestedRange; }
bool isInspectedAdjustment(std::uint32_t k) {
  return k == AdjInspectedLine || k == AdjInspectedRange;
}

bool lineHasCode(std::uint32_t flags) { return (flags & LineHasCode) != 0; }
bool lineUsed(std::uint32_t flags, std::uint16_t count) { return lineHasCode(flags) && count != 0; }
bool lineUnused(std::uint32_t flags, std::uint16_t count) {
  return lineHasCode(flags) && count == 0;
}

bool lineCountsForAdjusted(std::uint32_t flags, std::uint16_t count) {
  return lineHasCode(flags) && (count != 0 || !isDeadAdjustment(dominantAdjustment(flags)));
}

bool lineAdjustedUsed(std::uint32_t flags, std::uint16_t count) {
  std::uint32_t d = dominantAdjustment(flags);
  return lineHasCode(flags) && (count != 0 || isTestedAdjustment(d) || isInspectedAdjustment(d));
}

bool lineAdjustedUnused(std::uint32_t flags, std::uint16_t count) {
  return lineCountsForAdjusted(flags, count) && !lineAdjustedUsed(flags, count);
}

bool lineMarkedNotUnused(std::uint32_t flags, std::uint16_t count) {
  return (flags & kAdjustMask) != 0 && !lineUnused(flags, count);
}

bool lineUnusedDead(std::uint32_t flags, std::uint16_t count) {
  return lineUnused(flags, count) && isDeadAdjustment(dominantAdjustment(flags));
}
bool lineUnusedTested(std::uint32_t flags, std::uint16_t count) {
  return lineUnused(flags, count) && isTestedAdjustment(dominantAdjustment(flags));
}
bool lineUnusedInspected(std::uint32_t flags, std::uint16_t count) {
  return lineUnused(flags, count) && isInspectedAdjustment(dominantAdjustment(flags));
}

const char* countText(bool showAdjustments, std::uint32_t flags, std::uint16_t count) {
  static char buf[16];
  if (!lineHasCode(flags)) return "";
  if (count >= 10000) return "10K+";
  if (count != 0) {
    snprintf(buf, sizeof buf, "%u", static_cast<unsigned>(count));
    return buf;
  }
  if (showAdjustments) {
    std::uint32_t d = dominantAdjustment(flags);
    if (isDeadAdjustment(d)) return "DEAD";
    if (isTestedAdjustment(d)) return "TEST";
    if (isInspectedAdjustment(d)) return "INSP";
  }
  return "0";
}

const char* exportCountText(bool showAdjustments, std::uint32_t flags, std::uint16_t count) {
  if (count > 9999) return "10000";
  return countText(showAdjustments, flags, count);
}
