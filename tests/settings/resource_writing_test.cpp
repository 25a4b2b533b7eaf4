// Writing settings back: resource lines that read back to the same values, the ordinary
// save, the dumps and their failures.
#include <gtest/gtest.h>
#include <sys/stat.h>

#include <cstring>

#include "settings/resource_database.h"
#include "settings/settings_writer.h"
#include "settings_test_util.h"
#include "tests/common/test_support.h"

using kgtest::settingsFrom;
using kgtest::TextDatabase;
using kgtest::written;

namespace {

// The value a resource line gives when read back by the resource manager.
std::string readBack(const std::string& lines, const char* name) {
  TextDatabase d(lines);
  std::string v;
  EXPECT_TRUE(lookupResourceString(d.db(), name, v)) << lines;
  return v;
}

// The GUI-editable resources as the table lists them.
const char* const kEditable[] = {
    "directoryNames", "coverageChangesOption", "highlightDeadcodeLines",
    "highlightInspectedLines", "highlightTestedLines", "highlightUnusedLines",
    "highlightUsedLines", "longDirectoryNames", "longFileNames", "longFunctionNames",
    "nameColumnWidth", "showAdjustedAnnotations", "showCounts", "showLineNumbers", "showToolbar",
    "sortCriterion", "outlineDataColumnSeparators", "summaryLines",
    "suppressCplusplusArgumentList", "suppressCplusplusClassName",
    "suppressCplusplusOperatorPrefix", "showNumberOfFiles", "showNumberOfRuns",
    "showOldestSessionDate", "showNewestSessionDate", "showNumberOfCalls", "showFunctionsUnused",
    "showFunctionsPercentUnused", "showFunctionsUsed", "showFunctionsPercentUsed",
    "showFunctionsTotal", "showFunctionsDeadcode", "showFunctionsPercentDeadcode",
    "showAdjustedLinesUnused", "showAdjustedLinesPercentUnused", "showAdjustedLinesUsed",
    "showAdjustedLinesPercentUsed", "showAdjustedLinesTotal", "showLinesUnused",
    "showLinesPercentUnused", "showLinesUsed", "showLinesPercentUsed", "showLinesTotal",
    "showDeadcodeAdjustments", "showInspectedAdjustments", "showTestedAdjustments",
    "showTotalAdjustments", "showBlocksUnused", "showBlocksPercentUnused", "showBlocksUsed",
    "showBlocksPercentUsed", "showBlocksTotal"};

}  // namespace

TEST(ResourceLines, AStringWithNewlinesIsWrittenAsContinuedLinesAndReadsBackTheSame) {
  TextDatabase d("");
  KG_Settings& s = settingsFrom(d);
  s.sourceNeedsSavePrompt.value = "First line\nsecond line\n";
  std::string line = written(s.sourceNeedsSavePrompt);
  EXPECT_EQ(line, "Kestrelgauge*sourceNeedsSavePrompt: First line\\n\\\nsecond line\\n\\\n\n");
  EXPECT_EQ(readBack(line, "sourceNeedsSavePrompt"), "First line\nsecond line\n");
}

TEST(ResourceLines, QuotedStringsAreWrittenBetweenDoubleQuotes) {
  TextDatabase d("");
  KG_Settings& s = settingsFrom(d);
  EXPECT_EQ(written(s.adjustmentDisableString), "Kestrelgauge*adjustmentDisableString: \" NOT\"\n");
  EXPECT_EQ(written(s.adjustmentCommentFormat),
            "Kestrelgauge*adjustmentCommentFormat: \" /* %s */\"\n");
  // Written and read again, the blank in front survives.
  TextDatabase again(written(s.adjustmentDisableString));
  EXPECT_EQ(settingsFrom(again).adjustmentDisableString.value, " NOT");
}

TEST(ResourceLines, TextsWithLeadingBlanksBackslashesAndTrailingBlanksSurviveTheRoundTrip) {
  TextDatabase d("");
  KG_Settings& s = settingsFrom(d);
  EXPECT_EQ(written(s.crmsCommandString), "Kestrelgauge*crmsCommandString: \n");
  s.crmsCommandString.value = "C:\\new\\101 tab";
  EXPECT_EQ(readBack(written(s.crmsCommandString), "crmsCommandString"), "C:\\new\\101 tab");
  EXPECT_EQ(readBack(written(s.lineNumberPaneTitle), "lineNumberPaneTitle"), " Line");
  EXPECT_EQ(readBack(written(s.coverageActualPrompt), "coverageActualPrompt"), "(Actual coverage) ");

  // A whole dump reads back to the same table.
  std::string all = kgtest::writtenAll(true);
  TextDatabase back(all);
  KG_Settings& t = settingsFrom(back);
  EXPECT_TRUE(back.warnings.empty());
  EXPECT_EQ(t.crmsCommandString.value, "C:\\new\\101 tab");
  EXPECT_EQ(t.lineNumberPaneTitle.value, " Line");
  EXPECT_EQ(kgtest::writtenAll(true), all);
}

TEST(OrdinarySave, WritesExactlyTheGuiEditableResourcesInTableOrder) {
  TextDatabase d("");
  settingsFrom(d);
  std::vector<std::string> names = kgtest::namesOfLines(kgtest::writtenAll(false));
  std::vector<std::string> expected(std::begin(kEditable), std::end(kEditable));
  EXPECT_EQ(names, expected);
  EXPECT_EQ(kgtest::namesOfLines(kgtest::writtenAll(true)).size(), kSettingsResourceCount);
}

TEST(WriteViewSettings, ReplacesTheChosenFileWithTheChangedSettings) {
  kgtest::TempDir dir;
  std::string path = dir.file("my.Xdefaults");
  kgtest::writeFile(path, "old contents that go away\n");
  chmod(path.c_str(), 0640);
  TextDatabase d("");
  KG_Settings& s = settingsFrom(d);
  s.summaryLines.setValue(55);
  s.coverageChangesOption.set(KG_FileUpdateResource::reload);
  SettingsOutcome o = writeViewSettings(path);
  ASSERT_EQ(o.code, allOK) << pendingSystemError();
  std::string text = kgtest::readFile(path);
  EXPECT_EQ(text.find("old contents"), std::string::npos);
  EXPECT_NE(text.find("Kestrelgauge*summaryLines: 55\n"), std::string::npos);
  EXPECT_NE(text.find("Kestrelgauge*coverageChangesOption: reload\n"), std::string::npos);
  EXPECT_EQ(text.find("adjustmentCommentFormat"), std::string::npos);
  struct stat st;
  ASSERT_EQ(stat(path.c_str(), &st), 0);
  EXPECT_EQ(st.st_mode & 0777, 0640u);

  // The written file is a resource file the next session reads back.
  TextDatabase next(text);
  KG_Settings& n = settingsFrom(next);
  EXPECT_EQ(n.summaryLines.value, 55);
  EXPECT_EQ(n.coverageChangesOption.value, 3);
}

TEST(WriteViewSettings, AFileThatCannotBeCreatedGivesError19NamingTheFile) {
  kgtest::TempDir dir;
  std::string path = dir.file("missing-dir/settings");
  TextDatabase d("");
  settingsFrom(d);
  SettingsOutcome o = writeViewSettings(path);
  EXPECT_EQ(o.code, writeError);
  EXPECT_EQ(o.messageName, "noOverWriteFile");
  EXPECT_EQ(o.context, "Unable to overwrite the file");
  std::string pending = pendingSystemError();
  EXPECT_EQ(pending.rfind("File: " + path + "\nSystem error code: ", 0), 0u) << pending;
  std::string dialog = errorDialogText(o.context, o.code);
  EXPECT_EQ(dialog.rfind("Unable to overwrite the file:\n ", 0), 0u);
  EXPECT_NE(dialog.find("File: "), std::string::npos);
  EXPECT_TRUE(pendingSystemError().empty());

  // A directory chosen by mistake is not a file that can be overwritten.
  EXPECT_EQ(writeViewSettings(dir.path()).code, writeError);
  EXPECT_NE(pendingSystemError().find(strerror(EISDIR)), std::string::npos);
  clearPendingSystemError();
}

TEST(DumpResources, AllOrOnlyTheGuiEditableOnes) {
  kgtest::TempDir dir;
  TextDatabase d("");
  settingsFrom(d);
  ASSERT_EQ(dumpResources(dir.file("all"), true).code, allOK);
  ASSERT_EQ(dumpResources(dir.file("gui"), false).code, allOK);
  EXPECT_EQ(kgtest::namesOfLines(kgtest::readFile(dir.file("all"))).size(), kSettingsResourceCount);
  EXPECT_EQ(kgtest::namesOfLines(kgtest::readFile(dir.file("gui"))).size(), std::size(kEditable));
  SettingsOutcome o = dumpResources(dir.file("nowhere/all"), true);
  EXPECT_EQ(o.code, errorOccured);
  clearPendingSystemError();
}

TEST(WriteViewSettings, ASettingsFileKeptAsALinkStaysALink) {
  kgtest::TempDir dir;
  ASSERT_EQ(mkdir(dir.file("dotfiles").c_str(), 0755), 0);
  kgtest::writeFile(dir.file("dotfiles/kestrel.Xdefaults"), "! mine\n");
  std::string link = dir.file(".kestrel.Xdefaults");
  ASSERT_EQ(symlink("dotfiles/kestrel.Xdefaults", link.c_str()), 0);
  TextDatabase d("");
  settingsFrom(d);
  ASSERT_EQ(writeViewSettings(link).code, allOK);
  struct stat st;
  ASSERT_EQ(lstat(link.c_str(), &st), 0);
  EXPECT_TRUE(S_ISLNK(st.st_mode));
  EXPECT_NE(kgtest::readFile(dir.file("dotfiles/kestrel.Xdefaults")).find("summaryLines: 30"),
            std::string::npos);
}
