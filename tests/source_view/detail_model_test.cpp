// The annotated source window's contents as a user reads and edits them: count texts,
// highlights, adjustment letters, titles, edits by click, saving and giving edits up.
#include <gtest/gtest.h>
#include <sys/stat.h>

#include <algorithm>

#include "adjust/adjustments_file.h"
#include "coverage/adjustment_list.h"
#include "coverage/summary_build.h"
#include "settings/resource_table.h"
#include "source_view/kg_detail_model.h"
#include "support/message_sink.h"
#include "tests/coverage/kgv_test_util.h"

namespace {

LineState line(std::uint32_t flags, std::uint16_t count, std::uint32_t actual, std::uint32_t adjusted) {
  LineState s;
  s.flags = flags;
  s.count = count;
  s.actualClass = actual;
  s.adjustedClass = adjusted;
  return s;
}

// Answers every question with yes and never names another file.
class YesPrompter : public SourcePrompter {
 public:
  bool askFileName(const std::string&, std::string&) override { return false; }
  bool askContinue(const std::string&) override { return true; }
  void showError(const std::string&, ErrorCode) override {}
};

// A small program with its source: main used, helper unused, a dead-code marker on line 9.
const char kSource[] =
    "int helper(int x);\n"           // 1
    "\n"                             // 2
    "int main(void) {\n"             // 3
    "  int a = 1;\n"                 // 4
    "  return helper(a) - 2;\n"      // 5
    "}\n"                            // 6
    "int helper(int x) {\n"          // 7
    "  if (x > 100)\n"               // 8
    "    return 0; /* kestrel: deadcode */\n"  // 9
    "  return x * 2;\n"              // 10
    "}\n";                           // 11

class DetailModel : public ::testing::Test {
 protected:
  void SetUp() override {
    viewBefore = std::make_unique<KG_DetailModel>(false);  // the view values of the resources
    setenv("HOME", dir.path().c_str(), 1);
    adjustmentList().clear();
    readAdjustmentsFile(dir.file("adjust"));
    source = dir.file("prog.c");
    kgtest::writeFile(source, kSource);
    const std::string kgv = "record " + source +
                            "\n"
                            "function main line=3 calls=1\nblock 4 hits=1\nblock 5 hits=12345\n"
                            "function helper line=7 calls=0\nblock 8 hits=0\nblock 9 hits=0\nblock 10 hits=0\n";
    data = kgtest::readOk(kgtest::makeKgv(dir, "p.kgv", kgv));
    ASSERT_EQ(buildSummary(*data, 1, hitsMax, adjustmentList(), messages, root), allOK);
    file = &root->dirRecords.at(0).fileRecords.at(0);
  }
  void TearDown() override {
    adjustmentList().clear();
    viewBefore->storeViewInResources();
  }
  // Loads the file as the window does: text, markers into the list, a fresh summary, states.
  std::unique_ptr<KG_DetailModel> open(bool snapshot = false) {
    auto m = std::make_unique<KG_DetailModel>(snapshot);
    EXPECT_EQ(m->loadText(source, 0, prompter), allOK);
    LoadedSourceAdjustments found = m->rescanMarkers(file->dir->name, file->name);
    EXPECT_TRUE(found.warnings.empty());
    if (found.listChanged) {
      EXPECT_EQ(recomputeSummary(*root, hitsMax, adjustmentList(), messages), allOK);
    }
    m->takeLineStates(*file, root->hitsPolicy);
    return m;
  }

  kgtest::TempDir dir;
  std::string source;
  std::unique_ptr<KgvData> data;
  std::unique_ptr<SumRoot> root;
  SumFile* file = nullptr;
  MessageList messages;
  YesPrompter prompter;
  std::unique_ptr<KG_DetailModel> viewBefore;
};

}  // namespace

TEST(DetailLines, CountTextsOfBothModes) {
  const LineState big = line(LineHasCode, 12345, ClassUsed, ClassUsed);
  EXPECT_EQ(kgCountCell(big, true, false), "10K+");
  EXPECT_EQ(kgCountCell(line(LineHasCode, 9999, ClassUsed, ClassUsed), true, false), "9999");
  EXPECT_EQ(kgCountCell(line(LineHasCode, 7, ClassUsed, ClassUsed), false, false), "   7");
  EXPECT_EQ(kgCountCell(line(0, 0, ClassNothing, ClassNothing), true, false), "    ");
  // An unused line marked dead code: "0" in actual mode, "DEAD" in adjusted mode unless hidden.
  const LineState dead = line(LineHasCode | adjLineDead, 0, ClassUnused, ClassNothing);
  EXPECT_EQ(kgCountCell(dead, false, false), "   0");
  EXPECT_EQ(kgCountCell(dead, true, false), "DEAD");
  EXPECT_EQ(kgCountCell(dead, true, true), "    ");
  EXPECT_EQ(kgCountCell(line(LineHasCode | adjRangeInspected, 0, ClassUnused, ClassUsed), true, true), "INSP");
}

TEST(DetailLines, HighlightFollowsTheClassOfTheModeAndTheSwitches) {
  KG_HighlightSwitches on;  // unused only, as a new window starts
  const LineState dead = line(LineHasCode | adjLineDead, 0, ClassUnused, ClassNothing);
  EXPECT_EQ(kgLineHighlight(dead, false, on, true), KG_LineHighlight::unused);
  EXPECT_EQ(kgLineHighlight(dead, true, on, true), KG_LineHighlight::none);
  on.deadcode = true;
  EXPECT_EQ(kgLineHighlight(dead, true, on, true), KG_LineHighlight::deadcode);
  // Tested and inspected lines count as used in the adjusted view; their own switches win.
  const LineState tested = line(LineHasCode | adjRangeTested, 0, ClassUnused, ClassUsed);
  on.used = true;
  EXPECT_EQ(kgLineHighlight(tested, true, on, true), KG_LineHighlight::used);
  on.tested = true;
  EXPECT_EQ(kgLineHighlight(tested, true, on, true), KG_LineHighlight::tested);
  const LineState inspected = line(LineHasCode | adjLineInspected, 0, ClassUnused, ClassUsed);
  on.inspected = true;
  EXPECT_EQ(kgLineHighlight(inspected, true, on, true), KG_LineHighlight::inspected);
  // Lines between two lines of one class follow them only with codeless regions on.
  const LineState between = line(0, 0, ClassBetweenUnused, ClassBetweenUnused);
  EXPECT_EQ(kgLineHighlight(between, false, on, true), KG_LineHighlight::unused);
  EXPECT_EQ(kgLineHighlight(between, false, on, false), KG_LineHighlight::none);
  EXPECT_EQ(kgLineHighlight(line(0, 0, ClassBetweenUsed, ClassBetweenUsed), true, on, true), KG_LineHighlight::used);
  EXPECT_EQ(kgLineHighlight(line(LineHasCode, 0, 0, 0), true, on, true), KG_LineHighlight::none);
}

TEST(DetailLines, AdjustmentLettersAndDubiousMarks) {
  EXPECT_EQ(kgMarkerText(0), "     ");
  EXPECT_EQ(kgMarkerText(adjRangeDead | adjLineDead | adjRangeTested), "D   t");
  EXPECT_EQ(kgMarkerText(adjRangeInspected | adjLineTested), "  i T");
  EXPECT_FALSE(kgDubiousAdjustment(line(LineHasCode | adjLineDead, 0, ClassUnused, ClassNothing)));
  EXPECT_TRUE(kgDubiousAdjustment(line(LineHasCode | adjLineDead, 3, ClassUsed, ClassUsed)));
  EXPECT_TRUE(kgDubiousAdjustment(line(adjRangeTested, 0, ClassNothing, ClassNothing)));
  EXPECT_FALSE(kgDubiousAdjustment(line(LineHasCode, 3, ClassUsed, ClassUsed)));
}

TEST(DetailLines, DisplayLinesExpandTabsAndStopAtTheLimit) {
  EXPECT_EQ(kgDisplayLine("\tint a;\t// x", 1), "        int a;  // x");
  EXPECT_EQ(kgDisplayLine("", 1), " ");
  EXPECT_EQ(kgDisplayLine("\f", 1), "^L");
  const std::string wide = std::string(4999, 'a') + "\xc3\xa9\xc3\xa9";
  EXPECT_EQ(kgDisplayLine(wide, 1), std::string(4999, 'a') + "\xc3\xa9");  // never half a character
  EXPECT_EQ(kgDisplayLine(std::string(6000, 'b'), 1).size(), kDisplayLineLimit);
}

TEST_F(DetailModel, AFileOpensWithItsMarkersCountsAndHighlights) {
  auto m = open();
  EXPECT_EQ(m->lineCount(), 11u);
  EXPECT_EQ(m->lineStateCount(), 10u);  // states reach the last code line
  EXPECT_EQ(m->displayLine(8), "    return 0; /* kestrel: deadcode */");
  EXPECT_EQ(m->countCell(4), "10K+");
  EXPECT_EQ(m->countCell(8), "DEAD");
  EXPECT_EQ(m->countCell(7), "   0");
  EXPECT_EQ(m->countCell(10), "");
  EXPECT_EQ(m->markerText(8), "D    ");
  EXPECT_EQ(m->highlight(7), KG_LineHighlight::unused);
  // Dead code between two unused lines: with its own switch off it takes the unused stretch's colour.
  EXPECT_EQ(m->highlight(8), KG_LineHighlight::unused);
  EXPECT_EQ(m->title(), "prog.c (Adjusted coverage) ");
  EXPECT_EQ(m->sourcePath(), source);
  // The marker went into the adjustment list under the file's path.
  const CvgAdjustSet* set = adjustmentList().findSet(m->summaryPath());
  ASSERT_NE(set, nullptr);
  EXPECT_EQ(set->lineKinds(9), std::uint32_t(adjLineDead));
}

TEST_F(DetailModel, ClicksSetAndTakeOffMarkersAndTheFileSavesExactly) {
  auto m = open();
  // Column 0 on the "D" line takes the marker off; column 2 on an unused line inspects it.
  EXPECT_EQ(m->clickKind(8, 0), 0);
  EXPECT_EQ(m->clickKind(7, 2), static_cast<long>(adjLineInspected));
  EXPECT_EQ(m->clickKind(7, 4), static_cast<long>(adjLineTested));
  EXPECT_EQ(m->clickKind(7, 3), -1);
  EXPECT_EQ(m->canEdit(10), KG_DetailModel::EditRefusal::noCode);

  KG_DetailModel::LineEdit off = m->editAdjustment(0, 8);
  EXPECT_EQ(off.line, 9u);
  EXPECT_EQ(off.oldKind, std::uint32_t(adjLineDead));
  EXPECT_EQ(off.newKind, 0u);
  KG_DetailModel::LineEdit on = m->editAdjustment(adjLineInspected, 7);
  EXPECT_EQ(on.oldKind, 0u);
  EXPECT_EQ(on.newKind, std::uint32_t(adjLineInspected));
  EXPECT_FALSE(on.newDubious);
  EXPECT_TRUE(m->modified());
  EXPECT_EQ(m->markerText(7), "  I  ");
  EXPECT_EQ(m->countCell(7), "INSP");
  // The line counts as used now in the adjusted view, and is coloured so at once.
  EXPECT_EQ(m->lineState(7)->adjustedClass, std::uint32_t(ClassUsed));
  EXPECT_EQ(m->highlight(7), KG_LineHighlight::none);
  EXPECT_EQ(m->displayLine(8), "    return 0;");
  EXPECT_EQ(m->displayLine(7), "  if (x > 100) /* kestrel: inspected */");
  const CvgAdjustSet* set = adjustmentList().findSet(m->summaryPath());
  ASSERT_NE(set, nullptr);
  EXPECT_EQ(set->lineKinds(9), 0u);
  EXPECT_EQ(set->lineKinds(8), std::uint32_t(adjLineInspected));

  KG_DetailModel::SaveResult saved = m->save(prompter);
  EXPECT_EQ(saved.source, allOK);
  EXPECT_EQ(saved.adjustments, allOK);
  EXPECT_FALSE(m->modified());
  std::string want = kSource;
  want.replace(want.find("  if (x > 100)\n"), 15, "  if (x > 100) /* kestrel: inspected */\n");
  want.replace(want.find("    return 0; /* kestrel: deadcode */"), 37, "    return 0;");
  EXPECT_EQ(kgtest::readFile(source), want);
  // The adjustments file holds the new set.
  EXPECT_NE(kgtest::readFile(dir.file("adjust")).find("\tinspected\tL\t 8\n"), std::string::npos)
      << kgtest::readFile(dir.file("adjust"));
}

TEST_F(DetailModel, GivingEditsUpPutsTheSetOfBeforeBack) {
  auto m = open();
  m->editAdjustment(adjLineTested, 7);
  m->editAdjustment(0, 8);
  EXPECT_TRUE(m->discardEdits());
  const CvgAdjustSet* set = adjustmentList().findSet(m->summaryPath());
  ASSERT_NE(set, nullptr);
  EXPECT_EQ(set->lineKinds(9), std::uint32_t(adjLineDead));
  EXPECT_EQ(set->lineKinds(8), 0u);
  EXPECT_FALSE(m->modified());
  EXPECT_EQ(kgtest::readFile(source), kSource);  // nothing was written

  // A file without any set before: giving up removes the entry made for the edits.
  kgtest::writeFile(source, "int helper(int x);\n");
  auto plain = open();
  EXPECT_EQ(adjustmentList().findSet(plain->summaryPath()), nullptr);
  plain->editAdjustment(adjLineDead, 7);
  ASSERT_NE(adjustmentList().findSet(plain->summaryPath()), nullptr);
  EXPECT_TRUE(plain->discardEdits());
  EXPECT_EQ(adjustmentList().findSet(plain->summaryPath()), nullptr);
}

TEST_F(DetailModel, TheAnnotatedListingHasEveryLineWithItsCount) {
  auto m = open();
  // The name the user gives in the file dialog.
  class NamePrompter : public YesPrompter {
   public:
    explicit NamePrompter(std::string path) : path_(std::move(path)) {}
    bool askFileName(const std::string&, std::string& name) override {
      name = path_;
      return true;
    }

   private:
    std::string path_;
  } naming(dir.file("listing.txt"));
  ASSERT_EQ(m->writeAnnotated("Write annotated source to file:", naming), allOK);
  const std::string listing = kgtest::readFile(dir.file("listing.txt"));
  EXPECT_EQ(listing.substr(0, listing.find('\n')), "     |\tint helper(int x);");
  EXPECT_NE(listing.find("10K+ |\t  return helper(a) - 2;\n"), std::string::npos) << listing;
  EXPECT_NE(listing.find("DEAD |\t    return 0; /* kestrel: deadcode */\n"), std::string::npos) << listing;
  EXPECT_EQ(std::count(listing.begin(), listing.end(), '\n'), 11);
  // A cancelled dialog writes nothing and is no failure to report.
  EXPECT_EQ(m->writeAnnotated("Write annotated source to file:", prompter), noFileName);
}

TEST_F(DetailModel, ViewsTitlesAndReadOnlyWindows) {
  auto m = open();
  KG_HighlightSwitches sw;
  sw.used = true;
  m->setView(false, true, false, sw);
  EXPECT_EQ(m->title(), "prog.c (Actual coverage) ");
  EXPECT_EQ(m->countCell(8), "   0");
  EXPECT_EQ(m->highlight(8), KG_LineHighlight::unused);
  EXPECT_EQ(m->canEdit(7), KG_DetailModel::EditRefusal::actualShown);
  m->storeViewInResources();
  EXPECT_FALSE(kgSettings().showAdjustedAnnotations.value);
  EXPECT_TRUE(kgSettings().highlightUsedLines.value);

  // A snapshot: the same lines, independent, always read only.
  auto snap = m->snapshot();
  EXPECT_TRUE(snap->readOnly());
  EXPECT_EQ(snap->canEdit(7), KG_DetailModel::EditRefusal::readOnly);
  EXPECT_EQ(snap->title(), "Snapshot of prog.c (Actual coverage) [Read only]");
  EXPECT_EQ(snap->displayLine(8), m->displayLine(8));
  m->setView(true, true, true, sw);
  m->editAdjustment(adjLineTested, 7);
  EXPECT_EQ(snap->markerText(7), "     ");

  // A source the user may not write gives a read-only window.
  if (geteuid() != 0) {
    ASSERT_EQ(chmod(source.c_str(), 0444), 0);
    auto ro = open();
    EXPECT_EQ(ro->title(), "prog.c (Adjusted coverage) [Read only]");
    EXPECT_EQ(ro->canEdit(7), KG_DetailModel::EditRefusal::readOnly);
  }
}
