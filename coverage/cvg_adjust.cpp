// Names, parsing and precedence of the adjustment kinds.
#include "coverage/cvg_adjust.h"

const char* cvgAdjustName(CvgAdjust kind) {
  switch (kind) {
    case adjLineDead:
    case adjRangeDead:
      return "deadcode";
    case adjLineTested:
    case adjRangeTested:
      return "tested";
    case adjLineInspected:
    case adjRangeInspected:
      return "inspected";
    default:
      return "<invalid CvgAdjust>";
  }
}

bool parseCvgAdjustName(std::string_view text, CvgAdjust& kind) {
  if (text == "deadcode") {
    kind = adjLineDead;
  } else if (text == "tested") {
    kind = adjLineTested;
  } else if (text == "inspected") {
    kind = adjLineInspected;
  } else {
    return false;
  }
  return true;
}

CvgAdjust dominantAdjust(std::uint32_t flags) {
  for (CvgAdjust k : kAdjustOrder) {
    if (flags & k) return k;
  }
  return 0;
}

const char* adjustCode(std::uint32_t flags) {
  CvgAdjust k = dominantAdjust(flags);
  if (k & adjDeadMask) return "DEAD";
  if (k & adjTestedMask) return "TEST";
  if (k & adjInspectedMask) return "INSP";
  return "";
}

char adjustStyleLetter(CvgAdjust kind) {
  if (kind & adjLineMask) return (kind & (kind - 1)) == 0 ? 'L' : '?';
  if (kind & (adjAnyMask & ~adjLineMask)) return (kind & (kind - 1)) == 0 ? 'B' : '?';
  return '?';
}
