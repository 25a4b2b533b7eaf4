// Loading a source file in the annotated source window updates the stored adjustments.
#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "adjust/loaded_source_adjustments.h"

namespace {

TEST(LoadedSource, MarkersInTheTextReplaceTheStoredSetOnlyWhenTheyDiffer) {
  AdjustmentList list;
  std::vector<std::string> lines = {"a; /* kestrel: deadcode */", "/* kestrel: begin tested */",
                                    "b;", "/* kestrel: end */", "c; // kestrel: tested"};
  VectorTextLines text(lines);
  LoadedSourceAdjustments first = applyLoadedSourceMarkers("/s/a.c", text, list, 10);
  EXPECT_TRUE(first.listChanged);
  EXPECT_TRUE(first.warnings.empty());
  EXPECT_EQ(adjustTotalsText(first.totals), "1 deadcode, 4 tested, 0 inspected");
  // Loading the same text again changes nothing, so nothing needs writing.
  LoadedSourceAdjustments again = applyLoadedSourceMarkers("/s/a.c", text, list, 20);
  EXPECT_FALSE(again.listChanged);
  EXPECT_EQ(list.findEntry("/s/a.c")->loadTime(), 10u);
}

TEST(LoadedSource, ATextWithoutMarkersDropsTheFilesEntryAndReportsWarnings) {
  AdjustmentList list;
  auto set = std::make_unique<CvgAdjustSet>();
  set->addRange(adjLineDead, 1, 1);
  list.storeSet(std::move(set), "/s/a.c", 5);
  std::vector<std::string> lines = {"a;", "// kestrel: end"};
  VectorTextLines text(lines);
  LoadedSourceAdjustments r = applyLoadedSourceMarkers("/s/a.c", text, list, 10);
  EXPECT_TRUE(r.listChanged);
  EXPECT_TRUE(list.empty());
  ASSERT_EQ(r.warnings.size(), 1u);
  EXPECT_EQ(adjustTotalsText(r.totals), "0 deadcode, 0 tested, 0 inspected");
  EXPECT_FALSE(applyLoadedSourceMarkers("/s/a.c", text, list, 11).listChanged);
}

}  // namespace
