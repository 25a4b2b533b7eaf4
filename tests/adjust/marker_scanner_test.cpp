// The marker scanner over real source texts: what it records and the warnings it gives.
#include <gtest/gtest.h>

#include <cstdio>
#include <string>
#include <vector>

#include "adjust/marker_scanner.h"
#include "tests/common/test_support.h"

namespace {

struct Scan {
  std::vector<std::string> warnings;
  CvgAdjustSetPtr set;
};

Scan scan(const std::vector<std::string>& lines) {
  Scan s;
  scanLines(lines, s.warnings, s.set);
  return s;
}

std::vector<std::uint32_t> linesOf(const Scan& s, CvgAdjust kind) {
  std::vector<std::uint32_t> out;
  if (!s.set) return out;
  for (std::uint32_t l = 1; l < 100; ++l) {
    if (s.set->lineKinds(l) & kind) out.push_back(l);
  }
  return out;
}

TEST(MarkerGrammar, MarkersWithoutBlankOrWithTabsCountAndLookalikesDoNot) {
  Scan s = scan({
      "int a; // kestrel:deadcode",            // 1: no blank
      "x; /* kestrel:\tbegin\ttested */",      // 2: tabs
      "y; // Kestrel: deadcode",               // 3: capitalised prefix
      "z; // kestrel: dead code",              // 4: keyword in two words
      "w; // kestrel: deadcode-because-legacy",  // 5: text right after the keyword
      "// kestrel: end",                       // 6
      "// kestrel:",                           // 7: prefix at the end of the line
      "// kestrel: begin nothing",             // 8
  });
  EXPECT_TRUE(s.warnings.empty());
  EXPECT_EQ(linesOf(s, adjLineDead), (std::vector<std::uint32_t>{1, 5}));
  EXPECT_EQ(linesOf(s, adjRangeTested), (std::vector<std::uint32_t>{2, 3, 4, 5, 6}));
}

TEST(MarkerGrammar, ATextWithoutMarkersGivesNoSetAndNoWarnings) {
  Scan s = scan({"int main() {", "", "  return 0; // kestrel", "}"});
  EXPECT_EQ(s.set, nullptr);
  EXPECT_TRUE(s.warnings.empty());
}

TEST(MarkerWarnings, TwoOneLineMarkersOnALineWarnForTheSecondAndKeepBoth) {
  Scan s = scan({"a", "b; // kestrel: tested kestrel: inspected kestrel: begin deadcode",
                 "c; // kestrel: end"});
  ASSERT_EQ(s.warnings.size(), 1u);
  EXPECT_EQ(s.warnings[0],
            "Warning: line 2: 'kestrel: inspected' is on\n     the same line as another "
            "adjustment directive");
  EXPECT_EQ(s.set->lineKinds(2), adjLineTested | adjLineInspected | adjRangeDead);
  EXPECT_EQ(s.set->lineKinds(3), adjRangeDead);
}

TEST(MarkerWarnings, OverlappingRangesWarnAndOneEndTerminatesBoth) {
  std::vector<std::string> text(9, "code;");
  text[2] = "/* kestrel: begin deadcode */";
  text[4] = "/* kestrel: begin tested */";
  text[8] = "/* kestrel: end */";
  Scan s = scan(text);
  ASSERT_EQ(s.warnings.size(), 2u);
  EXPECT_EQ(s.warnings[0],
            "Warning: line 5: 'kestrel: begin tested' overlaps\n     with 'kestrel: begin "
            "deadcode' from line 3");
  EXPECT_EQ(s.warnings[1],
            "Warning: line 9: 'kestrel: end' terminates \n         'kestrel: begin deadcode' "
            "from line 3\n     and 'kestrel: begin tested' from line 5");
  EXPECT_EQ(linesOf(s, adjRangeDead), (std::vector<std::uint32_t>{3, 4, 5, 6, 7, 8, 9}));
  EXPECT_EQ(linesOf(s, adjRangeTested), (std::vector<std::uint32_t>{5, 6, 7, 8, 9}));
}

TEST(MarkerWarnings, ABeginOfAnOpenKindWarnsAboutItselfAndTheFirstBeginStays) {
  Scan s = scan({"// kestrel: begin inspected", "x", "// kestrel: begin inspected",
                 "// kestrel: end"});
  ASSERT_EQ(s.warnings.size(), 1u);
  EXPECT_EQ(s.warnings[0],
            "Warning: line 3: 'kestrel: begin inspected' overlaps\n     with 'kestrel: begin "
            "inspected' from line 1");
  EXPECT_EQ(linesOf(s, adjRangeInspected), (std::vector<std::uint32_t>{1, 2, 3, 4}));
}

TEST(MarkerWarnings, ABeginOnTheLineOfAnEndWarnsAboutTheRangeThatLineClosed) {
  Scan s = scan({"// kestrel: begin deadcode", "// kestrel: end kestrel: begin tested", "y",
                 "// kestrel: end"});
  ASSERT_EQ(s.warnings.size(), 1u);
  EXPECT_EQ(s.warnings[0],
            "Warning: line 2: 'kestrel: begin tested' overlaps\n     with 'kestrel: begin "
            "deadcode' from line 1");
  EXPECT_EQ(linesOf(s, adjRangeDead), (std::vector<std::uint32_t>{1, 2}));
  EXPECT_EQ(linesOf(s, adjRangeTested), (std::vector<std::uint32_t>{2, 3, 4}));
}

TEST(MarkerWarnings, AnEndWithNothingOpenWarnsButAnImplicitOneDoesNot) {
  Scan s = scan({"x", "// kestrel: end"});
  ASSERT_EQ(s.warnings.size(), 1u);
  EXPECT_EQ(s.warnings[0], "Warning: line 2: 'kestrel: end' with no matching 'kestrel: begin'");
  EXPECT_EQ(s.set, nullptr);
}

TEST(MarkerWarnings, AnUnterminatedRangeRunsToTheLastLineWithOneWarning) {
  std::vector<std::string> text(7, "x");
  text[6] = "// kestrel: begin tested";
  Scan s = scan(text);
  ASSERT_EQ(s.warnings.size(), 1u);
  EXPECT_EQ(s.warnings[0],
            "Warning: line 7: 'kestrel: begin tested' at line 7\n     has no matching "
            "'kestrel: end' -- treating line 7 as the end");
  EXPECT_EQ(linesOf(s, adjRangeTested), (std::vector<std::uint32_t>{7}));
}

TEST(MarkerWarnings, ThreeUnterminatedRangesGiveThreeWarningsAndAnImplicitSummary) {
  Scan s = scan({"// kestrel: begin tested", "// kestrel: begin deadcode",
                 "// kestrel: begin inspected", "", "x"});
  ASSERT_EQ(s.warnings.size(), 3u + 3u + 1u);  // overlaps on lines 2 and 3, then the end
  EXPECT_EQ(s.warnings[3],
            "Warning: line 5: 'kestrel: begin deadcode' at line 2\n     has no matching "
            "'kestrel: end' -- treating line 5 as the end");
  EXPECT_EQ(s.warnings[4],
            "Warning: line 5: 'kestrel: begin inspected' at line 3\n     has no matching "
            "'kestrel: end' -- treating line 5 as the end");
  EXPECT_EQ(s.warnings[5],
            "Warning: line 5: 'kestrel: begin tested' at line 1\n     has no matching "
            "'kestrel: end' -- treating line 5 as the end");
  EXPECT_EQ(s.warnings[6],
            "Warning: line 5: implicit 'kestrel: end' terminates \n         'kestrel: begin "
            "deadcode' from line 2,\n         'kestrel: begin inspected' from line 3,\n     "
            "and 'kestrel: begin tested' from line 1");
}

TEST(MarkerWarnings, InspectedAndTestedClosedTogetherNameBoth) {
  Scan s = scan({"// kestrel: begin tested", "// kestrel: begin inspected", "// kestrel: end"});
  ASSERT_EQ(s.warnings.size(), 2u);
  EXPECT_EQ(s.warnings[1],
            "Warning: line 3: 'kestrel: end' terminates \n         'kestrel: begin inspected' "
            "from line 2\n     and 'kestrel: begin tested' from line 1");
}

TEST(MarkerScanFile, AFinalLineWithoutNewlineAndEmptyLinesCount) {
  kgtest::TempDir dir;
  std::string path = dir.file("a.c");
  kgtest::writeFile(path, "x\n\n\r\n// kestrel: begin deadcode\n\nint y; // kestrel: tested");
  FILE* f = fopen(path.c_str(), "r");
  ASSERT_NE(f, nullptr);
  std::vector<std::string> warnings;
  CvgAdjustSetPtr set;
  markerScanner().scanFile(f, warnings, set);
  fclose(f);
  EXPECT_EQ(markerScanner().lineNumber(), 6u);
  ASSERT_EQ(warnings.size(), 1u);
  EXPECT_NE(warnings[0].find("line 6: 'kestrel: begin deadcode' at line 4"), std::string::npos);
  ASSERT_NE(set, nullptr);
  EXPECT_EQ(set->lineKinds(6), adjRangeDead | adjLineTested);
  EXPECT_EQ(set->lineKinds(3), 0u);
}

TEST(MarkerScanFile, AVeryLongLineIsScannedWhole) {
  std::string line(100000, 'x');
  line += " kestrel: inspected";
  Scan s = scan({line});
  ASSERT_NE(s.set, nullptr);
  EXPECT_EQ(s.set->lineKinds(1), adjLineInspected);
}

}  // namespace
