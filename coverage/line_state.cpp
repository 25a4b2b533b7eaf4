// Line predicates and the count texts.
#include "coverage/line_state.h"

#include <cstdio>

bool lineHasCode(std::uint32_t flags) { return (flags & LineHasCode) != 0; }
bool lineUsed(std::uint32_t flags, std::uint16_t count) { return lineHasCode(flags) && count != 0; }
bool lineUnused(std::uint32_t flags, std::uint16_t count) {
  return lineHasCode(flags) && count == 0;
}

bool lineCountsForAdjusted(std::uint32_t flags, std::uint16_t count) {
  return lineHasCode(flags) && (count != 0 || !isDeadAdjustment(dominantAdjust(flags)));
}

bool lineAdjustedUsed(std::uint32_t flags, std::uint16_t count) {
  std::uint32_t d = dominantAdjust(flags);
  return lineHasCode(flags) && (count != 0 || isTestedAdjustment(d) || isInspectedAdjustment(d));
}

bool lineAdjustedUnused(std::uint32_t flags, std::uint16_t count) {
  return lineCountsForAdjusted(flags, count) && !lineAdjustedUsed(flags, count);
}

bool lineMarkedNotUnused(std::uint32_t flags, std::uint16_t count) {
  return (flags & adjAnyMask) != 0 && !lineUnused(flags, count);
}

bool lineUnusedDead(std::uint32_t flags, std::uint16_t count) {
  return lineUnused(flags, count) && isDeadAdjustment(dominantAdjust(flags));
}
bool lineUnusedTested(std::uint32_t flags, std::uint16_t count) {
  return lineUnused(flags, count) && isTestedAdjustment(dominantAdjust(flags));
}
bool lineUnusedInspected(std::uint32_t flags, std::uint16_t count) {
  return lineUnused(flags, count) && isInspectedAdjustment(dominantAdjust(flags));
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
    std::uint32_t d = dominantAdjust(flags);
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
