// Reading preferences from a user's resources: kinds, ranges, words, defaults and the table.
#include <gtest/gtest.h>

#include <cstring>
#include <set>

#include "coverage/sort_orders.h"
#include "settings/resource_converters.h"
#include "settings/resource_table.h"
#include "settings_test_util.h"

using kgtest::settingsFrom;
using kgtest::TextDatabase;
using kgtest::written;

TEST(ResourceTable, EveryResourceIsRegisteredOnceInTableOrder) {
  TextDatabase d("");
  KG_Settings& s = settingsFrom(d);
  const auto& reg = registeredResources();
  ASSERT_EQ(reg.size(), kSettingsResourceCount);
  std::set<std::string> names;
  for (KG_Resource* r : reg) names.insert(r->name());
  EXPECT_EQ(names.size(), kSettingsResourceCount);
  // Landmarks of the order: first, the texts between the update command and the adjustment
  // switches, the cursor, the column switches, and the newer resources after the classic
  // table.
  EXPECT_STREQ(reg.front()->name(), "directoryNames");
  EXPECT_EQ(reg[46], &s.xdefaultsUpdateCommandString);
  EXPECT_STREQ(reg[47]->name(), "actualCoverageShown");
  EXPECT_STREQ(reg[84]->name(), "usedFunctionText");
  EXPECT_EQ(reg[85], &s.deleteGUIAdjustments);
  EXPECT_EQ(reg[88], &s.adjustEditCursor);
  EXPECT_STREQ(reg[101]->name(), "showNumberOfDirectories");
  EXPECT_STREQ(reg[135]->name(), "showBlocksTotal");
  EXPECT_EQ(reg.back(), &s.helpBrowserCommand);
  EXPECT_EQ(findResource("summaryLines"), &s.summaryLines);
  EXPECT_EQ(findResource("noSuchSetting"), nullptr);
  EXPECT_EQ(s.summaryLines.fullName, "Kestrelgauge*summaryLines");
}

TEST(ResourceTable, RebuildingReplacesTheTableWithoutLeavingStaleEntries) {
  TextDatabase a("*summaryLines: 40\n");
  settingsFrom(a);
  TextDatabase b("*summaryLines: 50\n");
  KG_Settings& s = settingsFrom(b);
  EXPECT_EQ(registeredResources().size(), kSettingsResourceCount);
  EXPECT_EQ(s.summaryLines.value, 50);
  {
    KG_BoolResource extra(b.source(), "extraSwitch", true, false);
    EXPECT_EQ(registeredResources().back(), &extra);
  }
  EXPECT_EQ(registeredResources().size(), kSettingsResourceCount);
}

TEST(ResourceTable, WithoutAnyResourcesEveryDefaultHolds) {
  TextDatabase d("");
  KG_Settings& s = settingsFrom(d);
  EXPECT_EQ(s.directoryNames.value, 1);
  EXPECT_EQ(s.coverageChangesOption.value, 4);
  EXPECT_EQ(s.longDirectoryNames.value, 2);
  EXPECT_EQ(s.longFileNames.value, 1);
  EXPECT_EQ(s.nameColumnWidth.value, 32);
  EXPECT_EQ(s.sortCriterion.value, 11);
  EXPECT_EQ(s.outlineDataColumnSeparators.value, 2);
  EXPECT_EQ(s.outlineHeaderColumnSeparators.value, 1);
  EXPECT_EQ(s.summaryLines.value, 30);
  EXPECT_EQ(s.adjustmentCommentFormat.value, " /* %s */");
  EXPECT_EQ(s.adjustmentDisableString.value, " NOT");
  EXPECT_EQ(s.adjustmentExtractWarnThreshold.value, 50);
  EXPECT_EQ(s.crmsCommandString.value, "");
  EXPECT_EQ(s.usedLineForeground.value, "reverse");
  EXPECT_EQ(s.deadcodeLineBackground.value, "reverse");
  EXPECT_EQ(s.filePollRetryInterval.value, 6);
  EXPECT_EQ(s.filePollPauseInterval.value, 3);
  EXPECT_EQ(s.xdefaultsUpdateCommandString.value, "quor_invoke_xdef_edit");
  EXPECT_EQ(s.fileNotFoundPrompt.value, "Can't find source file \"%s\".  New name:");
  EXPECT_EQ(s.lineNumberPaneTitle.value, " Line");
  EXPECT_EQ(s.coverageActualPrompt.value, "(Actual coverage) ");
  EXPECT_EQ(s.annotatedSourceWindowMinWidth.value, 400);
  EXPECT_EQ(s.viewerWindowMinWidth.value, 300);
  EXPECT_EQ(s.viewerWindowMinHeight.value, 200);
  EXPECT_TRUE(s.highlightUnusedLines.value);
  EXPECT_FALSE(s.highlightUsedLines.value);
  EXPECT_TRUE(s.showNumberOfRuns.value);
  EXPECT_FALSE(s.showNumberOfDirectories.value);
  EXPECT_FALSE(s.saveMergedDataAtExit.value);
  EXPECT_FALSE(s.adjustEditCursor.value.empty());
  for (KG_Resource* r : registeredResources()) EXPECT_FALSE(r->found) << r->name();
  EXPECT_TRUE(d.warnings.empty());
}

TEST(RangeResources, OutOfRangeValuesAreClampedNeverRejected) {
  TextDatabase big("Kestrelgauge*summaryLines: 500\n*nameColumnWidth: 99999999999999\n");
  KG_Settings& s = settingsFrom(big);
  EXPECT_EQ(s.summaryLines.value, 100);
  EXPECT_TRUE(s.summaryLines.found);
  EXPECT_EQ(s.nameColumnWidth.value, 200);

  TextDatabase small("Kestrelgauge*summaryLines: 5\n*filePollPauseInterval: -7\n");
  KG_Settings& t = settingsFrom(small);
  EXPECT_EQ(t.summaryLines.value, 10);
  EXPECT_EQ(t.filePollPauseInterval.value, 1);

  // A GUI change is clamped the same way.
  t.summaryLines.setValue(1000);
  EXPECT_EQ(t.summaryLines.value, 100);
  t.summaryLines.setValue(42);
  EXPECT_EQ(t.summaryLines.value, 42);
}

TEST(RangeResources, AValueThatIsNoNumberKeepsTheDefaultAndIsReported) {
  TextDatabase d("*summaryLines: lots\n*adjustmentExtractWarnThreshold: 12abc\n*viewerWindowMinWidth:  640  \n");
  KG_Settings& s = settingsFrom(d);
  EXPECT_EQ(s.summaryLines.value, 30);
  EXPECT_EQ(s.adjustmentExtractWarnThreshold.value, 50);
  EXPECT_EQ(s.viewerWindowMinWidth.value, 640);
  ASSERT_EQ(d.warnings.size(), 2u);
  EXPECT_NE(d.warnings[0].find("\"lots\""), std::string::npos);
  EXPECT_NE(d.warnings[0].find("Kestrelgauge*summaryLines"), std::string::npos);
}

TEST(EnumeratedResources, WordsAreReadAndWrittenBack) {
  TextDatabase d(
      "*coverageChangesOption: reload\n*outlineDataColumnSeparators: all\n"
      "*directoryNames: rightmost\n*longFunctionNames: Rightmost\n*sortCriterion: b_unused%\n");
  KG_Settings& s = settingsFrom(d);
  EXPECT_EQ(s.coverageChangesOption.value, 3);
  EXPECT_EQ(written(s.coverageChangesOption), "Kestrelgauge*coverageChangesOption: reload\n");
  EXPECT_EQ(s.outlineDataColumnSeparators.value, 3);
  EXPECT_EQ(written(s.outlineDataColumnSeparators), "Kestrelgauge*outlineDataColumnSeparators: all\n");
  EXPECT_EQ(s.directoryNames.value, 2);
  EXPECT_EQ(s.longFunctionNames.value, 2);
  EXPECT_EQ(s.sortCriterion.value, 17);
  EXPECT_EQ(written(s.sortCriterion), "Kestrelgauge*sortCriterion: b_unused%\n");
  EXPECT_TRUE(d.warnings.empty());

  // The automatic reload of a running session is saved as a question for the next one.
  s.coverageChangesOption.set(KG_FileUpdateResource::automaticReload);
  EXPECT_EQ(written(s.coverageChangesOption), "Kestrelgauge*coverageChangesOption: prompt\n");
  s.coverageChangesOption.set(KG_FileUpdateResource::ignore);
  EXPECT_EQ(written(s.coverageChangesOption), "Kestrelgauge*coverageChangesOption: ignore\n");
  s.outlineDataColumnSeparators.setValue(9);
  EXPECT_EQ(written(s.outlineDataColumnSeparators), "Kestrelgauge*outlineDataColumnSeparators: <invalid>\n");
  s.directoryNames.setValue(7);
  EXPECT_EQ(written(s.directoryNames), "Kestrelgauge*directoryNames: whole\n");
}

TEST(EnumeratedResources, AnUnknownWordKeepsTheDefault) {
  TextDatabase d("*coverageChangesOption: sometimes\n*outlineHeaderColumnSeparators: stripes\n");
  KG_Settings& s = settingsFrom(d);
  EXPECT_EQ(s.coverageChangesOption.value, 4);
  EXPECT_EQ(s.outlineHeaderColumnSeparators.value, 1);
  EXPECT_EQ(d.warnings.size(), 2u);
}

TEST(EnumeratedResources, AnUnknownSortCriterionGivesTheDefaultOrderAndError42) {
  TextDatabase d("*sortCriterion: biggest\n");
  KG_Settings& s = settingsFrom(d);
  EXPECT_EQ(s.sortCriterion.value, 11);
  ASSERT_EQ(d.warnings.size(), 1u);
  EXPECT_NE(d.warnings[0].find(errorText(invalidSortingOrder)), std::string::npos);

  int id = 0;
  EXPECT_EQ(sortCriterionFromWord("", id), invalidSortingOrder);
  EXPECT_EQ(id, 11);
  // Every word names its own id, and the id gives the word back.
  for (int i = 1; i <= kSortCriterionCount; ++i) {
    ASSERT_NE(sortCriterionWord(i), nullptr);
    EXPECT_EQ(sortCriterionFromWord(sortCriterionWord(i), id), allOK);
    EXPECT_EQ(id, i);
  }
  EXPECT_STREQ(sortCriterionWord(1), "alpha");
  EXPECT_STREQ(sortCriterionWord(8), "adj_lines");
  EXPECT_STREQ(sortCriterionWord(16), "b_unused");
  EXPECT_EQ(sortCriterionWord(0), nullptr);
  EXPECT_EQ(sortCriterionWord(18), nullptr);
}

TEST(EnumeratedResources, SortCriterionWordsAreTheNamesOfTheSortOrders) {
  // The preference and the -sort option name the same orders by the same ids.
  for (const SortOrderInfo& o : sortOrderTable()) {
    ASSERT_NE(sortCriterionWord(static_cast<int>(o.id)), nullptr) << o.id;
    EXPECT_STREQ(sortCriterionWord(static_cast<int>(o.id)), o.name);
  }
  EXPECT_EQ(sortOrderTable().size(), static_cast<size_t>(kSortCriterionCount));
  EXPECT_EQ(kDefaultSortOrder, static_cast<std::uint32_t>(kDefaultSortCriterion));
}

TEST(BooleanResources, TheUsualSpellingsAreAccepted) {
  TextDatabase d(
      "*showCounts: off\n*showToolbar: No\n*highlightUsedLines: yes\n*highlightTestedLines: 1\n"
      "*showLineNumbers: maybe\n*hideDeadcodeCounts: TRUE  \n");
  KG_Settings& s = settingsFrom(d);
  EXPECT_FALSE(s.showCounts.value);
  EXPECT_FALSE(s.showToolbar.value);
  EXPECT_TRUE(s.highlightUsedLines.value);
  EXPECT_TRUE(s.highlightTestedLines.value);
  EXPECT_TRUE(s.showLineNumbers.value);  // rejected: the default stays
  EXPECT_TRUE(s.hideDeadcodeCounts.value);
  EXPECT_EQ(d.warnings.size(), 1u);
  s.showCounts = true;
  EXPECT_EQ(written(s.showCounts), "Kestrelgauge*showCounts: true\n");
}

TEST(HighlightResources, ReverseAndDefaultAreRecognisedInAnySpelling) {
  for (const char* v : {"Reverse", "re-verse", "REVERSE", "re_Verse"}) {
    TextDatabase d(std::string("*usedLineForeground: ") + v + "\n");
    EXPECT_EQ(settingsFrom(d).usedLineForeground.value, "reverse") << v;
  }
  TextDatabase d("*unusedLineBackground: De-Fault\n*testedLineBackground: light sea green\n");
  KG_Settings& s = settingsFrom(d);
  EXPECT_EQ(s.unusedLineBackground.value, "default");
  // Without a display any colour name is kept as written.
  EXPECT_EQ(s.testedLineBackground.value, "light sea green");
  EXPECT_EQ(written(s.testedLineBackground), "Kestrelgauge*testedLineBackground: light sea green\n");
}

TEST(HighlightResources, AColourTheDisplayCannotResolveShowsTheNormalColours) {
  setHighlightColourCheck([](const std::string& n) { return n == "red" || n == "#ffd0d0"; });
  TextDatabase d("*usedLineBackground: #ffd0d0\n*unusedLineBackground: reddish\n");
  KG_Settings& s = settingsFrom(d);
  setHighlightColourCheck(nullptr);
  EXPECT_EQ(s.usedLineBackground.value, "#ffd0d0");
  EXPECT_EQ(s.unusedLineBackground.value, "default");
  EXPECT_EQ(d.warnings.size(), 1u);
}

TEST(CursorResources, AnUnknownCursorKeepsTheDefaultOnceTheGuiCanCheck) {
  TextDatabase d("*adjustEditCursor: pencil\n");
  EXPECT_EQ(settingsFrom(d).adjustEditCursor.value, "pencil");
  setCursorNameCheck([](const std::string& n) { return n == "hand2" || n == "leftbutton"; });
  TextDatabase e("*adjustEditCursor: pencil\n");
  std::string unknown = settingsFrom(e).adjustEditCursor.value;
  TextDatabase f("*adjustEditCursor: hand2\n");
  std::string known = settingsFrom(f).adjustEditCursor.value;
  setCursorNameCheck(nullptr);
  EXPECT_EQ(unknown, kDefaultEditCursor);
  EXPECT_EQ(known, "hand2");
}

TEST(StringResources, QuotedStringsLoseTheirQuotesWhenRead) {
  TextDatabase d("*adjustmentCommentFormat: \" // %s\"\n*adjustmentDisableString: NEVER\n");
  KG_Settings& s = settingsFrom(d);
  EXPECT_EQ(s.adjustmentCommentFormat.value, " // %s");
  EXPECT_EQ(s.adjustmentDisableString.value, "NEVER");
}
