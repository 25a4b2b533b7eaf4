// Adjustment kinds, line sets and per-file adjustment sets as the summary and the file use them.
#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "coverage/cvg_adjust_set.h"

namespace {

struct KindRun {
  CvgAdjust kind;
  std::uint32_t first, last;
  bool operator==(const KindRun&) const = default;
};

std::vector<KindRun> runsOf(const CvgAdjustSet& set) {
  std::vector<KindRun> runs;
  set.iterateRanges([&](CvgAdjust k, std::uint32_t f, std::uint32_t l) {
    runs.push_back({k, f, l});
    return true;
  });
  return runs;
}

TEST(AdjustKinds, NamesParsingAndPrecedenceFollowTheMarkerWords) {
  EXPECT_STREQ(cvgAdjustName(adjRangeInspected), "inspected");
  EXPECT_STREQ(cvgAdjustName(adjLineDead), "deadcode");
  EXPECT_STREQ(cvgAdjustName(0x30), "<invalid CvgAdjust>");
  CvgAdjust k = 0;
  EXPECT_TRUE(parseCvgAdjustName("tested", k));
  EXPECT_EQ(k, adjLineTested);
  EXPECT_FALSE(parseCvgAdjustName("Tested", k));
  EXPECT_FALSE(parseCvgAdjustName("tested ", k));
  EXPECT_FALSE(parseCvgAdjustName("", k));
  // A one-line tested marker inside a dead-code range is tested, not dead.
  EXPECT_EQ(dominantAdjust(adjRangeDead | adjLineTested), adjLineTested);
  EXPECT_STREQ(adjustCode(adjRangeDead | adjLineTested), "TEST");
  EXPECT_STREQ(adjustCode(adjLineTested | adjLineInspected), "INSP");
  EXPECT_STREQ(adjustCode(adjRangeTested | adjRangeInspected | adjRangeDead), "DEAD");
  EXPECT_STREQ(adjustCode(0x1), "");
  EXPECT_EQ(adjustStyleLetter(adjLineInspected), 'L');
  EXPECT_EQ(adjustStyleLetter(adjRangeTested), 'B');
}

TEST(LineSetGrowth, CapacityDoublesFromTwoThousandLinesAndRunsSpanWords) {
  LineSet s;
  EXPECT_EQ(s.capacity(), 2048u);
  EXPECT_FALSE(s.test(5000));
  EXPECT_TRUE(s.set(5000));
  EXPECT_EQ(s.capacity(), 8192u);
  EXPECT_TRUE(s.setRange(60, 200));
  s.clear(130);
  std::vector<std::pair<std::uint32_t, std::uint32_t>> runs;
  s.forEachRun([&](std::uint32_t f, std::uint32_t l) {
    runs.emplace_back(f, l);
    return true;
  });
  EXPECT_EQ(runs, (std::vector<std::pair<std::uint32_t, std::uint32_t>>{
                      {60, 129}, {131, 200}, {5000, 5000}}));
  EXPECT_FALSE(s.set(0));
}

TEST(LineSetGrowth, TheLargestLineNumberCostsNoMoreThanASmallOne) {
  LineSet s;
  EXPECT_TRUE(s.setRange(4294967280u, 4294967289u));
  EXPECT_EQ(s.capacity(), 4294967296ull);
  EXPECT_TRUE(s.test(4294967289u));
  EXPECT_FALSE(s.test(4294967290u));
  s.clearRange(1, 4294967284u);
  std::vector<std::pair<std::uint32_t, std::uint32_t>> runs;
  s.forEachRun([&](std::uint32_t f, std::uint32_t l) {
    runs.emplace_back(f, l);
    return true;
  });
  EXPECT_EQ(runs, (std::vector<std::pair<std::uint32_t, std::uint32_t>>{{4294967285u, 4294967289u}}));
}

TEST(LineSetGrowth, OverlappingAndTouchingRangesMergeIntoOneRun) {
  LineSet a, b;
  a.setRange(10, 20);
  a.setRange(30, 40);
  a.setRange(21, 29);
  a.set(5);
  a.setRange(1, 4);
  EXPECT_FALSE(a.setRange(9, 6));  // a line set takes its bounds in order
  a.setRange(6, 9);
  for (std::uint32_t l = 40; l >= 1; --l) b.set(l);
  EXPECT_EQ(a, b);
  b.clear(7);
  EXPECT_FALSE(a == b);
  EXPECT_FALSE(b.test(7));
  EXPECT_TRUE(b.test(6));
  EXPECT_TRUE(b.test(8));
  // A set that grew differs from a small one with the same lines.
  LineSet big, small;
  big.set(5000);
  big.clear(5000);
  EXPECT_TRUE(big.empty());
  EXPECT_FALSE(big == small);
}

TEST(LineSetGrowth, ARunReachingTheLastLineOfTheCapacityEndsThere) {
  LineSet s;
  s.setRange(2000, 2047);
  std::vector<std::pair<std::uint32_t, std::uint32_t>> runs;
  s.forEachRun([&](std::uint32_t f, std::uint32_t l) {
    runs.emplace_back(f, l);
    return true;
  });
  ASSERT_EQ(runs.size(), 1u);
  EXPECT_EQ(runs[0], std::make_pair(2000u, 2047u));
}

TEST(AdjustSet, RangesAreOrderedAndIteratedInPrecedenceOrder) {
  CvgAdjustSet set;
  set.addRange(adjRangeTested, 9, 5);
  set.addRange(adjLineDead, 3, 3);
  set.addRange(adjLineDead, 4, 4);
  set.addRange(adjRangeDead, 1, 2);
  set.addRange(adjLineInspected, 12, 12);
  EXPECT_FALSE(set.addRange(0x30, 1, 1));
  EXPECT_EQ(runsOf(set), (std::vector<KindRun>{{adjLineDead, 3, 4},
                                           {adjLineInspected, 12, 12},
                                           {adjRangeDead, 1, 2},
                                           {adjRangeTested, 5, 9}}));
  EXPECT_EQ(set.lineKinds(5), adjRangeTested);
  EXPECT_EQ(set.lineKinds(3), adjLineDead);
  EXPECT_EQ(set.lineKinds(100), 0u);
}

TEST(AdjustSet, IterationStopsAtTheFirstFailingCallback) {
  CvgAdjustSet set;
  set.addRange(adjLineDead, 1, 1);
  set.addRange(adjLineDead, 3, 3);
  set.addRange(adjRangeTested, 7, 8);
  int calls = 0;
  EXPECT_FALSE(set.iterateRanges([&](CvgAdjust, std::uint32_t, std::uint32_t) {
    return ++calls < 2;
  }));
  EXPECT_EQ(calls, 2);
}

TEST(AdjustSet, RemovingPartOfARangeSplitsItAndRemovingBeyondTheCapacityIsHarmless) {
  CvgAdjustSet set;
  set.addRange(adjRangeDead, 10, 20);
  set.removeRange(adjRangeDead, 16, 14);
  set.removeRange(adjRangeDead, 3000, 9000);
  set.removeRange(0x8, 1, 100);
  EXPECT_EQ(runsOf(set), (std::vector<KindRun>{{adjRangeDead, 10, 13}, {adjRangeDead, 17, 20}}));
  set.removeRange(adjRangeDead, 19, 5000);
  EXPECT_EQ(runsOf(set), (std::vector<KindRun>{{adjRangeDead, 10, 13}, {adjRangeDead, 17, 18}}));
}

TEST(AdjustSet, TotalsCountALineMarkedTwiceTwice) {
  CvgAdjustSet set;
  set.addRange(adjRangeDead, 1, 10);
  set.addRange(adjLineDead, 4, 4);
  set.addRange(adjLineTested, 20, 21);
  set.addRange(adjRangeInspected, 30, 30);
  AdjustLineTotals t = set.countLines();
  EXPECT_EQ(t.dead, 11u);
  EXPECT_EQ(t.tested, 2u);
  EXPECT_EQ(t.inspected, 1u);
  AdjustLineTotals none = countAdjustLines(nullptr);
  EXPECT_EQ(none.dead + none.tested + none.inspected, 0u);
}

TEST(AdjustSet, EqualityComparesEveryKindAndCopiesAreIndependent) {
  CvgAdjustSet a;
  a.addRange(adjLineDead, 5, 5);
  CvgAdjustSetPtr b = copyAdjustSet(&a);
  EXPECT_TRUE(adjustSetsEqual(&a, b.get()));
  b->addRange(adjRangeInspected, 5, 5);
  EXPECT_FALSE(adjustSetsEqual(&a, b.get()));
  EXPECT_TRUE(adjustSetsEqual(nullptr, nullptr));
  EXPECT_FALSE(adjustSetsEqual(&a, nullptr));
}

}  // namespace
