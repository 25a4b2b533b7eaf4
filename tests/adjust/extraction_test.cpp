// "Extract adjustments from all source files" as a user runs it: the result sentence for
// one and several files, missing and binary files, the skipped window file, the merge with
// the old list, the rewritten adjustments file and the recomputed figures.
#include <gtest/gtest.h>

#include "adjust/adjust_settings.h"
#include "adjust/adjustments_file.h"
#include "adjust/extraction.h"
#include "coverage/adjustment_list.h"
#include "coverage/summary_build.h"
#include "support/message_sink.h"
#include "tests/coverage/kgv_test_util.h"

namespace {

// Where the engine's notices go; these tests do not look at them.
MessageList gMessages;

class Counting : public ExtractionQuestion {
 public:
  explicit Counting(bool answer) : answer_(answer) {}
  bool continueWith(const std::string& message) override {
    asked.push_back(message);
    return answer_;
  }
  std::vector<std::string> asked;

 private:
  bool answer_;
};

// A source tree with data naming its files by absolute path.
struct Project {
  kgtest::TempDir dir;
  std::unique_ptr<KgvData> data;
  std::unique_ptr<SumRoot> root;

  explicit Project(const std::vector<std::string>& files) {
    std::string text;
    for (const auto& f : files)
      text += "record " + dir.file(f) + "\nfunction f line=1 calls=1\nblock 2 hits=0\nblock 3 hits=0\n";
    data = kgtest::readOk(kgtest::makeKgv(dir, "p.kgv", text));
    adjustmentList().clear();
    readAdjustmentsFile(dir.file("adjust"));
    EXPECT_EQ(buildSummary(*data, 1, hitsMax, adjustmentList(), gMessages, root), allOK);
  }
  std::string path(const std::string& f) const { return dir.file(f); }
};

AdjustSettings lowThreshold() {
  AdjustSettings s;
  s.adjustmentExtractWarnThreshold = 2;
  return s;
}

}  // namespace

TEST(Extraction, OneFileWithMarkersIsReadAndTheFiguresChange) {
  Project p({"one.c"});
  kgtest::writeFile(p.path("one.c"), "int f() {\n  g(); /* kestrel: deadcode */\n  h();\n}\n");
  EXPECT_EQ(p.root->counts.adjUnusedLines, 2u);
  AlwaysContinue yes;
  ExtractionOutcome out = extractAllAdjustments(*p.root, "", yes, gMessages);
  ASSERT_TRUE(out.performed);
  EXPECT_EQ(out.lines, (std::vector<std::string>{
                           "Of 1 file in the Kestrelgauge data, 0 were missing",
                           "and 0 were ignored because they contained binary data.", " "}));
  EXPECT_EQ(out.writeStatus, allOK);
  EXPECT_EQ(p.root->counts.adjUnusedLines, 1u);
  EXPECT_EQ(p.root->counts.deadLines, 1u);
  std::string file = kgtest::readFile(p.path("adjust"));
  EXPECT_NE(file.find(p.path("one.c")), std::string::npos) << file;
}

TEST(Extraction, MissingAndBinaryFilesAreNamedAndKeepTheirOldAdjustments) {
  Project p({"a.c", "gone.c", "blob.c", "warn.c"});
  kgtest::writeFile(p.path("a.c"), "x(); // kestrel: tested\n");
  kgtest::writeFile(p.path("blob.c"), std::string("\x7f" "ELF\0\0\0\1\2\3", 10));
  kgtest::writeFile(p.path("warn.c"), "a();\n/* kestrel: end */\n");
  // An earlier extraction had found the now missing file's markers.
  auto old = std::make_unique<CvgAdjustSet>();
  old->addRange(adjLineDead, 2, 2);
  adjustmentList().storeSet(std::move(old), p.path("gone.c"), 5);
  AlwaysContinue yes;
  ExtractionOutcome out = extractAllAdjustments(*p.root, "", yes, gMessages);
  ASSERT_GE(out.lines.size(), 7u);
  EXPECT_EQ(out.lines[0], "Of 4 files in the Kestrelgauge data, 1 was missing");
  EXPECT_EQ(out.lines[1], "and 1 was ignored because it contained binary data.");
  EXPECT_EQ(out.lines[2], " ");
  // Per-file lines follow the records' array order (by name): a, blob, gone, warn.
  EXPECT_EQ(out.lines[3], " *** " + p.path("blob.c") + ": Not a source file");
  EXPECT_EQ(out.lines[4], " *** " + p.path("gone.c") + ": Cannot locate");
  EXPECT_EQ(out.lines[5], " *** " + p.path("warn.c") + ":");
  EXPECT_NE(out.lines[6].find("kestrel: end"), std::string::npos) << out.lines[6];
  EXPECT_NE(adjustmentList().findSet(p.path("gone.c")), nullptr);
  EXPECT_NE(adjustmentList().findSet(p.path("a.c")), nullptr);
  SumFile* gone = findSumFile(*p.root, p.path("gone.c"));
  ASSERT_NE(gone, nullptr);
  EXPECT_EQ(gone->counts.deadLines, 1u);  // the kept set still counts
}

TEST(Extraction, TheFileOfTheSourceWindowIsSkippedAndSaidSo) {
  Project p({"shown.c", "other.c"});
  kgtest::writeFile(p.path("other.c"), "y();\n");
  AlwaysContinue yes;
  ExtractionOutcome out = extractAllAdjustments(*p.root, p.path("shown.c"), yes, gMessages);
  EXPECT_EQ(out.lines, (std::vector<std::string>{
                           "Of 2 files in the Kestrelgauge data, 0 were missing,",
                           "the file in the annotated source window was skipped because",
                           "the adjustments for it are already accurate,",
                           "and 0 were ignored because they contained binary data.", " "}));
}

TEST(Extraction, ManyFilesAskFirstAndADeclineChangesNothing) {
  Project p({"a.c", "b.c"});
  kgtest::writeFile(p.path("a.c"), "x(); // kestrel: tested\n");
  setAdjustSettingsProvider(lowThreshold);
  Counting no(false);
  ExtractionOutcome out = extractAllAdjustments(*p.root, "", no, gMessages);
  setAdjustSettingsProvider(nullptr);
  EXPECT_FALSE(out.performed);
  EXPECT_TRUE(out.lines.empty());
  EXPECT_EQ(no.asked, (std::vector<std::string>{"2 files to process; this may take a while"}));
  EXPECT_EQ(adjustmentList().findSet(p.path("a.c")), nullptr);
  EXPECT_FALSE(kgtest::fileExists(p.path("adjust")));
}

TEST(Extraction, TheQuestionTextTakesOnlyNumbers) {
  EXPECT_EQ(manyFilesMessage("%u of %lu, 100%%", 7, 50), "7 of 50, 100%");
  EXPECT_EQ(manyFilesMessage("%s and %n %u %u %u", 1, 2), "%s and %n 1 2 %u");
}
