// The summary outline as a user reads it: row lines under the headings, stripes, lazy
// children, resorting, new data, and adjustment counts walking up to the overall row.
#include <gtest/gtest.h>

#include "coverage/adjustment_list.h"
#include "coverage/sort_orders.h"
#include "coverage/summary_build.h"
#include "settings/resource_table.h"
#include "summary/cell_format.h"
#include "summary/kg_columns.h"
#include "summary/kg_outline_text.h"
#include "support/message_sink.h"
#include "tests/coverage/kgv_test_util.h"
#include "tests/outline/recording_display.h"

namespace {

// Where the engine's notices go; these tests do not look at them.
MessageList gMessages;

// Two directories; one file without functions; one function never called.
const char kProgram[] =
    "clockTime 125\n"
    "cpuTime 37\n"
    "record src/app/main.c build=1700000000 first=1700000100 last=1700000200 sessions=3\n"
    "function main line=3 calls=1\n"
    "block 4 hits=1\n"
    "blockline 5\n"
    "function helper line=10 calls=0\n"
    "block 11 hits=0\n"
    "block 12 hits=0\n"
    "record src/app/empty.c first=1700000100 last=1700000100\n"
    "record lib/util.c first=1700000100 last=1700000300\n"
    "function util_sum line=2 calls=7\n"
    "block 3 hits=7\n"
    "block 4 hits=0\n";

struct Viewer {
  explicit Viewer(const std::string& text, std::uint32_t order = 1) {
    data = kgtest::readOk(kgtest::makeKgv(dir, "a.kgv", text));
    std::unique_ptr<SumRoot> sum;
    EXPECT_EQ(buildSummary(*data, order, 1, AdjustmentList{}, gMessages, sum), allOK);
    display = new RecordingDisplay();
    root = std::make_unique<KG_OutlineRoot>(display);
    overall = new KG_SummaryOverall(std::move(data), std::move(sum));
    root->add_child(overall);
    overall->expand();
  }
  // The screen line whose text starts with the name, after the indentation.
  std::string lineOf(const std::string& name) const {
    for (const std::string& l : display->screen()) {
      std::size_t at = l.find_first_not_of(" >v?");
      if (at != std::string::npos && l.compare(at, name.size() + 1, name + " ") == 0) return l;
    }
    return "";
  }
  KG_OutlineText* row(const std::string& name) const {
    for (std::uint32_t i = 0; i < root->total_lines(); ++i) {
      auto* t = dynamic_cast<KG_OutlineText*>(root->object_at_line(i));
      if (t != nullptr && name == t->name()) return t;
    }
    return nullptr;
  }
  kgtest::TempDir dir;
  std::unique_ptr<KgvData> data;
  RecordingDisplay* display;
  std::unique_ptr<KG_OutlineRoot> root;
  KG_SummaryOverall* overall;
};

// The settings are process-wide: each test starts from the defaults and leaves them so.
class SummaryRows : public ::testing::Test {
 protected:
  void SetUp() override {
    buildSettings(ResourceSource{});
    set_format_date_now(1700000000 + 86400);
  }
  void TearDown() override { buildSettings(ResourceSource{}); }
};

// The cell of a shown column, read off a line by the column's place.
std::string cell(const std::string& line, std::uint32_t id) {
  for (const KG_ShownColumn& s : kgShownColumns()) {
    if (s.column->id == id) return line.substr(s.start, s.width);
  }
  return "<not shown>";
}

std::string trim(const std::string& s) {
  std::size_t a = s.find_first_not_of(' ');
  if (a == std::string::npos) return "";
  return s.substr(a, s.find_last_not_of(' ') - a + 1);
}

TEST_F(SummaryRows, DefaultColumnsLineUpUnderTheHeadings) {
  Viewer v(kProgram);
  const KG_Headings h = kgBuildHeadings(kgShownColumns(), sort_order_label(1), 1);
  const std::uint32_t width = kgShownWidth(kgShownColumns());
  // Name 32, Runs, Calls, three function columns, three adjusted-lines columns, adjustments total.
  EXPECT_EQ(width, 33u + 7 + 6 + 8 + 8 + 6 + 8 + 8 + 6 + 8);
  EXPECT_EQ(h.first.size(), width);
  EXPECT_EQ(h.second.size(), width);
  EXPECT_EQ(h.first.substr(0, 14), "Sorting order:");
  EXPECT_NE(h.first.find("FUNCTIONS"), std::string::npos);
  EXPECT_NE(h.first.find("ADJUSTED LINES"), std::string::npos);
  // The adjustments group is one 7-wide column: its title is too long, the short one is used.
  EXPECT_NE(h.first.find(" ADJS "), std::string::npos);
  EXPECT_EQ(h.second.substr(0, 32), justify_left(sort_order_label(1), 32).substr(0, 32));
  EXPECT_EQ(trim(cell(h.second, 4)), "Runs");
  EXPECT_EQ(cell(h.second, 14), "used%");
  // Three titled groups are marked; the misc group is a blank span.
  EXPECT_EQ(h.marked.size(), 3u);

  v.row("src/app/")->expand();
  v.row("main.c")->expand();
  for (const char* name : {"Total Coverage", "src/app/", "main.c", "main", "helper"}) {
    std::string l = v.lineOf(name);
    ASSERT_FALSE(l.empty()) << name;
    EXPECT_EQ(l.size(), width) << name;  // every row ends with the separator blank
    EXPECT_EQ(l.back(), ' ');
  }
  // Function rows: calls and the used/unused marks.
  EXPECT_EQ(trim(cell(v.lineOf("main"), 5)), "1");
  EXPECT_EQ(trim(cell(v.lineOf("main"), 13)), "used");
  EXPECT_EQ(trim(cell(v.lineOf("main"), 11)), "");
  EXPECT_EQ(trim(cell(v.lineOf("helper"), 11)), "unused");
  EXPECT_EQ(trim(cell(v.lineOf("helper"), 13)), "");
  EXPECT_EQ(trim(cell(v.lineOf("helper"), 26)), "0%");
  // A file row: sessions, functions used of total.
  EXPECT_EQ(trim(cell(v.lineOf("main.c"), 4)), "3");
  EXPECT_EQ(trim(cell(v.lineOf("main.c"), 11)), "1");
  EXPECT_EQ(trim(cell(v.lineOf("main.c"), 14)), "50%");
  // The overall row leaves Runs and Calls blank and counts every function.
  const std::string all = v.lineOf("Total Coverage");
  EXPECT_EQ(trim(cell(all, 4)), "");
  EXPECT_EQ(trim(cell(all, 5)), "");
  EXPECT_EQ(trim(cell(all, 13)), "2");
  EXPECT_EQ(trim(cell(all, 11)), "1");
}

TEST_F(SummaryRows, NameCellsShrinkWithTheIndentationSoColumnsStayAligned) {
  Viewer v(kProgram);
  v.overall->expand_all();
  // The screen adds 3 per level + 3 of indentation; the name cell gives that back.
  const std::string fn = v.display->lines[v.row("main")->first_line()];
  EXPECT_EQ(fn.size(), v.display->lines[0].size());
  EXPECT_EQ(fn.substr(12, 20), justify_left("main", 20));
  // Only the name column and Calls: name width + 1 + 5 + 1.
  KG_Settings& s = kgSettings();
  for (KG_BoolResource* r : {&s.showNumberOfRuns, &s.showFunctionsUnused, &s.showFunctionsUsed,
                             &s.showFunctionsPercentUsed, &s.showAdjustedLinesUnused,
                             &s.showAdjustedLinesUsed, &s.showAdjustedLinesPercentUsed,
                             &s.showTotalAdjustments}) {
    r->value = false;
  }
  v.overall->refresh_subtree();
  EXPECT_EQ(v.row("helper")->line_text(0), std::string(20, ' ').replace(0, 6, "helper") + " " +
                                               justify_right("0", 5) + " ");
  EXPECT_EQ(std::string(v.overall->line_text(0)).size(), 32u - 3 + 1 + 5 + 1);
}

TEST_F(SummaryRows, StripesFallBetweenGroupsOrAfterEveryColumn) {
  const auto shown = kgShownColumns();
  EXPECT_EQ(kgStripePositions(shown, 2), (std::vector<std::uint32_t>{32, 45, 67, 89}));
  EXPECT_EQ(kgStripePositions(shown, 3),
            (std::vector<std::uint32_t>{32, 39, 45, 53, 61, 67, 75, 83, 89}));
  EXPECT_TRUE(kgStripePositions(shown, 1).empty());
  // Under every stripe the line has the separator blank.
  Viewer v(kProgram);
  for (std::uint32_t p : kgStripePositions(shown, 3)) EXPECT_EQ(v.lineOf("Total Coverage")[p], ' ');
  // Hidden by default, the restricted directory count appears when set.
  kgSettings().showNumberOfDirectories.value = true;
  v.overall->refresh();
  EXPECT_EQ(trim(cell(v.lineOf("Total Coverage"), 2)), "2");
}

TEST_F(SummaryRows, ChildrenAreMadeOnFirstExpansionAndEmptyOnesHaveNoGlyph) {
  Viewer v(kProgram);
  ASSERT_EQ(v.overall->child_count(), 2u);
  KG_OutlineText* app = v.row("src/app/");
  ASSERT_NE(app, nullptr);
  EXPECT_EQ(app->child_count(), 0u);  // not expanded yet
  app->expand();
  ASSERT_EQ(app->child_count(), 2u);
  KG_OutlineText* empty = v.row("empty.c");
  ASSERT_NE(empty, nullptr);
  EXPECT_FALSE(empty->is_expandable_or_collapsible());
  EXPECT_TRUE(v.row("main.c")->is_expandable_or_collapsible());
  for (const auto& f : v.display->faults) ADD_FAILURE() << f;
  // Expanding the whole tree makes every function row.
  v.overall->expand_all();
  EXPECT_NE(v.row("util_sum"), nullptr);
  EXPECT_EQ(v.root->total_lines(), 1u + 2 + 3 + 3);
}

TEST_F(SummaryRows, ResortKeepsExpansionAndSelection) {
  Viewer v(kProgram, 1);
  v.row("src/app/")->expand();
  v.row("main.c")->expand();
  v.row("helper")->select();
  const auto before = v.display->screen().size();
  v.display->take_log();
  v.overall->resort(1, false);  // same order, not forced: nothing happens
  EXPECT_TRUE(v.display->take_log().empty());

  v.overall->resort(1, true);
  EXPECT_EQ(v.display->screen().size(), before);
  ASSERT_EQ(v.root->selection_count(), 1u);
  EXPECT_STREQ(static_cast<KG_OutlineText*>(v.root->selected(0))->name(), "helper");
  EXPECT_NE(v.row("main.c"), nullptr);
  for (const auto& f : v.display->faults) ADD_FAILURE() << f;

  // Another order: the same rows stay open, and the overall row's totals are unchanged.
  const std::string total = v.overall->line_text(0);
  v.overall->resort(kDefaultSortOrder, false);
  EXPECT_EQ(v.overall->sort_order(), kDefaultSortOrder);
  EXPECT_EQ(std::string(v.overall->line_text(0)), total);
  EXPECT_TRUE(v.row("main.c")->is_expanded());
  EXPECT_EQ(v.root->selection_count(), 1u);
}

TEST_F(SummaryRows, NewDataReplaceTheOutlineKeepingOpenRowsByName) {
  Viewer v(kProgram);
  v.row("src/app/")->expand();
  v.row("main.c")->expand();
  v.row("main")->select();
  std::string more = kProgram;
  more += "record lib/extra.c first=1700000100 last=1700000300\nfunction extra line=1 calls=0\nblock 2\n";
  auto data = kgtest::readOk(kgtest::makeKgv(v.dir, "b.kgv", more));
  ASSERT_EQ(v.overall->replace_data(std::move(data), gMessages), allOK);
  EXPECT_TRUE(v.row("main.c")->is_expanded());
  ASSERT_EQ(v.root->selection_count(), 1u);
  EXPECT_STREQ(static_cast<KG_OutlineText*>(v.root->selected(0))->name(), "main");
  EXPECT_EQ(trim(cell(v.lineOf("Total Coverage"), 11)), "2");  // helper and extra unused
  for (const auto& f : v.display->faults) ADD_FAILURE() << f;
}

TEST_F(SummaryRows, DeadcodeAdjustmentsMakeAFunctionDeadAndReachTheTotals) {
  Viewer v(kProgram);
  kgSettings().showFunctionsDeadcode.value = true;
  v.overall->expand_all();
  auto* helper = dynamic_cast<KG_SummaryFunc*>(v.row("helper"));
  ASSERT_NE(helper, nullptr);
  const std::uint32_t unused = helper->counts().adjUnusedLines;
  ASSERT_GT(unused, 0u);
  for (std::uint32_t i = 0; i < unused; ++i) helper->adjustment_added(adjLineDead);
  for (std::uint32_t id : {11u, 13u, 16u}) EXPECT_EQ(trim(cell(v.lineOf("helper"), id)), "dead");
  EXPECT_EQ(trim(cell(v.lineOf("Total Coverage"), 16)), "1");
  EXPECT_EQ(trim(cell(v.lineOf("main.c"), 16)), "1");
  EXPECT_EQ(trim(cell(v.lineOf("Total Coverage"), 31)), std::to_string(unused));
  // Taking one back: no longer all dead, the ancestors lose the dead function.
  helper->adjustment_removed(adjLineDead);
  EXPECT_EQ(trim(cell(v.lineOf("helper"), 11)), "unused");
  EXPECT_EQ(trim(cell(v.lineOf("src/app/"), 16)), "0");
  EXPECT_EQ(trim(cell(v.lineOf("Total Coverage"), 31)), std::to_string(unused - 1));
  // The file row finds the function by a line inside it.
  auto* file = dynamic_cast<KG_SummaryFile*>(v.row("main.c"));
  ASSERT_NE(file, nullptr);
  auto at = file->functions_at_line(helper->record()->firstLine);
  ASSERT_EQ(at.size(), 1u);
  EXPECT_EQ(at[0], helper);
  EXPECT_TRUE(file->functions_at_line(100000).empty());
}

TEST_F(SummaryRows, OverallRowShowsTheDataTimesWhenAsked) {
  KG_Settings& s = kgSettings();
  s.showRealTime.value = true;
  s.showCpuTime.value = true;
  s.showNumberOfFiles.value = true;
  Viewer v(kProgram);
  const std::string all = v.lineOf("Total Coverage");
  EXPECT_EQ(cell(all, 10), format_elapsed(13, 125));
  EXPECT_EQ(cell(all, 9), format_elapsed(13, 37));
  EXPECT_EQ(trim(cell(all, 3)), "3");
  EXPECT_EQ(trim(cell(v.lineOf("lib/"), 3)), "1");
  EXPECT_EQ(trim(cell(v.lineOf("lib/"), 9)), "");
}

}  // namespace
