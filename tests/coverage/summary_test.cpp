// The summary tree as users see it: counts with and without adjustments, line states,
// the sort orders, view state across a rebuild, finding files.
#include <gtest/gtest.h>

#include <cstdlib>
#include <random>

#include "adjust/export_report.h"
#include "coverage/sort_orders.h"
#include "coverage/summary_build.h"
#include "coverage/summary_sort.h"
#include "support/message_sink.h"
#include "tests/coverage/kgv_test_util.h"

namespace {

// Where the engine's notices go; these tests do not look at them.
MessageList gMessages;

struct Built {
  kgtest::TempDir dir;
  std::unique_ptr<KgvData> data;
  std::unique_ptr<SumRoot> root;
  ErrorCode rc = allOK;
};

std::unique_ptr<Built> build(const std::string& text, const AdjustmentList& adj = {},
                             std::uint32_t order = 1, std::uint32_t policy = hitsMax) {
  auto b = std::make_unique<Built>();
  b->data = kgtest::readOk(kgtest::makeKgv(b->dir, "t.kgv", text));
  if (!b->data) return b;
  b->rc = buildSummary(*b->data, order, policy, adj, gMessages, b->root);
  return b;
}

const SumFile& onlyFile(const SumRoot& r) { return r.dirRecords.at(0).fileRecords.at(0); }

AdjustmentList adjustments(const std::string& path, CvgAdjust kind, std::uint32_t first,
                           std::uint32_t last) {
  AdjustmentList list;
  auto set = std::make_unique<CvgAdjustSet>();
  set->addRange(kind, first, last);
  list.append(AdjustEntry(makeKgvFileRef(path, path), std::move(set)));
  return list;
}

std::vector<std::string> dirNames(const SumRoot& r) {
  std::vector<std::string> v;
  for (const SumDir* d : r.dirOrder) v.push_back(d->name);
  return v;
}

std::vector<std::string> fileNames(const SumDir& d) {
  std::vector<std::string> v;
  for (const SumFile* f : d.fileOrder) v.push_back(f->name);
  return v;
}

const char kTwoBlocksOneLine[] =
    "record src/a.c\n"
    "function f line=1 calls=1\n"
    "block 2 hits=3\n"
    "block 2 hits=0\n";

}  // namespace

TEST(SummaryHits, TwoBlocksOnOneLineCombineByThePolicy) {
  auto count = [](std::uint32_t policy) {
    auto b = build(kTwoBlocksOneLine, {}, 1, policy);
    EXPECT_EQ(b->rc, allOK);
    const SumFile& f = onlyFile(*b->root);
    EXPECT_EQ(f.counts.lines, 1u);
    EXPECT_EQ(f.counts.blocks, 2u);
    EXPECT_EQ(f.counts.unusedBlocks, 1u);
    return std::make_pair(f.counts.unusedLines, f.lineStates.at(1).count);
  };
  EXPECT_EQ(count(hitsMax), std::make_pair(0u, std::uint16_t(3)));
  EXPECT_EQ(count(hitsFirst), std::make_pair(0u, std::uint16_t(3)));
  EXPECT_EQ(count(hitsMin), std::make_pair(1u, std::uint16_t(0)));
  EXPECT_EQ(count(hitsLast), std::make_pair(1u, std::uint16_t(0)));
}

TEST(SummaryHits, ThePolicyNameFollowsTheOptionNameRule) {
  EXPECT_EQ(hitsPolicyFromText(nullptr), 1u);
  EXPECT_EQ(hitsPolicyFromText(""), 1u);
  EXPECT_EQ(hitsPolicyFromText("MIN"), 2u);
  EXPECT_EQ(hitsPolicyFromText("-fi_rst"), 3u);
  EXPECT_EQ(hitsPolicyFromText("Last"), 4u);
  EXPECT_EQ(hitsPolicyFromText("largest"), 1u);
}

TEST(SummaryCounts, AFunctionWithoutALineEntryHasBlocksButNoLines) {
  auto b = build(
      "record a.c\n"
      "function g calls=0\n"
      "block 40 hits=0\n"
      "blockline 41\n"
      "function f line=3 calls=2\n"
      "block 4 hits=1\n");
  ASSERT_EQ(b->rc, allOK);
  const SumFile& f = onlyFile(*b->root);
  EXPECT_STREQ(b->root->dirRecords[0].name, "**no_directory_provided**/");
  EXPECT_STREQ(f.name, "a.c");
  ASSERT_EQ(f.functions.size(), 2u);
  const SumFunc& g = f.functions[0];
  EXPECT_STREQ(g.name, "g");
  EXPECT_EQ(g.counts.blocks, 1u);
  EXPECT_EQ(g.counts.lines, 0u);
  EXPECT_EQ(g.firstLine, 0u);
  EXPECT_EQ(f.unusedFuncs, 1u);
  // Its lines 40 and 41 lie beyond the file's lines and are never stored.
  EXPECT_EQ(f.lineCount, 4u);
  EXPECT_EQ(f.lineStates.size(), 4u);
  EXPECT_EQ(f.functions[1].firstMapIndex, 4u);
  EXPECT_EQ(f.functions[1].lastMapIndex, 6u);
}

TEST(SummaryCounts, BlockLinesBeyondTheFileAreReportedOnlyWhenAsked) {
  const char text[] =
      "record d/late.c\n"
      "function g\n"
      "block 90\n"
      "block 91\n"
      "function f line=2 calls=1\n"
      "block 2 hits=1\n";
  kgtest::TempDir dir;
  std::string path = kgtest::makeKgv(dir, "c.kgv", text);
  auto r = kgtest::runProcess({kgtest::binPath("kestrel"), "-export", path},
                              {"HOME=" + dir.path(), "PROCESS_CORRUPTED_LINES=1"});
  EXPECT_EQ(r.status, 0) << r.err;
  // The notice is for the user; the report a script reads starts with its header.
  EXPECT_NE(r.err.find("The line number information of file d/late.c is corrupted.\n"
                       "Kestrel will not process this information\n"),
            std::string::npos)
      << r.err;
  EXPECT_EQ(r.out.rfind("#####", 0), 0u) << r.out.substr(0, 200);
  EXPECT_EQ(r.out.find("corrupted"), std::string::npos);
  r = kgtest::runProcess({kgtest::binPath("kestrel"), "-export", path}, {"HOME=" + dir.path()});
  EXPECT_EQ(r.status, 0);
  EXPECT_EQ(r.out.find("corrupted"), std::string::npos);
  EXPECT_EQ(r.err.find("corrupted"), std::string::npos);
  EXPECT_NE(r.out.find("li\t2\t1\n"), std::string::npos);
}

TEST(SummaryAdjusted, DeadTestedAndInspectedLinesCountWhereTheyShould) {
  const char text[] =
      "record src/x.c\n"
      "function f line=1 calls=1\n"
      "block 2 hits=0\n"
      "block 3 hits=4\n"
      "block 4 hits=0\n"
      "block 5 hits=0\n"
      "block 6 hits=0\n";
  AdjustmentList adj;
  auto set = std::make_unique<CvgAdjustSet>();
  set->addRange(adjRangeDead, 2, 3);       // 2 unused dead, 3 used dead
  set->addRange(adjLineTested, 4, 4);      // 4 tested
  set->addRange(adjLineInspected, 5, 5);   // 5 inspected
  adj.append(AdjustEntry(makeKgvFileRef("src/x.c", "src/x.c"), std::move(set)));
  auto b = build(text, adj);
  ASSERT_EQ(b->rc, allOK);
  const SumFunc& fn = onlyFile(*b->root).functions[0];
  EXPECT_EQ(fn.counts.lines, 5u);
  EXPECT_EQ(fn.counts.unusedLines, 4u);
  EXPECT_EQ(fn.counts.deadLines, 1u);
  EXPECT_EQ(fn.counts.testedLines, 1u);
  EXPECT_EQ(fn.counts.inspectedLines, 1u);
  EXPECT_EQ(fn.counts.adjLines, 4u);        // 3 (used), 4, 5, 6
  EXPECT_EQ(fn.counts.adjUnusedLines, 1u);  // 6 only
  EXPECT_FALSE(fn.allDead);
  const auto& ls = onlyFile(*b->root).lineStates;
  EXPECT_EQ(ls[1].flags & adjAnyMask, std::uint32_t(adjRangeDead));
  EXPECT_EQ(ls[1].actualClass, std::uint32_t(ClassUnused));
  EXPECT_EQ(ls[1].adjustedClass, std::uint32_t(ClassNothing));  // dead: not counted
  EXPECT_EQ(ls[3].adjustedClass, std::uint32_t(ClassUsed));     // tested
  EXPECT_EQ(ls[5].adjustedClass, std::uint32_t(ClassUnused));
  EXPECT_TRUE(ls[0].flags & LineFuncStart);
  EXPECT_TRUE(ls[5].flags & LineFuncEnd);

  // Without the set the same data count every unused line.
  ASSERT_EQ(recomputeSummary(*b->root, hitsMax, AdjustmentList{}, gMessages), allOK);
  EXPECT_EQ(fn.counts.adjLines, 5u);
  EXPECT_EQ(fn.counts.adjUnusedLines, 4u);
  EXPECT_EQ(onlyFile(*b->root).lineStates[1].flags & adjAnyMask, 0u);
}

TEST(SummaryAdjusted, MarkingUnusedLinesOneByOneGivesTheCountsOfARebuild) {
  // The window changes counts line by line as the user marks; a rebuild counts from scratch.
  // Both must agree for every kind and every mix, and taking marks back restores the counts.
  std::string text = "record src/m.c\nfunction f line=1 calls=1\n";
  for (int l = 2; l <= 40; ++l) text += "block " + std::to_string(l) + " hits=" + (l % 7 == 0 ? "2" : "0") + "\n";
  auto plain = build(text);
  ASSERT_EQ(plain->rc, allOK);
  const SumCounts before = onlyFile(*plain->root).functions[0].counts;
  std::mt19937 random(12);
  const CvgAdjust kinds[] = {0, adjLineDead, adjLineTested, adjLineInspected, adjRangeDead,
                             adjRangeTested, adjRangeInspected};
  for (int round = 0; round < 20; ++round) {
    SumCounts stepwise = before;
    auto set = std::make_unique<CvgAdjustSet>();
    std::vector<std::pair<std::uint32_t, CvgAdjust>> marked;
    for (std::uint32_t l = 2; l <= 40; ++l) {
      CvgAdjust k = kinds[random() % 7];
      if (l % 7 == 0 || k == 0) continue;  // used lines and unmarked ones keep their share
      set->addRange(k, l, l);
      moveUnusedLine(stepwise, 0, k);
      marked.emplace_back(l, k);
    }
    AdjustmentList adj;
    adj.append(AdjustEntry(makeKgvFileRef("src/m.c", "src/m.c"), std::move(set)));
    auto rebuilt = build(text, adj);
    ASSERT_EQ(rebuilt->rc, allOK);
    const SumCounts& want = onlyFile(*rebuilt->root).functions[0].counts;
    EXPECT_EQ(stepwise.adjLines, want.adjLines);
    EXPECT_EQ(stepwise.adjUnusedLines, want.adjUnusedLines);
    EXPECT_EQ(stepwise.deadLines, want.deadLines);
    EXPECT_EQ(stepwise.testedLines, want.testedLines);
    EXPECT_EQ(stepwise.inspectedLines, want.inspectedLines);
    for (const auto& [line, kind] : marked) moveUnusedLine(stepwise, kind, 0);
    EXPECT_EQ(stepwise.adjLines, before.adjLines);
    EXPECT_EQ(stepwise.adjUnusedLines, before.adjUnusedLines);
    EXPECT_EQ(stepwise.deadLines + stepwise.testedLines + stepwise.inspectedLines, 0u);
  }
  // Removing more marks than were made never wraps a count below 0.
  SumCounts empty;
  moveUnusedLine(empty, adjLineTested, 0);
  EXPECT_EQ(empty.testedLines, 0u);
  EXPECT_EQ(empty.adjUnusedLines, 1u);
}

TEST(SummaryAdjusted, AFunctionOfOnlyUnusedDeadLinesIsAllDead) {
  auto b = build(
      "record src/d.c\n"
      "function gone line=10 calls=0\n"
      "block 11 hits=0\n"
      "block 12 hits=0\n"
      "function kept line=20 calls=1\n"
      "block 21 hits=1\n",
      adjustments("src/d.c", adjRangeDead, 10, 13));
  ASSERT_EQ(b->rc, allOK);
  const SumFile& f = onlyFile(*b->root);
  EXPECT_TRUE(f.functions[0].allDead);
  EXPECT_FALSE(f.functions[1].allDead);
  EXPECT_EQ(f.deadFuncs, 1u);
  EXPECT_EQ(b->root->deadFuncs, 1u);
  EXPECT_EQ(b->root->dirRecords[0].deadFuncs, 1u);
}

TEST(SummaryClasses, LinesBetweenTwoOfTheSameClassInAFunctionTakeTheBetweenClass) {
  auto b = build(
      "record c.c\n"
      "function f line=1 calls=1\n"
      "block 2 hits=1\n"
      "block 5 hits=1\n"
      "block 6 hits=0\n"
      "block 9 hits=0\n"
      "function g line=12 calls=1\n"
      "block 13 hits=0\n");
  ASSERT_EQ(b->rc, allOK);
  const auto& ls = onlyFile(*b->root).lineStates;
  std::string classes;
  for (std::size_t i = 0; i < ls.size(); ++i) classes += char('0' + ls[i].actualClass);
  // line:     1 2 3 4 5 6 7 8 9 10 11 12 13
  EXPECT_EQ(classes, "1233245541114");
}

TEST(SummaryTree, DirectoriesAndFilesAreGroupedAndNativeOrderIsTheRecordOrder) {
  auto b = build(
      "record z/b.c\nfunction f line=1\nblock 1\n"
      "record a/c.c\nfunction f line=1\nblock 1 hits=1\n"
      "record z/a.c\nfunction f line=1\nblock 1\n"
      "record top.c\nfunction f line=1\nblock 1\n",
      {}, 2);
  ASSERT_EQ(b->rc, allOK);
  const SumRoot& r = *b->root;
  EXPECT_EQ(r.dirs, 3u);
  EXPECT_EQ(r.files, 4u);
  // Array order is by name; native order by the first record of each directory.
  EXPECT_STREQ(r.dirRecords[0].name, "**no_directory_provided**/");
  EXPECT_EQ(dirNames(r), (std::vector<std::string>{"z/", "a/", "**no_directory_provided**/"}));
  EXPECT_EQ(fileNames(*r.dirOrder[0]), (std::vector<std::string>{"b.c", "a.c"}));
  EXPECT_EQ(findSumFile(*b->root, "z/a.c"), &r.dirOrder[0]->fileRecords[0]);
  EXPECT_EQ(findSumFile(*b->root, "top.c"), nullptr);
  EXPECT_NE(findSumFile(*b->root, "**no_directory_provided**/top.c"), nullptr);
  EXPECT_EQ(findSumFile(*b->root, "z/"), nullptr);
}

TEST(SummaryTree, LinesFarAboveTheRestCostNothingForTheGap) {
  for (const char* text : {"record s/a.c\nfunction f line=1\nblock 0x0FFFFFF0\n",
                           "record s/a.c\nfunction f line=50000000\n",
                           "record s/a.c\nfunction f line=0x0FFFFFFF\n"}) {
    auto b = build(text, adjustments("s/a.c", adjRangeDead, 2, 40000000));
    ASSERT_EQ(b->rc, allOK) << text;
    const SumFile& f = onlyFile(*b->root);
    EXPECT_GE(f.lineCount, 50000000u) << text;
    EXPECT_LT(f.lineStates.segments(), 8u) << text;
    // The far line is there with its state.
    const LineState& last = f.lineStates[f.lineCount - 1];
    EXPECT_TRUE(last.flags & (LineHasCode | LineFuncStart | LineFuncEnd)) << text;
    EXPECT_EQ(f.lineStates[30000000].flags & adjAnyMask, adjRangeDead & adjAnyMask) << text;
  }
}

TEST(SummaryTree, BadMapsGiveCorruptDataAndNoTree) {
  for (const char* text :
       {"record a.c\nblock 3\n",                              // a block outside a function
        "record a.c\nfunction f line=1\nblock 2\nentry 2 0\n",  // a file entry among blocks
        "record a.c\nfunction f line=1\nblockline 2\n"}) {     // blocks start with a line
    auto b = build(text);
    EXPECT_EQ(b->rc, corruptKgvFile) << text;
    EXPECT_EQ(b->root, nullptr);
  }
}

TEST(SummaryTree, ABlockLineBeforeItsBlockNeverMakesTheSortedDataUnreadable) {
  const char text[] =
      "record s.c\n"
      "function f line=1 calls=1\n"
      "block 5 hits=5\n"
      "blockline 3\n"
      "block 4 hits=0\n";
  auto b = build(text);
  ASSERT_EQ(b->rc, allOK);
  const ObjRecord& rec = *b->data->records[0];
  EXPECT_EQ(kgtest::describeMap(rec), "F:s.c:1 fn:f:1 fl:1:0 b:4:0 bl:3:0 b:5:5 ");
  std::unique_ptr<SumRoot> again;
  ASSERT_EQ(buildSummary(*b->data, 1, hitsMax, {}, gMessages, again), allOK);
  EXPECT_EQ(kgtest::describeMap(rec), "F:s.c:1 fn:f:1 fl:1:0 b:4:0 bl:3:0 b:5:5 ");
  EXPECT_EQ(recomputeSummary(*again, hitsMax, {}, gMessages), allOK);
}

TEST(SummaryTree, BlocksOutOfOrderAreSortedOnceInTheData) {
  const char text[] =
      "record s.c\n"
      "function f line=1 calls=1\n"
      "block 5 hits=5\n"
      "block 3 hits=3\n"
      "blockline 4\n"
      "block 3 hits=7\n";
  auto b = build(text);
  ASSERT_EQ(b->rc, allOK);
  const ObjRecord& rec = *b->data->records[0];
  EXPECT_EQ(kgtest::describeMap(rec), "F:s.c:1 fn:f:1 fl:1:0 b:3:3 b:3:7 bl:4:0 b:5:5 ");
  const SumFile& f = onlyFile(*b->root);
  EXPECT_EQ(f.lineStates[2].count, 7u);  // two blocks on line 3, the larger
  EXPECT_EQ(f.functions[0].firstLine, 3u);
  EXPECT_EQ(f.functions[0].lastLine, 5u);
  // Stable: a second build over the sorted data leaves the map alone.
  std::string once = kgtest::describeMap(rec);
  std::unique_ptr<SumRoot> again;
  ASSERT_EQ(buildSummary(*b->data, 1, hitsMax, {}, gMessages, again), allOK);
  EXPECT_EQ(kgtest::describeMap(rec), once);
}

namespace {

// Files whose counts make the ratio orders interesting: "empty.c" has no lines at all.
const char kRatios[] =
    "record d/half.c\nfunction f line=1 calls=1\nblock 2 hits=1\nblock 3 hits=0\n"
    "record d/empty.c\nfunction g calls=1\n"
    "record d/full.c\nfunction h line=1 calls=1\nblock 2 hits=1\nblock 3 hits=1\nblock 4 hits=1\n"
    "record d/none.c\nfunction k line=1 calls=0\nblock 2 hits=0\n";

std::vector<std::string> order(std::uint32_t id) {
  std::uint32_t parsed = 0;
  EXPECT_EQ(sort_order_by_name(sort_order_name(id), parsed), allOK);
  auto b = build(kRatios, {}, parsed);
  EXPECT_EQ(b->rc, allOK);
  return fileNames(*b->root->dirOrder[0]);
}

}  // namespace

TEST(SummarySort, RatioOrdersPutItemsWithoutLinesOrBlocksFirstForUsedAndLastForUnused) {
  const std::vector<std::string> usedFirst = {"empty.c", "full.c", "half.c", "none.c"};
  const std::vector<std::string> unusedFirst = {"none.c", "half.c", "full.c", "empty.c"};
  for (std::uint32_t id : {5u, 10u, 15u}) EXPECT_EQ(order(id), usedFirst) << sort_order_name(id);
  for (std::uint32_t id : {7u, 12u, 17u}) EXPECT_EQ(order(id), unusedFirst) << sort_order_name(id);
}

TEST(SummarySort, CountOrdersAreDescendingAndEqualCountsGoByName) {
  EXPECT_EQ(order(1), (std::vector<std::string>{"empty.c", "full.c", "half.c", "none.c"}));
  EXPECT_EQ(order(2), (std::vector<std::string>{"half.c", "empty.c", "full.c", "none.c"}));
  EXPECT_EQ(order(3), (std::vector<std::string>{"full.c", "half.c", "none.c", "empty.c"}));
  EXPECT_EQ(order(4), (std::vector<std::string>{"full.c", "half.c", "empty.c", "none.c"}));
  // half and none both have one unused line; full and empty none.
  EXPECT_EQ(order(6), (std::vector<std::string>{"half.c", "none.c", "empty.c", "full.c"}));
  EXPECT_EQ(order(16), (std::vector<std::string>{"half.c", "none.c", "empty.c", "full.c"}));
}

TEST(SummarySort, FunctionsOfEqualNameAndCountsGoByTheirPlaceInTheMap) {
  auto b = build(
      "record t.c\n"
      "function f line=1 calls=1\nblock 2 hits=0\n"
      "function b line=5 calls=1\nblock 6 hits=1\n"
      "function f line=9 calls=1\nblock 10 hits=0\n",
      {}, 6);
  ASSERT_EQ(b->rc, allOK);
  const SumFile& f = onlyFile(*b->root);
  ASSERT_EQ(f.funcOrder.size(), 3u);
  EXPECT_EQ(f.funcOrder[0], &f.functions[0]);
  EXPECT_EQ(f.funcOrder[1], &f.functions[2]);
  EXPECT_EQ(f.funcOrder[2], &f.functions[1]);
  // Re-sorting by name keeps the two "f" in map order.
  ASSERT_EQ(sortSummary(*b->root, 1), allOK);
  EXPECT_EQ(b->root->sortOrder, 1u);
  EXPECT_EQ(f.funcOrder[0], &f.functions[1]);
  EXPECT_EQ(f.funcOrder[1], &f.functions[0]);
  EXPECT_EQ(f.funcOrder[2], &f.functions[2]);
}

TEST(SummarySort, FunctionsOfEqualCountsGoByTheirNamesBytesWhateverTheirLengths) {
  // Names alike in their first eight bytes and beyond, shorter and longer, a byte above 127,
  // and two of one name; every function has the same counts. Then all of them with a long
  // part in common in front.
  const std::vector<std::string> plain = {"abcdefghij", "abcdefgh", "zz", "abcdefgi", "abcdefghi", "a",
                                          "abcdefg", "\xc3\xa9t\xc3\xa9", "abcdefgh2", "ABCDEFGH", "abcdefghij", "abcdefgh10"};
  for (const std::string& shared : {std::string(), std::string("mylib::detail::"), std::string("abcdefg")}) {
    std::vector<std::string> names;
    for (const std::string& n : plain) names.push_back(shared + n);
    std::string text = "record t.c\n";
    for (std::size_t k = 0; k < names.size(); ++k)
      text += "function " + names[k] + " line=" + std::to_string(10 * k + 1) + " calls=1\nblock " +
              std::to_string(10 * k + 2) + " hits=0\n";
    auto b = build(text);
    ASSERT_EQ(b->rc, allOK);
    const SumFile& f = onlyFile(*b->root);
    ASSERT_EQ(f.functions.size(), names.size());
    // By bytes (as unsigned), then by place in the map.
    std::vector<std::size_t> byName(names.size());
    for (std::size_t k = 0; k < byName.size(); ++k) byName[k] = k;
    std::stable_sort(byName.begin(), byName.end(), [&](std::size_t x, std::size_t y) { return names[x] < names[y]; });
    for (std::uint32_t id = 1; id <= 17; ++id) {
      ASSERT_EQ(sortSummary(*b->root, id), allOK);
      for (std::size_t k = 0; k < names.size(); ++k) {
        const std::size_t expected = id == 2 ? k : byName[k];  // native order first
        EXPECT_EQ(f.funcOrder[k], &f.functions[expected]) << sort_order_name(id) << " place " << k << " " << shared;
      }
    }
  }
}

TEST(SummarySort, NamesIdsAndLabels) {
  std::uint32_t id = 0;
  EXPECT_EQ(sort_order_by_name("l_used%", id), allOK);
  EXPECT_EQ(id, 5u);
  EXPECT_STREQ(sort_order_name(5), "l_used%");
  EXPECT_STREQ(sort_order_label(12), "Adjusted percent of lines unused");
  EXPECT_EQ(sort_order_by_name("Alpha", id), invalidSortingOrder);
  EXPECT_EQ(id, 11u);
  EXPECT_EQ(sort_order_by_name("", id), invalidSortingOrder);
  EXPECT_EQ(sort_order_by_name(nullptr, id), invalidSortingOrder);
  EXPECT_STREQ(sort_order_name(18), "");
  for (std::uint32_t i = 1; i <= 17; ++i) {
    ASSERT_EQ(sort_order_by_name(sort_order_name(i), id), allOK);
    EXPECT_EQ(id, i);
  }
  ASSERT_EQ(sortOrderNameTable().size(), 18u);
  EXPECT_STREQ(sortOrderNameTable()[4].name, "l_unused");
  EXPECT_STREQ(sortOrderNameTable()[17].name, "");
}

TEST(SummaryViewState, ARebuildKeepsTheStateOfRowsThatStillExist) {
  auto old = build(
      "record a/x.c\nfunction f line=1\nblock 1\nfunction g line=3\nblock 3\n"
      "record b/y.c\nfunction h line=1\nblock 1\n");
  ASSERT_EQ(old->rc, allOK);
  SumRoot& o = *old->root;
  setViewState(o, 0);
  o.viewState = 1;
  o.dirRecords[0].viewState = 1;                   // a/ expanded
  o.dirRecords[0].fileRecords[0].viewState = 1;    // x.c expanded
  o.dirRecords[0].fileRecords[0].functions[1].viewState = 5;  // g
  auto fresh = build(
      "record c/new.c\nfunction n line=1\nblock 1\n"
      "record a/x.c\nfunction g line=3\nblock 3\nfunction z line=7\nblock 7\n"
      "record b/y.c\nfunction h line=1\nblock 1\n",
      {}, 3);
  ASSERT_EQ(fresh->rc, allOK);
  SumRoot& n = *fresh->root;
  setViewState(n, 9);
  carryViewState(&n, &o, 0);
  EXPECT_EQ(n.viewState, 1u);
  SumFile* x = findSumFile(n, "a/x.c");
  ASSERT_NE(x, nullptr);
  EXPECT_EQ(x->dir->viewState, 1u);
  EXPECT_EQ(x->viewState, 1u);
  EXPECT_EQ(x->functions[0].viewState, 5u);  // g kept its state
  EXPECT_EQ(x->functions[1].viewState, 0u);  // z is new
  SumFile* created = findSumFile(n, "c/new.c");
  EXPECT_EQ(created->dir->viewState, 0u);    // a new directory gets the default
  EXPECT_EQ(created->viewState, 9u);         // and its rows keep what they had
  carryViewState(&n, nullptr, 4);
  EXPECT_EQ(created->functions[0].viewState, 4u);
  carryViewState(nullptr, &o, 4);  // nothing to do
}

TEST(SummaryTree, TimesAndTotalsAddUpThroughTheLevels) {
  auto b = build(
      "record p/a.c first=100 last=200 sessions=2\nfunction f line=1 calls=0\nblock 1\n"
      "record p/b.c first=50 last=150\nfunction g line=1 calls=3\nblock 1 hits=1\n"
      "record q.c first=300 last=400\n");
  ASSERT_EQ(b->rc, allOK);
  const SumRoot& r = *b->root;
  EXPECT_EQ(r.firstTime, 50u);
  EXPECT_EQ(r.lastTime, 400u);
  EXPECT_EQ(r.funcs, 2u);
  EXPECT_EQ(r.unusedFuncs, 1u);
  EXPECT_EQ(r.counts.lines, 2u);
  EXPECT_EQ(r.counts.unusedLines, 1u);
  const SumFile* a = findSumFile(*b->root, "p/a.c");
  ASSERT_NE(a, nullptr);
  EXPECT_EQ(a->sessions, 2u);
  EXPECT_EQ(a->dir->firstTime, 50u);
  EXPECT_EQ(a->dir->lastTime, 200u);
}

namespace {

// A record with a random map: mostly plausible entries, some of any tag, lines up to the
// largest a map can hold, counts of any size.
std::unique_ptr<ObjRecord> randomRecord(std::mt19937& rng, int n) {
  auto r = std::make_unique<ObjRecord>();
  std::string names = "d" + std::to_string(n % 3) + "/f" + std::to_string(n % 5) + ".c";
  names.push_back('\0');
  names += "fn";
  names.push_back('\0');
  r->strings.assign(names.begin(), names.end());
  r->fileNameOffset = 0;
  std::uniform_int_distribution<int> pick(0, 99);
  std::uniform_int_distribution<std::uint32_t> any(0, 0x0FFFFFFF);
  std::uniform_int_distribution<std::uint32_t> small(0, 60);
  auto add = [&](std::uint32_t tag, std::uint32_t value) {
    r->map.push_back(makeMapEntry(tag, value));
    r->counts.push_back(static_cast<std::uint16_t>(pick(rng) < 40 ? 0 : any(rng)));
  };
  if (pick(rng) < 98) add(TagFile, 0);
  int functions = pick(rng) % 5;
  for (int f = 0; f < functions; ++f) {
    add(TagFunction, pick(rng) < 2 ? any(rng) : std::uint32_t(names.find("fn")));
    if (pick(rng) < 80) add(TagFuncLine, pick(rng) < 2 ? any(rng) : small(rng));
    int blocks = pick(rng) % 7;
    for (int b = 0; b < blocks; ++b) {
      int p = pick(rng);
      if (p < 2) add(std::uint32_t(pick(rng) % 16), any(rng));   // anything at all
      else if (p < 4) add(TagEmpty, 0);
      else if (p < 6) add(TagBlock, any(rng));                     // a line far away
      else add(b == 0 || p < 70 ? TagBlock : TagBlockLine, small(rng));
    }
  }
  r->objHeader.mapCount = static_cast<std::uint32_t>(r->map.size());
  return r;
}

// The export report of a tree, as of a fixed time.
std::string exportText(const SumRoot& root) {
  char* text = nullptr;
  std::size_t size = 0;
  FILE* out = open_memstream(&text, &size);
  EXPECT_NE(out, nullptr);
  if (!out) return "";
  EXPECT_EQ(writeExport(out, root, 1700000000, gMessages), allOK);
  fclose(out);
  std::string s(text, size);
  free(text);
  return s;
}

// "" when both trees have the same counts in every row, else where they differ.
std::string sameFigures(const SumRoot& a, const SumRoot& b) {
  auto same = [](const SumCounts& x, const SumCounts& y) {
    return x.lines == y.lines && x.unusedLines == y.unusedLines && x.blocks == y.blocks &&
           x.unusedBlocks == y.unusedBlocks && x.deadLines == y.deadLines && x.testedLines == y.testedLines &&
           x.inspectedLines == y.inspectedLines && x.adjLines == y.adjLines && x.adjUnusedLines == y.adjUnusedLines;
  };
  if (!same(a.counts, b.counts) || a.funcs != b.funcs || a.unusedFuncs != b.unusedFuncs) return "total";
  if (a.dirRecords.size() != b.dirRecords.size()) return "directories";
  for (std::size_t d = 0; d < a.dirRecords.size(); ++d) {
    const SumDir &x = a.dirRecords[d], &y = b.dirRecords[d];
    if (!same(x.counts, y.counts) || x.fileRecords.size() != y.fileRecords.size()) return x.name;
    for (std::size_t f = 0; f < x.fileRecords.size(); ++f) {
      const SumFile &p = x.fileRecords[f], &q = y.fileRecords[f];
      if (!same(p.counts, q.counts) || p.lineCount != q.lineCount || p.functions.size() != q.functions.size())
        return p.name;
      for (std::size_t k = 0; k < p.functions.size(); ++k) {
        if (!same(p.functions[k].counts, q.functions[k].counts)) return p.functions[k].name;
        // And the same order.
        if (p.funcOrder[k]->nativeIndex != q.funcOrder[k]->nativeIndex) return std::string("order in ") + p.name;
      }
    }
  }
  for (std::size_t d = 0; d < a.dirOrder.size(); ++d) {
    if (std::string(a.dirOrder[d]->name) != b.dirOrder[d]->name) return "directory order";
    for (std::size_t f = 0; f < a.dirOrder[d]->fileOrder.size(); ++f)
      if (std::string(a.dirOrder[d]->fileOrder[f]->name) != b.dirOrder[d]->fileOrder[f]->name) return "file order";
  }
  return "";
}

}  // namespace

TEST(SummaryTree, DamagedMapsGiveCorruptDataOrATreeButNeverACrash) {
  std::mt19937 rng(12345);
  AdjustmentList adj = adjustments("d1/f1.c", adjRangeDead, 3, 20);
  int trees = 0, corrupt = 0;
  for (int round = 0; round < 400; ++round) {
    KgvData data;
    for (int k = 0; k < 4; ++k) data.records.push_back(randomRecord(rng, round + k));
    std::unique_ptr<SumRoot> root;
    ErrorCode rc = buildSummary(data, 1 + round % 17, 1 + round % 4, adj, gMessages, root);
    if (rc == allOK) {
      ++trees;
      ASSERT_NE(root, nullptr);
      for (const SumDir& d : root->dirRecords)
        for (const SumFile& f : d.fileRecords) {
          ASSERT_EQ(f.lineStates.size(), f.lineCount);
          for (const SumFunc& fn : f.functions) ASSERT_LE(fn.lastLine, f.lineCount);
          // Segments classify as the same lines one by one would.
          if (f.lineStates.size() > (1u << 20)) continue;
          const std::vector<LineState> segmented = f.lineStates.dense(f.lineStates.size());
          std::vector<LineState> lineByLine = segmented;
          for (LineState& s : lineByLine) s.actualClass = s.adjustedClass = 0;
          classifyLines(lineByLine);
          for (std::size_t i = 0; i < lineByLine.size(); ++i) {
            ASSERT_EQ(segmented[i].actualClass, lineByLine[i].actualClass) << f.name << " line " << i + 1;
            ASSERT_EQ(segmented[i].adjustedClass, lineByLine[i].adjustedClass) << f.name << " line " << i + 1;
          }
        }
      // Counted on several threads, every row has the same figures.
      setSummaryThreadThreshold(0);
      std::unique_ptr<SumRoot> threaded;
      ErrorCode threadedRc = buildSummary(data, 1 + round % 17, 1 + round % 4, adj, gMessages, threaded);
      setSummaryThreadThreshold(std::size_t(4) << 20);
      ASSERT_EQ(threadedRc, allOK);
      ASSERT_EQ(sameFigures(*root, *threaded), "");
      ASSERT_EQ(recomputeSummary(*root, hitsMin, AdjustmentList{}, gMessages), allOK);
      // A second build over the data as the first one left it succeeds too.
      std::unique_ptr<SumRoot> again;
      ASSERT_EQ(buildSummary(data, 1, hitsMax, adj, gMessages, again), allOK);
      // And the report is written from either tree, the second making line states as it goes.
      std::unique_ptr<SumRoot> lazy;
      ASSERT_EQ(buildSummary(data, 1, hitsMax, adj, gMessages, lazy, false), allOK);
      // Made on request, a file's line states are those the full build keeps, and a recount
      // of the tree that keeps none makes none.
      LazyLineStates onRequest(adj, hitsMax, gMessages);
      for (std::size_t d = 0; d < again->dirRecords.size(); ++d)
        for (std::size_t k = 0; k < again->dirRecords[d].fileRecords.size(); ++k) {
          const SumFile& kept = again->dirRecords[d].fileRecords[k];
          const SumFile& made = lazy->dirRecords[d].fileRecords[k];
          if (kept.lineStates.size() > (1u << 20)) continue;
          const std::vector<LineState> a = kept.lineStates.dense(kept.lineStates.size());
          const std::vector<LineState> b = onRequest.of(made).dense(kept.lineStates.size());
          ASSERT_EQ(a.size(), b.size()) << kept.name;
          for (std::size_t i = 0; i < a.size(); ++i)
            ASSERT_TRUE(a[i].flags == b[i].flags && a[i].count == b[i].count && a[i].actualClass == b[i].actualClass &&
                        a[i].adjustedClass == b[i].adjustedClass)
                << kept.name << " line " << i + 1;
          // Packed for a report, lines with code carry the same hits and adjustments.
          const std::vector<std::uint32_t>& packed = onRequest.packed(made);
          if (packed.empty()) continue;
          ASSERT_EQ(packed.size(), a.size() + 1) << kept.name;
          for (std::size_t i = 0; i < a.size(); ++i) {
            const std::uint32_t flags = packed[i + 1] >> 16;
            ASSERT_EQ(flags & LineHasCode, a[i].flags & LineHasCode) << kept.name << " line " << i + 1;
            if (!(flags & LineHasCode)) continue;
            ASSERT_EQ(flags & adjAnyMask, a[i].flags & adjAnyMask) << kept.name << " line " << i + 1;
            ASSERT_EQ(packed[i + 1] & 0xFFFF, a[i].count) << kept.name << " line " << i + 1;
          }
        }
      ASSERT_EQ(recomputeSummary(*lazy, hitsMax, adj, gMessages), allOK);
      for (const SumDir& d : lazy->dirRecords)
        for (const SumFile& f : d.fileRecords) ASSERT_TRUE(f.lineStates.empty());
      // Formatted on several threads, the report is the same text.
      const std::string serial = exportText(*again);
      setSummaryThreadThreshold(0);
      const std::string parallel = exportText(*again);
      setSummaryThreadThreshold(std::size_t(4) << 20);
      ASSERT_EQ(serial, parallel);
      // Written from states made file by file, packed or in segments, it is the same text too.
      AdjustmentList savedList = std::move(adjustmentList());
      adjustmentList() = adjustments("d1/f1.c", adjRangeDead, 3, 20);
      const std::string fromKept = exportText(*again);
      const std::string fromLazy = exportText(*lazy);
      adjustmentList() = std::move(savedList);
      ASSERT_EQ(fromKept, fromLazy);
      FILE* sink = fopen("/dev/null", "w");
      ASSERT_NE(sink, nullptr);
      EXPECT_EQ(writeExport(sink, *again, gMessages), allOK);
      EXPECT_EQ(writeExport(sink, *lazy, gMessages), allOK);
      fclose(sink);
    } else {
      ++corrupt;
      ASSERT_EQ(rc, corruptKgvFile);
      ASSERT_EQ(root, nullptr);
    }
  }
  EXPECT_GT(trees, 20);
  EXPECT_GT(corrupt, 20);
}
