// The adjustments of one source file: one line set per adjustment kind.
#pragma once

#include <array>
#include <cstdint>
#include <functional>
#include <memory>

#include "coverage/cvg_adjust.h"
#include "coverage/line_set.h"

struct AdjustLineTotals {
  unsigned long dead = 0;
  unsigned long tested = 0;
  unsigned long inspected = 0;
};

class CvgAdjustSet {
 public:
  CvgAdjustSet() = default;

  // Orders the bounds and marks every line between them with the kind. False when the
  // kind is not one of the six or the range holds only line 0.
  bool addRange(CvgAdjust kind, std::uint32_t first, std::uint32_t last);
  // Orders the bounds and unmarks the lines between them (as far as the set reaches).
  void removeRange(CvgAdjust kind, std::uint32_t first, std::uint32_t last);
  // OR of the kinds that mark the line; 0 when none does.
  std::uint32_t lineKinds(std::uint32_t line) const;
  bool empty() const;

  bool operator==(const CvgAdjustSet& other) const = default;

  // The line set of one kind, or nullptr for a value that is not a kind.
  const LineSet* lineSet(CvgAdjust kind) const;

  // Visits the kinds in precedence order and, within each, the maximal runs in ascending
  // order; stops at the first callback that returns false, and then returns false.
  using RangeFn = std::function<bool(CvgAdjust kind, std::uint32_t first, std::uint32_t last)>;
  bool iterateRanges(const RangeFn& fn) const;

  // Lines per meaning; a line marked by both the line and the range kind counts twice.
  AdjustLineTotals countLines() const;

 private:
  LineSet* lineSetFor(CvgAdjust kind);
  // Order of storage: 0x10, 0x20, 0x40, 0x100, 0x200, 0x400.
  std::array<LineSet, 6> sets_;
};

using CvgAdjustSetPtr = std::unique_ptr<CvgAdjustSet>;

// Totals of an absent set are zero.
AdjustLineTotals countAdjustLines(const CvgAdjustSet* set);
// Two absent sets are equal; an absent and a present one are not.
bool adjustSetsEqual(const CvgAdjustSet* a, const CvgAdjustSet* b);
CvgAdjustSetPtr copyAdjustSet(const CvgAdjustSet* set);
