// The export report as scripts read it: the whole text of a small data set against a file
// checked by hand, and the guarded writing into pipes and full disks.
#include <gtest/gtest.h>
#include <unistd.h>

#include <csignal>
#include <cstdlib>
#include <ctime>
#include <string>
#include <thread>

#include "adjust/export_report.h"
#include "coverage/summary_build.h"
#include "coverage/summary_sort.h"
#include "support/message_sink.h"
#include "tests/coverage/kgv_test_util.h"

namespace {

// Where the engine's notices go; these tests do not look at them.
MessageList gMessages;

// Two directories; dead, tested and inspected lines; saturated counts; a function without
// a line entry; several blocks on one line.
const char kSmallData[] =
    "record src/calc.c build=10 first=1700000000 last=1700000500 sessions=12000\n"
    "function add line=3 calls=65535\n"
    "block 4 hits=65535\n"
    "block 4 hits=2\n"
    "blockline 5\n"
    "block 6 hits=0\n"
    "block 7 hits=0\n"
    "block 8 hits=0\n"
    "block 9 hits=0\n"
    "function unused line=12 calls=0\n"
    "block 13 hits=0\n"
    "record src/io.c build=10 first=1700000000 last=1700000500\n"
    "function rd line=2 calls=1\n"
    "block 3 hits=1\n"
    "block 4 hits=0\n"
    "function stub calls=1\n"
    "block 20 hits=1\n"
    "record main.c build=10 first=1700000000 last=1700000500 sessions=2\n"
    "function main line=1 calls=2\n"
    "block 2 hits=2\n";

AdjustmentList smallAdjustments() {
  AdjustmentList list;
  auto calc = std::make_unique<CvgAdjustSet>();
  calc->addRange(adjLineDead, 6, 6);       // unused dead: no "li"
  calc->addRange(adjLineTested, 7, 7);     // "TEST"
  calc->addRange(adjRangeInspected, 8, 8); // "INSP"
  calc->addRange(adjRangeDead, 4, 5);      // dead but used: shows its counts
  list.append(AdjustEntry(makeKgvFileRef("src/calc.c", "src/calc.c"), std::move(calc)));
  return list;
}

struct Report {
  kgtest::TempDir dir;
  std::unique_ptr<KgvData> data;
  std::unique_ptr<SumRoot> root;
};

std::unique_ptr<Report> smallReport(std::uint32_t order) {
  auto r = std::make_unique<Report>();
  r->data = kgtest::readOk(kgtest::makeKgv(r->dir, "small.kgv", kSmallData));
  EXPECT_EQ(buildSummary(*r->data, order, hitsMax, smallAdjustments(), gMessages, r->root), allOK);
  return r;
}

std::string exportText(const SumRoot& root, std::time_t when) {
  kgtest::TempDir dir;
  std::string path = dir.file("out.txt");
  FILE* f = fopen(path.c_str(), "w");
  EXPECT_NE(f, nullptr);
  EXPECT_EQ(writeExport(f, root, when, gMessages), allOK);
  fclose(f);
  return kgtest::readFile(path);
}

// True when no file of the tree holds line states.
bool noLineStatesKept(const SumRoot& root) {
  for (const SumDir& d : root.dirRecords)
    for (const SumFile& f : d.fileRecords)
      if (!f.lineStates.empty()) return false;
  return true;
}

class InUtc : public ::testing::Test {
 protected:
  void SetUp() override {
    const char* tz = getenv("TZ");
    if (tz) saved_ = tz, hadTz_ = true;
    setenv("TZ", "UTC", 1);
    tzset();
  }
  void TearDown() override {
    if (hadTz_) setenv("TZ", saved_.c_str(), 1); else unsetenv("TZ");
    tzset();
  }

 private:
  std::string saved_;
  bool hadTz_ = false;
};

}  // namespace

TEST_F(InUtc, TheReportOfASmallDataSetMatchesTheCheckedFile) {
  auto r = smallReport(1);  // alpha
  std::string text = exportText(*r->root, 1700000000);  // 14-Nov-2023 10:13:20 PM UTC
  std::string golden = kgtest::readFile(kgtest::sourceDir() + "/tests/adjust/golden/export_small.txt");
  EXPECT_EQ(text, golden);
  if (getenv("KG_WRITE_GOLDEN")) kgtest::writeFile(getenv("KG_WRITE_GOLDEN"), text);
}

TEST_F(InUtc, LineStatesMadeWhileWritingGiveTheSameReport) {
  Report r;
  r.data = kgtest::readOk(kgtest::makeKgv(r.dir, "small.kgv", kSmallData));
  AdjustmentList saved = std::move(adjustmentList());
  adjustmentList() = smallAdjustments();
  ASSERT_EQ(buildSummary(*r.data, 1, hitsMax, adjustmentList(), gMessages, r.root, false), allOK);
  EXPECT_TRUE(noLineStatesKept(*r.root));
  std::string text = exportText(*r.root, 1700000000);
  adjustmentList() = std::move(saved);
  EXPECT_EQ(text, kgtest::readFile(kgtest::sourceDir() + "/tests/adjust/golden/export_small.txt"));
}

TEST_F(InUtc, EveryLineOfTheHeaderIsSeventyNineCharactersWide) {
  auto r = smallReport(1);
  std::string text = exportText(*r->root, 1700000000);
  std::size_t start = 0;
  for (int line = 0; line < 44; ++line) {
    std::size_t end = text.find('\n', start);
    ASSERT_NE(end, std::string::npos);
    EXPECT_EQ(end - start, 79u) << "line " << line + 1 << ": " << text.substr(start, end - start);
    start = end + 1;
  }
  EXPECT_EQ(text.compare(start, 3, "to\t"), 0);
}

TEST_F(InUtc, TheReportFollowsTheTreesSortOrder) {
  auto r = smallReport(11);  // al_unused: the directory with unused lines first
  std::string text = exportText(*r->root, 1700000000);
  std::size_t src = text.find("di\tsrc/");
  std::size_t none = text.find("di\t**no_directory_provided**/");
  ASSERT_NE(src, std::string::npos);
  ASSERT_NE(none, std::string::npos);
  EXPECT_LT(src, none);
  sortSummary(*r->root, 1);
  text = exportText(*r->root, 1700000000);
  EXPECT_GT(text.find("di\tsrc/"), text.find("di\t**no_directory_provided**/"));
}

namespace {

// A report into a pipe whose reader has gone: no failure and no error left pending.
void expectNoFailureWhenTheReaderLeaves(const SumRoot& root) {
  int fds[2];
  ASSERT_EQ(pipe(fds), 0);
  close(fds[0]);
  FILE* w = fdopen(fds[1], "w");
  ASSERT_NE(w, nullptr);
  auto old = signal(SIGPIPE, SIG_IGN);
  EXPECT_EQ(writeExport(w, root, gMessages), allOK);
  EXPECT_EQ(pendingSystemError(), "");
  signal(SIGPIPE, old);
  fclose(w);
}

}  // namespace

TEST(ExportWriting, AReaderThatClosesItsEndEarlyIsNoFailure) {
  kgtest::TempDir dir;
  auto data = kgtest::readOk(kgtest::makeKgv(dir, "g.kgv", "generate records=300 functions=5 blocks=8\n"));
  std::unique_ptr<SumRoot> root;
  ASSERT_EQ(buildSummary(*data, 1, hitsMax, {}, gMessages, root), allOK);
  expectNoFailureWhenTheReaderLeaves(*root);
}

TEST(ExportWriting, AFullDiskIsAWriteFailure) {
  FILE* full = fopen("/dev/full", "w");
  if (!full) GTEST_SKIP() << "no /dev/full";
  SumRoot empty;
  EXPECT_EQ(writeExport(full, empty, gMessages), fileWriteFailed);
  EXPECT_NE(errorMessage(fileWriteFailed).find("space"), std::string::npos)
      << errorMessage(fileWriteFailed);
  fclose(full);
}

TEST(ExportWriting, OnSeveralThreadsAReportGoesToAPipeWholeAndStopsAtAFailedWrite) {
  // Several million map entries: the report is formatted in several stretches, each written
  // out while the next is formatted.
  kgtest::TempDir dir;
  auto data = kgtest::readOk(kgtest::makeKgv(dir, "g.kgv", "generate records=3000 functions=50 blocks=20\n"));
  std::unique_ptr<SumRoot> root;
  ASSERT_EQ(buildSummary(*data, 11, hitsMax, {}, gMessages, root, false), allOK);
  const std::string serial = exportText(*root, 1700000000);
  ASSERT_GT(serial.size(), std::size_t(40) << 20);

  setSummaryThreadThreshold(0);
  int fds[2];
  ASSERT_EQ(pipe(fds), 0);
  std::string piped;
  std::thread reader([&] {
    char buf[1 << 16];
    for (ssize_t n; (n = read(fds[0], buf, sizeof buf)) > 0;) piped.append(buf, static_cast<std::size_t>(n));
    close(fds[0]);
  });
  FILE* out = fdopen(fds[1], "w");
  ASSERT_NE(out, nullptr);
  EXPECT_EQ(writeExport(out, *root, 1700000000, gMessages), allOK);
  fclose(out);
  reader.join();
  EXPECT_TRUE(piped == serial) << "the report written on several threads differs";

  // A disk that fills stops the report with the failure; a reader that goes away does not.
  if (FILE* full = fopen("/dev/full", "w")) {
    EXPECT_EQ(writeExport(full, *root, gMessages), fileWriteFailed);
    clearPendingSystemError();
    fclose(full);
  }
  expectNoFailureWhenTheReaderLeaves(*root);
  setSummaryThreadThreshold(std::size_t(4) << 20);
}

TEST(ExportWriting, ExportToAFileReplacesItOnlyWhenWhole) {
  kgtest::TempDir dir;
  SumRoot empty;
  std::string target = dir.file("report.txt");
  EXPECT_EQ(exportToFile(empty, target, gMessages), allOK);
  std::string text = kgtest::readFile(target);
  const std::string totals = "to\t0\t0\t0\t0\t0\t0\t0\t0\n";
  ASSERT_GT(text.size(), totals.size());
  EXPECT_EQ(text.substr(text.size() - totals.size()), totals);
  EXPECT_EQ(exportToFile(empty, dir.file("missing/dir/report.txt"), gMessages), writeError);
  EXPECT_EQ(kgtest::filesIn(dir.path()).size(), 1u);  // no temporary file left behind
}
