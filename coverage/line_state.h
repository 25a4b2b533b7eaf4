// The state of one source line (flags, hits, classes), its predicates, the dominant
// adjustment rule and the count texts of the annotated source and of exports.
#pragma once

#include <cstdint>

constexpr std::uint32_t LineHasCode = 0x1;    // some block lies on the line
constexpr std::uint32_t LineFuncStart = 0x2;  // a function begins here
constexpr std::uint32_t LineFuncEnd = 0x4;    // the last line of a function's data

// Adjustment kinds carried in a line's flags: one-line markers and ranges.
constexpr std::uint32_t AdjDeadLine = 0x10;
constexpr std::uint32_t AdjTestedLine = 0x20;
constexpr std::uint32_t AdjInspectedLine = 0x40;
constexpr std::uint32_t AdjDeadRange = 0x100;
constexpr std::uint32_t AdjTestedRange = 0x200;
constexpr std::uint32_t AdjInspectedRange = 0x400;
constexpr std::uint32_t kAdjustMask = 0x770;

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

// The first present of 0x10, 0x40, 0x20, 0x100, 0x400, 0x200; 0 when none.
std::uint32_t dominantAdjustment(std::uint32_t flags);
bool isDeadAdjustment(std::uint32_t kind);
bool isTestedAdjustment(std::uint32_t kind);
bool isInspectedAdjustment(std::uint32_t kind);

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
