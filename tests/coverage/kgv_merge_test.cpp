// Loading several data files and merging them: counts add up, the newest version wins or
// both versions are merged line by line, Java and C/C++ data stay apart.
#include <gtest/gtest.h>

#include <ctime>

#include "coverage/kgv_load.h"
#include "coverage/kgv_lock.h"
#include "coverage/kgv_merge.h"
#include "tests/coverage/kgv_test_util.h"

using namespace kgtest;

namespace {

const char* const kOld = R"(
clockTime 10
cpuTime 4
record s.c signature=1 build=100 first=1000 last=2000
function alpha line=10 calls=2
block 11 hits=2
block 12 hits=0
function gamma line=30 calls=1
block 31 hits=1
)";

const char* const kNew = R"(
clockTime 5
cpuTime 1
record s.c signature=2 build=200 first=1500 last=2500
function alpha line=10 calls=3
block 11 hits=1
blockline 13
function beta line=20 calls=5
block 21 hits=5
)";

struct Loaded {
  ErrorCode rc = 0;
  std::unique_ptr<KgvData> data;
  std::vector<std::string> ignored;
  MessageList messages;
  size_t count = 0;
};

Loaded loadAll(const std::vector<std::string>& paths, std::uint32_t mode) {
  std::vector<KgvFileRef> refs;
  for (const auto& p : paths) refs.push_back(makeKgvFileRef(p));
  Loaded l;
  l.rc = loadAllKgvFiles(refs, mode, &l.ignored, l.messages, l.data, l.count);
  if (l.rc == allOK || l.rc == mergeIgnored) {
    for (const auto& r : refs) EXPECT_NE(r.loadTime, 0u) << "a loaded file knows when it was read";
  }
  return l;
}

const ObjRecord* recordNamed(const KgvData& d, const std::string& name) {
  for (const auto& r : d.records)
    if (name == r->fileName()) return r.get();
  return nullptr;
}

}  // namespace

TEST(Merging, RunsOfTheSameProgramAddUpAndStopAtTenThousand) {
  TempDir dir;
  const char* run = R"(
record s.c signature=7 build=100 first=%FIRST% last=%LAST% sessions=1
function f line=1 calls=6000
block 2 hits=6000
blockline 3
block 4 hits=1
)";
  auto text = [&](const char* first, const char* last) {
    std::string t = run;
    t.replace(t.find("%FIRST%"), 7, first);
    t.replace(t.find("%LAST%"), 6, last);
    return t;
  };
  std::string a = makeKgv(dir, "a.kgv", "clockTime 7\ncpuTime 3\n" + text("1000", "2000"));
  std::string b = makeKgv(dir, "b.kgv", "clockTime 8\ncpuTime 2\n" + text("0", "3000"));
  Loaded l = loadAll({a, b}, kMergeNewestWins);
  ASSERT_EQ(l.rc, allOK);
  EXPECT_EQ(l.count, 2u);
  ASSERT_EQ(l.data->records.size(), 1u);
  const ObjRecord& r = *l.data->records[0];
  EXPECT_EQ(describeMap(r), "F:s.c:2 fn:f:10000 fl:1:0 b:2:10000 bl:3:0 b:4:2 ");
  EXPECT_EQ(r.objHeader.firstTime, 1000u);  // an unknown time does not count as earlier
  EXPECT_EQ(r.objHeader.lastTime, 3000u);
  EXPECT_EQ(l.data->header.clockTime, 15u);
  EXPECT_EQ(l.data->header.cpuTime, 5u);
  EXPECT_EQ(l.data->header.recordCount, 1u);
  EXPECT_TRUE(l.ignored.empty());
  EXPECT_TRUE(filesIn(dir.path()).size() == 2) << "the locks are gone";
}

TEST(Merging, RunsWrittenInBothByteOrdersAddUp) {
  TempDir dir;
  const char* run = "clockTime 3\nrecord s.c signature=7 build=100 first=50 last=60\n"
                    "function f line=1 calls=2\nblock 2 hits=2\nblockline 3\nblock 5 hits=0\n";
  std::string native = makeKgv(dir, "a.kgv", run);
  std::string swapped = makeKgv(dir, "b.kgv", std::string("order swapped\n") + run);
  std::string newer = makeKgv(dir, "c.kgv", "order swapped\nrecord s.c signature=8 build=300\n"
                                            "function g line=9 calls=1\n");
  for (auto order : {std::vector<std::string>{native, swapped}, std::vector<std::string>{swapped, native}}) {
    Loaded l = loadAll(order, kMergeNewestWins);
    ASSERT_EQ(l.rc, allOK);
    EXPECT_EQ(describeMap(*l.data->records[0]), "F:s.c:2 fn:f:4 fl:1:0 b:2:4 bl:3:0 b:5:0 ");
    EXPECT_EQ(l.data->header.clockTime, 6u);
  }
  Loaded l = loadAll({native, swapped, newer}, kMergeNewestWins);
  ASSERT_EQ(l.rc, mergeIgnored);
  EXPECT_EQ(describeMap(*l.data->records[0]), "F:s.c:1 fn:g:1 fl:9:0 ");
}

TEST(Merging, HitFlagsStayFlags) {
  TempDir dir;
  const char* flags = "hitFlags 1\nrecord s.c signature=7\nfunction f line=1 calls=1\nblock 2 hits=1\nblock 3 hits=0\n";
  std::string a = makeKgv(dir, "a.kgv", flags);
  std::string b = makeKgv(dir, "b.kgv", flags);
  std::string c = makeKgv(dir, "c.kgv", flags);
  Loaded l = loadAll({a, b, c}, kMergeNewestWins);
  ASSERT_EQ(l.rc, allOK);
  EXPECT_EQ(describeMap(*l.data->records[0]), "F:s.c:1 fn:f:1 fl:1:0 b:2:1 b:3:0 ");
}

TEST(Merging, WhereOneRunSplitsABlockBothSidesUseTheBlockCount) {
  KgvData x, r;
  for (KgvData* d : {&x, &r}) d->records.push_back(std::make_unique<ObjRecord>());
  auto fill = [](ObjRecord& rec, std::uint32_t secondTag, std::uint16_t first, std::uint16_t second) {
    rec.strings = {'s', '.', 'c', '\0'};
    rec.objHeader.signature = 9;
    rec.map = {makeMapEntry(TagFile, 0), makeMapEntry(TagBlock, 5), makeMapEntry(secondTag, 6)};
    rec.counts = {1, first, second};
  };
  fill(*x.records[0], TagBlockLine, 4, 0);  // line 6 belongs to the block of line 5
  fill(*r.records[0], TagBlock, 3, 2);      // here line 6 is a block of its own
  MessageList messages;
  ASSERT_EQ(mergeKgvData(kMergeNewestWins, x, r, nullptr, messages), allOK);
  EXPECT_EQ(describeMap(*x.records[0]), "F:s.c:2 b:5:7 b:6:6 ");
}

TEST(Merging, TheNewestVersionWinsWhicheverFileComesFirst) {
  TempDir dir;
  std::string oldFile = makeKgv(dir, "old.kgv", kOld);
  std::string newFile = makeKgv(dir, "new.kgv", kNew + std::string("record other.c\nfunction o line=1\n"));
  for (auto order : {std::vector<std::string>{oldFile, newFile}, std::vector<std::string>{newFile, oldFile}}) {
    Loaded l = loadAll(order, kMergeNewestWins);
    ASSERT_EQ(l.rc, mergeIgnored);
    ASSERT_EQ(l.data->records.size(), 2u);
    const ObjRecord* s = recordNamed(*l.data, "s.c");
    ASSERT_TRUE(s);
    EXPECT_EQ(s->objHeader.buildTime, 200u);
    EXPECT_EQ(describeMap(*s), "F:s.c:1 fn:alpha:3 fl:10:0 b:11:1 bl:13:0 fn:beta:5 fl:20:0 b:21:5 ");
    EXPECT_EQ(l.ignored, std::vector<std::string>{"s.c"});
    EXPECT_EQ(l.data->mergeMode, kMergeNewestWins);
  }
  // The kept record stays in the place of the first file's record.
  Loaded l = loadAll({oldFile, newFile}, kMergeNewestWins);
  EXPECT_STREQ(l.data->records[0]->fileName(), "s.c");
}

TEST(Merging, ForceMergeOrdersTheFunctionsOfBothVersionsByLine) {
  TempDir dir;
  std::string oldFile = makeKgv(dir, "old.kgv", kOld);
  std::string newFile = makeKgv(dir, "new.kgv", kNew);
  time_t before = time(nullptr);
  Loaded l = loadAll({oldFile, newFile}, kMergeForce);
  ASSERT_EQ(l.rc, allOK);
  ASSERT_EQ(l.data->records.size(), 1u);
  const ObjRecord& r = *l.data->records[0];
  EXPECT_EQ(describeMap(r),
            "F:s.c:2 fn:alpha:5 fl:10:0 b:11:3 b:12:0 b:13:1 fn:beta:5 fl:20:0 b:21:5 "
            "fn:gamma:1 fl:30:0 b:31:1 ");
  EXPECT_EQ(r.objHeader.signature, 0u);
  EXPECT_GE(r.objHeader.buildTime, static_cast<std::uint32_t>(before));
  EXPECT_EQ(r.objHeader.firstTime, 1000u);
  EXPECT_EQ(r.objHeader.lastTime, 2500u);
  EXPECT_EQ(l.data->mergeMode, kMergeForce);
  EXPECT_TRUE(l.ignored.empty());
  // The new string area holds each name once, sorted.
  EXPECT_EQ(std::string(r.strings.data(), r.strings.size()),
            std::string("alpha\0beta\0gamma\0s.c\0\0\0\0", 24));

  // The merged data written out read back the same, and a third version merges in too.
  ASSERT_EQ(writeKgvFile(dir.file("merged.kgv"), *l.data), allOK);
  std::string third = makeKgv(dir, "third.kgv", R"(
record s.c signature=3 build=50
function delta line=25 calls=1
block 26 hits=1
blockline 27
function gamma line=30 calls=2
block 31 hits=1
blockline 32
)");
  Loaded again = loadAll({dir.file("merged.kgv"), third}, kMergeForce);
  ASSERT_EQ(again.rc, allOK);
  EXPECT_EQ(describeMap(*again.data->records[0]),
            "F:s.c:3 fn:alpha:5 fl:10:0 b:11:3 b:12:0 b:13:1 fn:beta:5 fl:20:0 b:21:5 "
            "fn:delta:1 fl:25:0 b:26:1 bl:27:0 fn:gamma:3 fl:30:0 b:31:2 b:32:1 ");
}

TEST(Merging, OneSourceCapturedWithDifferentLinesIsCombinedLineByLineInEitherOrder) {
  // A header inlined differently by two programs: the same source (signature), two maps.
  TempDir dir;
  std::string lib = makeKgv(dir, "lib.kgv", R"(
record inc/h.h signature=77 build=300 first=1000 last=2000
function get line=5 calls=4
block 6 hits=4
function put line=10 calls=1
block 11 hits=1
block 12 hits=0
)");
  std::string tests = makeKgv(dir, "tests.kgv", R"(
record inc/h.h signature=77 build=300 first=1500 last=2500
function get line=5 calls=2
block 6 hits=2
function size line=20 calls=3
block 21 hits=3
)");
  const std::string combined = "F:inc/h.h:2 fn:get:6 fl:5:0 b:6:6 fn:put:1 fl:10:0 b:11:1 b:12:0 "
                               "fn:size:3 fl:20:0 b:21:3 ";
  for (auto order : {std::vector<std::string>{lib, tests}, std::vector<std::string>{tests, lib}}) {
    Loaded l = loadAll(order, kMergeNewestWins);
    ASSERT_EQ(l.rc, allOK) << "nothing is set aside";
    EXPECT_TRUE(l.ignored.empty());
    ASSERT_EQ(l.data->records.size(), 1u);
    const ObjRecord& r = *l.data->records[0];
    EXPECT_EQ(describeMap(r), combined);
    EXPECT_EQ(r.objHeader.signature, 77u) << "still the same source";
    EXPECT_EQ(r.objHeader.buildTime, 300u);
    // A third capture of the same source merges in as well.
    ASSERT_EQ(writeKgvFile(dir.file("both.kgv"), *l.data), allOK);
    Loaded again = loadAll({dir.file("both.kgv"), tests}, kMergeNewestWins);
    ASSERT_EQ(again.rc, allOK);
    EXPECT_EQ(describeMap(*again.data->records[0]),
              "F:inc/h.h:3 fn:get:8 fl:5:0 b:6:8 fn:put:1 fl:10:0 b:11:1 b:12:0 "
              "fn:size:6 fl:20:0 b:21:6 ");
  }
}

TEST(Merging, MapsOfEqualSizeButOtherLinesAreNotAddedPositionByPosition) {
  TempDir dir;
  std::string a = makeKgv(dir, "a.kgv", R"(
record s.c signature=9 build=100
function f line=1 calls=1
block 2 hits=1
block 3 hits=0
)");
  std::string b = makeKgv(dir, "b.kgv", R"(
record s.c signature=9 build=100
function f line=1 calls=1
block 4 hits=5
block 5 hits=0
)");
  Loaded l = loadAll({a, b}, kMergeNewestWins);
  ASSERT_EQ(l.rc, allOK);
  EXPECT_EQ(describeMap(*l.data->records[0]), "F:s.c:2 fn:f:2 fl:1:0 b:2:1 b:3:0 b:4:5 b:5:0 ");
}

TEST(Merging, JavaDataAfterCDataAreSetAsideWithAWarningToTheCaller) {
  TempDir dir;
  std::string c = makeKgv(dir, "c.kgv", kOld);
  std::string java = makeKgv(dir, "java.kgv", "java 1\nrecord Main.java\nfunction main line=1\n");
  testing::internal::CaptureStderr();
  testing::internal::CaptureStdout();
  Loaded l = loadAll({c, java}, kMergeNewestWins);
  Loaded j = loadAll({java, c}, kMergeNewestWins);
  // The loader itself prints nothing: the warning is the caller's to show.
  EXPECT_EQ(testing::internal::GetCapturedStdout(), "");
  EXPECT_EQ(testing::internal::GetCapturedStderr(), "");

  ASSERT_EQ(l.messages.messages.size(), 1u);
  EXPECT_TRUE(l.messages.messages[0].warning);
  EXPECT_EQ(l.messages.messages[0].text, "Warn: Found Java .kgv files when processing C/C++ .kgv files.\n");
  EXPECT_EQ(l.rc, mergeIgnored);
  ASSERT_EQ(l.data->records.size(), 1u);
  EXPECT_STREQ(l.data->records[0]->fileName(), "s.c");

  ASSERT_EQ(j.messages.messages.size(), 1u);
  EXPECT_EQ(j.messages.messages[0].text, "Warn: Found C/C++ .kgv files when processing Java .kgv files.\n");
  EXPECT_EQ(j.rc, mergeIgnored);
  EXPECT_TRUE(kgvIsJava());
  EXPECT_STREQ(j.data->records[0]->fileName(), "Main.java");

  // Adding a Java file to C data in the window takes the same way.
  auto shown = readOk(c);
  auto added = readOk(java);
  MessageList messages;
  std::unique_ptr<KgvData> copy;
  EXPECT_EQ(mergeKgvDataCopy(kMergeNewestWins, *shown, *added, nullptr, messages, copy), mergeIgnored);
  ASSERT_EQ(messages.messages.size(), 1u);
  EXPECT_EQ(messages.messages[0].text, l.messages.messages[0].text);
}

TEST(Merging, AddingAFileOfNewSourcesAppendsThemInOrder) {
  TempDir dir;
  auto shown = readOk(makeKgv(dir, "a.kgv", kOld));
  auto added = readOk(makeKgv(dir, "b.kgv", "record z.c\nfunction z line=1\nrecord m.c\nfunction m line=1\n"));
  ASSERT_TRUE(shown && added);
  std::unique_ptr<KgvData> copy;
  MessageList messages;
  ASSERT_EQ(mergeKgvDataCopy(kMergeNewestWins, *shown, *added, nullptr, messages, copy), allOK);
  ASSERT_EQ(copy->records.size(), 3u);
  EXPECT_STREQ(copy->records[1]->fileName(), "z.c");
  EXPECT_STREQ(copy->records[2]->fileName(), "m.c");
  EXPECT_EQ(copy->header.recordCount, 3u);
  EXPECT_EQ(copy->recordSizes.size(), 3u);
  EXPECT_EQ(shown->records.size(), 1u);  // the data merged from a copy stay as they were

  ASSERT_EQ(mergeKgvData(kMergeNewestWins, *shown, *added, nullptr, messages), allOK);
  EXPECT_EQ(shown->records.size(), 3u);
  EXPECT_EQ(added->records.size(), 2u);  // the data merged from are never consumed
}

TEST(Merging, AFileThatCannotBeLoadedStopsTheLoadAndIsNamed) {
  TempDir dir;
  std::string good = makeKgv(dir, "good.kgv", kOld);
  writeFile(dir.file("bad.kgv"), std::string(200, 'x'));
  Loaded l = loadAll({good, dir.file("bad.kgv"), good}, kMergeNewestWins);
  EXPECT_EQ(l.rc, notOurFile);
  EXPECT_EQ(l.count, 1u);
  EXPECT_FALSE(l.data);

  std::vector<KgvFileRef> none;
  std::unique_ptr<KgvData> d;
  size_t n = 0;
  MessageList messages;
  EXPECT_EQ(loadAllKgvFiles(none, kMergeNewestWins, nullptr, messages, d, n), noFileName);
}
