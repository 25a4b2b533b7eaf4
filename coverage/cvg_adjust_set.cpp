// Adjustment sets: range updates, lookups, ordered iteration and totals.
#include "coverage/cvg_adjust_set.h"

#include <utility>

namespace {
int slotOf(CvgAdjust kind) {
  switch (kind) {
    case adjLineDead: return 0;
    case adjLineTested: return 1;
    case adjLineInspected: return 2;
    case adjRangeDead: return 3;
    case adjRangeTested: return 4;
    case adjRangeInspected: return 5;
    default: return -1;
  }
}
constexpr CvgAdjust kSlotKinds[6] = {adjLineDead,  adjLineTested,  adjLineInspected,
                                     adjRangeDead, adjRangeTested, adjRangeInspected};
}  // namespace

LineSet* CvgAdjustSet::lineSetFor(CvgAdjust kind) {
  int slot = slotOf(kind);
  return slot < 0 ? nullptr : &sets_[slot];
}

const LineSet* CvgAdjustSet::lineSet(CvgAdjust kind) const {
  int slot = slotOf(kind);
  return slot < 0 ? nullptr : &sets_[slot];
}

bool CvgAdjustSet::addRange(CvgAdjust kind, std::uint32_t first, std::uint32_t last) {
  LineSet* s = lineSetFor(kind);
  if (!s) return false;
  if (first > last) std::swap(first, last);
  return s->setRange(first, last);
}

void CvgAdjustSet::removeRange(CvgAdjust kind, std::uint32_t first, std::uint32_t last) {
  LineSet* s = lineSetFor(kind);
  if (!s) return;
  if (first > last) std::swap(first, last);
  s->clearRange(first, last);
}

std::uint32_t CvgAdjustSet::lineKinds(std::uint32_t line) const {
  std::uint32_t kinds = 0;
  for (int i = 0; i < 6; ++i) {
    if (sets_[i].test(line)) kinds |= kSlotKinds[i];
  }
  return kinds;
}

bool CvgAdjustSet::empty() const {
  for (const LineSet& s : sets_) {
    if (!s.empty()) return false;
  }
  return true;
}

bool CvgAdjustSet::iterateRanges(const RangeFn& fn) const {
  for (CvgAdjust kind : kAdjustOrder) {
    const LineSet* s = lineSet(kind);
    bool ok = s->forEachRun([&](std::uint32_t first, std::uint32_t last) {
      return fn(kind, first, last);
    });
    if (!ok) return false;
  }
  return true;
}

AdjustLineTotals CvgAdjustSet::countLines() const {
  AdjustLineTotals t;
  iterateRanges([&](CvgAdjust kind, std::uint32_t first, std::uint32_t last) {
    unsigned long n = static_cast<unsigned long>(last) - first + 1;
    if (kind & adjDeadMask) t.dead += n;
    if (kind & adjTestedMask) t.tested += n;
    if (kind & adjInspectedMask) t.inspected += n;
    return true;
  });
  return t;
}

AdjustLineTotals countAdjustLines(const CvgAdjustSet* set) {
  return set ? set->countLines() : AdjustLineTotals{};
}

bool adjustSetsEqual(const CvgAdjustSet* a, const CvgAdjustSet* b) {
  if (!a || !b) return a == b;
  return *a == *b;
}

CvgAdjustSetPtr copyAdjustSet(const CvgAdjustSet* set) {
  return set ? std::make_unique<CvgAdjustSet>(*set) : nullptr;
}
