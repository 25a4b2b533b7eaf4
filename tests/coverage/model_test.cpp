// The small shared pieces of the data model: string tables, line predicates, count texts
// and count arithmetic.
#include <gtest/gtest.h>

#include <cstring>

#include "coverage/kgv_data.h"
#include "coverage/line_state.h"
#include "coverage/string_block.h"

TEST(StringTable, FreezingSortsAndDropsDuplicates) {
  StringBlock b;
  ASSERT_EQ(b.add("b/"), allOK);
  ASSERT_EQ(b.add("a/"), allOK);
  ASSERT_EQ(b.add("b/"), allOK);
  std::uint32_t off = 0, pos = 0;
  EXPECT_EQ(b.find("a/", off, pos), blockMelted);  // not searchable while open

  std::vector<char> area;
  std::uint32_t count = 0, words = 0;
  ASSERT_EQ(b.freeze(area, count, words), allOK);
  EXPECT_EQ(count, 2u);
  EXPECT_EQ(words, 2u);
  ASSERT_EQ(area.size(), 8u);
  EXPECT_EQ(std::memcmp(area.data(), "a/\0b/\0\0\0", 8), 0);
  ASSERT_EQ(b.find("b/", off, pos), allOK);
  EXPECT_EQ(off, 3u);
  EXPECT_EQ(pos, 1u);
  ASSERT_EQ(b.find("a/", off, pos), allOK);
  EXPECT_EQ(off, 0u);
  EXPECT_EQ(b.find("c/", off, pos), stringNotInBlk);

  // Frozen means frozen: no more strings, no second freeze.
  EXPECT_EQ(b.add("c/"), blockFroze);
  EXPECT_EQ(b.freeze(area, count, words), blockFroze);
}

TEST(StringTable, AnEmptyTableCannotBeFrozen) {
  StringBlock b;
  std::vector<char> area;
  std::uint32_t count = 0, words = 0;
  EXPECT_EQ(b.freeze(area, count, words), blockEmpty);
}

TEST(LineStates, OneLineMarkersDominateRanges) {
  // A tested one-line marker inside a dead-code range: the line is tested, not dead.
  std::uint32_t flags = LineHasCode | adjLineTested | adjRangeDead;
  EXPECT_EQ(dominantAdjust(flags), adjLineTested);
  EXPECT_TRUE(lineUnusedTested(flags, 0));
  EXPECT_FALSE(lineUnusedDead(flags, 0));
  EXPECT_TRUE(lineAdjustedUsed(flags, 0));
  EXPECT_EQ(dominantAdjust(adjLineTested | adjLineInspected), adjLineInspected);
  EXPECT_EQ(dominantAdjust(adjRangeTested | adjRangeInspected), adjRangeInspected);
  EXPECT_EQ(dominantAdjust(adjLineDead | adjLineInspected), adjLineDead);
  EXPECT_EQ(dominantAdjust(LineHasCode), 0u);
}

TEST(LineStates, DeadCodeLeavesAdjustedCoverageOnlyWhileUnused) {
  std::uint32_t dead = LineHasCode | adjRangeDead;
  EXPECT_FALSE(lineCountsForAdjusted(dead, 0));
  EXPECT_FALSE(lineAdjustedUnused(dead, 0));
  EXPECT_TRUE(lineUnusedDead(dead, 0));
  EXPECT_TRUE(lineCountsForAdjusted(dead, 3));
  EXPECT_TRUE(lineAdjustedUsed(dead, 3));
  EXPECT_TRUE(lineMarkedNotUnused(dead, 3));
  EXPECT_FALSE(lineMarkedNotUnused(dead, 0));

  std::uint32_t plain = LineHasCode;
  EXPECT_TRUE(lineAdjustedUnused(plain, 0));
  EXPECT_TRUE(lineUnused(plain, 0));
  EXPECT_FALSE(lineUsed(0, 5));  // without code nothing is used
  EXPECT_FALSE(lineCountsForAdjusted(adjLineTested, 0));
}

TEST(LineStates, CountTexts) {
  EXPECT_STREQ(countText(true, 0, 12), "");  // no code: empty even with a count
  EXPECT_STREQ(countText(false, LineHasCode, 10000), "10K+");
  EXPECT_STREQ(exportCountText(false, LineHasCode, 10000), "10000");
  EXPECT_STREQ(exportCountText(false, LineHasCode, 65535), "10000");
  EXPECT_STREQ(exportCountText(false, LineHasCode, 9999), "9999");
  EXPECT_STREQ(countText(false, LineHasCode, 7), "7");
  EXPECT_STREQ(countText(true, LineHasCode | adjLineDead, 0), "DEAD");
  EXPECT_STREQ(countText(true, LineHasCode | adjRangeTested, 0), "TEST");
  EXPECT_STREQ(countText(true, LineHasCode | adjLineInspected, 0), "INSP");
  EXPECT_STREQ(countText(false, LineHasCode | adjLineDead, 0), "0");
  EXPECT_STREQ(countText(true, LineHasCode | adjLineDead, 2), "2");
}

TEST(CountArithmetic, CountsSaturateAndFlagsStayFlags) {
  EXPECT_EQ(combineCounts(9000, 2000, false), 10000);
  EXPECT_EQ(combineCounts(65535, 65535, false), 10000);
  EXPECT_EQ(combineCounts(3, 4, false), 7);
  EXPECT_EQ(combineCounts(1, 1, true), 1);
  EXPECT_EQ(combineCounts(0, 7, true), 1);
  EXPECT_EQ(combineCounts(0, 0, true), 0);
}

TEST(CountArithmetic, VersionsAndAges) {
  ObjRecord a, b;
  a.objHeader.signature = b.objHeader.signature = 7;
  a.map.resize(3);
  b.map.resize(3);
  EXPECT_TRUE(sameVersion(a, b));
  b.map.resize(4);
  EXPECT_FALSE(sameVersion(a, b));
  b.map.resize(3);
  a.objHeader.signature = b.objHeader.signature = 0;  // unknown versions never match
  EXPECT_FALSE(sameVersion(a, b));

  a.objHeader.buildTime = 5;
  b.objHeader.buildTime = 4;
  b.objHeader.lastTime = 100;
  EXPECT_TRUE(isNewer(a, b));
  b.objHeader.buildTime = 5;
  EXPECT_TRUE(isNewer(b, a));  // equal builds: the later collection wins
  a.objHeader.lastTime = 100;
  a.objHeader.firstTime = 3;
  EXPECT_TRUE(isNewer(a, b));
  EXPECT_FALSE(isNewer(a, a));
}
