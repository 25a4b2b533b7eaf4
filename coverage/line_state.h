// The state of one source line (flags, hits, classes), its predicates, the dominant
// adjustment rule and the count texts of the annotated source and of exports.
#pragma once

#include <cstdint>

#include "coverage/cvg_adjust.h"

constexpr std::uint32_t LineHasCode = 0x1;    // some block lies on the line
constexpr std::uint32_t LineFuncStart = 0x2;  // a function begins here
constexpr std::uint32_t LineFuncEnd = 0x4;    // the last line of a function's data
// Bits 0x10 to 0x400 carry the line's adjustment kinds (CvgAdjust, adjAnyMask).

enum LineClass : std::uint32_t {
  ClassNothing = 1,
  ClassUsed = 2,
  ClassBetweenUsed = 3,
  ClassUnused = 4,
  ClassBetweenUnused = 5,
};

struct LineState {
  std::uint32_t flags = 0;
  std::uint16_t count = 0;
  std::uint32_t actualClass = 0;
  std::uint32_t adjustedClass = 0;
};

bool lineHasCode(std::uint32_t flags);
bool lineUsed(std::uint32_t flags, std::uint16_t count);
bool lineUnused(std::uint32_t flags, std::uint16_t count);
bool lineCountsForAdjusted(std::uint32_t flags, std::uint16_t count);
bool lineAdjustedUsed(std::uint32_t flags, std::uint16_t count);
bool lineAdjustedUnused(std::uint32_t flags, std::uint16_t count);
bool lineMarkedNotUnused(std::uint32_t flags, std::uint16_t count);
bool lineUnusedDead(std::uint32_t flags, std::uint16_t count);
bool lineUnusedTested(std::uint32_t flags, std::uint16_t count);
bool lineUnusedInspected(std::uint32_t flags, std::uint16_t count);

// The count column of the annotated source: "" without code, "10K+" from 10000, the count,
// or for a zero count "DEAD"/"TEST"/"INSP" when adjustments are shown, else "0". The text
// stays valid until the next call.
const char* countText(bool showAdjustments, std::uint32_t flags, std::uint16_t count);
// The export form: "10000" for every count above 9999, else as countText.
const char* exportCountText(bool showAdjustments, std::uint32_t flags, std::uint16_t count);
