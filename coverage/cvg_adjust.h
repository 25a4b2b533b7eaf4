// Adjustment kinds: the six single-bit marks a source line can carry, their names and order.
#pragma once

#include <cstdint>
#include <string_view>

using CvgAdjust = std::uint32_t;

enum : CvgAdjust {
  adjLineDead = 0x10,
  adjLineTested = 0x20,
  adjLineInspected = 0x40,
  adjRangeDead = 0x100,
  adjRangeTested = 0x200,
  adjRangeInspected = 0x400,
};

// Masks by meaning, and of every kind / of the one-line kinds.
constexpr CvgAdjust adjDeadMask = 0x110;
constexpr CvgAdjust adjTestedMask = 0x220;
constexpr CvgAdjust adjInspectedMask = 0x440;
constexpr CvgAdjust adjAnyMask = 0x770;
constexpr CvgAdjust adjLineMask = 0x70;

// The six kinds in the order in which they take precedence, are iterated and are written.
constexpr CvgAdjust kAdjustOrder[6] = {adjLineDead,  adjLineInspected,  adjLineTested,
                                       adjRangeDead, adjRangeInspected, adjRangeTested};

// "deadcode", "tested", "inspected", or "<invalid CvgAdjust>" for anything but one kind.
const char* cvgAdjustName(CvgAdjust kind);

// Accepts exactly "deadcode", "tested" or "inspected" and gives the one-line kind.
bool parseCvgAdjustName(std::string_view text, CvgAdjust& kind);

// The first kind present in precedence order, or 0 when none is.
CvgAdjust dominantAdjust(std::uint32_t flags);

// What a single kind means; false for 0 and for anything but one of the six kinds.
inline bool isDeadAdjustment(CvgAdjust kind) { return kind == adjLineDead || kind == adjRangeDead; }
inline bool isTestedAdjustment(CvgAdjust kind) {
  return kind == adjLineTested || kind == adjRangeTested;
}
inline bool isInspectedAdjustment(CvgAdjust kind) {
  return kind == adjLineInspected || kind == adjRangeInspected;
}

// "DEAD", "TEST" or "INSP" for the dominant kind of the flags; empty when none.
const char* adjustCode(std::uint32_t flags);

// 'L' for a one-line kind, 'B' for a range kind, '?' otherwise.
char adjustStyleLetter(CvgAdjust kind);
