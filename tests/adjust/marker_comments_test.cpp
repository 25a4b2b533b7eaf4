// Marker comments the annotated source window writes and removes in a text.
#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "adjust/adjust_settings.h"
#include "adjust/marker_comments.h"
#include "adjust/marker_scanner.h"

namespace {

AdjustSettings hashComments() {
  AdjustSettings s;
  s.adjustmentCommentFormat = " # %s";
  s.adjustmentDisableString = "-off";
  return s;
}

AdjustSettings keepEverything() {
  AdjustSettings s;
  s.deleteGUIAdjustments = false;
  s.invalidateUserAdjustments = false;
  return s;
}

struct ProviderGuard {
  explicit ProviderGuard(AdjustSettingsProvider p) { setAdjustSettingsProvider(p); }
  ~ProviderGuard() { setAdjustSettingsProvider(nullptr); }
};

TEST(MarkerComments, CommentTextsFollowTheFormatResource) {
  EXPECT_EQ(adjustmentCommentText(adjRangeDead), " /* kestrel: deadcode */");
  EXPECT_EQ(adjustmentCommentText(adjLineTested), " /* kestrel: tested */");
  EXPECT_EQ(adjustmentCommentText(adjLineInspected), " /* kestrel: inspected */");
  ProviderGuard g(hashComments);
  EXPECT_EQ(adjustmentCommentText(adjLineTested), " # kestrel: tested");
}

TEST(MarkerComments, AHostileFormatIsFilledInLiterally) {
  EXPECT_EQ(formatWithString("%s %s %n %d 100%%", "kestrel: tested"),
            "kestrel: tested %s %n %d 100%");
}

TEST(MarkerComments, AddingThenClearingLeavesTheOriginalLines) {
  std::vector<std::string> lines = {"int a;", "int b;", "int c;"};
  VectorTextLines text(lines);
  addMarker(text, adjLineDead, 1, 2);
  addMarker(text, adjLineTested, 2, 2);
  EXPECT_EQ(lines[1], "int b; /* kestrel: deadcode */ /* kestrel: tested */");
  clearMarkers(text, 1, 3);
  EXPECT_EQ(lines, (std::vector<std::string>{"int a;", "int b;", "int c;"}));
}

TEST(MarkerComments, HandWrittenOneLineMarkersAreDisabledAndRangesKept) {
  std::vector<std::string> lines = {
      "x; // kestrel: deadcode and kestrel: tested",
      "/* kestrel: begin deadcode */ /* kestrel: end */",
      "y; // kestrel: NOT inspected; kestrel:",
      "z; // kestrel:tested",
  };
  VectorTextLines text(lines);
  clearMarkers(text, 1, 4);
  EXPECT_EQ(lines[0], "x; // kestrel: NOT deadcode and kestrel: NOT tested");
  EXPECT_EQ(lines[1], "/* kestrel: begin deadcode */ /* kestrel: end */");
  EXPECT_EQ(lines[2], "y; // kestrel: NOT inspected; kestrel:");
  EXPECT_EQ(lines[3], "z; // kestrel: NOTtested");
  // Rescanning finds none of the one-line markers any more, but the range is still there.
  std::vector<std::string> warnings;
  CvgAdjustSetPtr set;
  scanLines(lines, warnings, set);
  ASSERT_NE(set, nullptr);
  EXPECT_EQ(set->lineKinds(1), 0u);
  EXPECT_EQ(set->lineKinds(2), adjRangeDead);
  EXPECT_EQ(set->lineKinds(4), 0u);
}

TEST(MarkerComments, BothCleaningStepsCanBeSwitchedOff) {
  ProviderGuard g(keepEverything);
  std::vector<std::string> lines = {"a; /* kestrel: deadcode */"};
  VectorTextLines text(lines);
  clearMarkers(text, 1, 1);
  EXPECT_EQ(lines[0], "a; /* kestrel: deadcode */");
}

TEST(MarkerComments, EditingALineReplacesItsMarkerInTextAndSet) {
  std::vector<std::string> lines = {"a;", "b; /* kestrel: deadcode */", "c;"};
  VectorTextLines text(lines);
  CvgAdjustSet set;
  set.addRange(adjLineDead, 2, 2);
  set.addRange(adjRangeTested, 1, 3);
  editAdjustmentLine(text, 2, adjLineInspected, set);
  EXPECT_EQ(lines[1], "b; /* kestrel: inspected */");
  EXPECT_EQ(set.lineKinds(2), adjLineInspected | adjRangeTested);
  editAdjustmentLine(text, 2, 0, set);
  EXPECT_EQ(lines[1], "b;");
  EXPECT_EQ(set.lineKinds(2), adjRangeTested);
  // The text and the set agree: a rescan of the edited text finds the same one-line kinds.
  editAdjustmentLine(text, 3, adjLineTested, set);
  std::vector<std::string> warnings;
  CvgAdjustSetPtr rescanned;
  scanLines(lines, warnings, rescanned);
  ASSERT_NE(rescanned, nullptr);
  EXPECT_EQ(rescanned->lineKinds(3), adjLineTested);
}

}  // namespace
