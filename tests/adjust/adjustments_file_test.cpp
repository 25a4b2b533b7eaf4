// The adjustments file as users and the viewer meet it: reading records with their warnings,
// writing the list back, and the adjustment list's store and lookup rules.
#include <dirent.h>
#include <pwd.h>
#include <signal.h>
#include <sys/resource.h>
#include <sys/stat.h>
#include <sys/wait.h>
#include <unistd.h>

#include <gtest/gtest.h>

#include <string>
#include <vector>

#include "adjust/adjustments_file.h"
#include "tests/common/test_support.h"

namespace {

using kgtest::readFile;
using kgtest::TempDir;
using kgtest::writeFile;

const std::string kBanner = "Kestrelgauge Adjustments File 1.0\n";

class AdjustmentsFile : public ::testing::Test {
 protected:
  // Every case starts from an empty list bound to its own (missing) file, never the
  // user's real one.
  void SetUp() override {
    adjustmentList().clear();
    ASSERT_TRUE(readAdjustmentsFile(path).empty());
    ASSERT_EQ(adjustmentsFilePath(), path);
  }
  void TearDown() override { adjustmentList().clear(); }

  // Writes the file and reads it; gives the warnings.
  std::vector<std::string> read(const std::string& body) {
    writeFile(path, body);
    return readAdjustmentsFile(path);
  }
  // The record lines of a written file (the banner and the comment header dropped).
  std::vector<std::string> writtenRecords() {
    EXPECT_EQ(writeAdjustmentsFile(), allOK);
    std::string text = readFile(path);
    EXPECT_EQ(text.substr(0, kBanner.size()), kBanner);
    std::vector<std::string> records;
    size_t pos = kBanner.size();
    while (pos < text.size()) {
      size_t nl = text.find('\n', pos);
      std::string line = text.substr(pos, nl - pos);
      if (line[0] != '#') records.push_back(line);
      pos = nl + 1;
    }
    return records;
  }
  std::string src(const std::string& name) {
    std::string p = dir.file(name);
    writeFile(p, "int x;\n");
    return p;
  }

  TempDir dir;
  std::string path = dir.file("adjust");
};

TEST_F(AdjustmentsFile, ReadAndWrittenBackGivesResolvedNamesKindsInOrderAndMaximalRuns) {
  std::string a = src("a.c");
  std::string b = src("b.c");
  ASSERT_EQ(symlink(b.c_str(), dir.file("link.c").c_str()), 0);
  std::string body = kBanner + "# my notes\n\n" +
                     dir.path() + "/./a.c\t100\ttested\tL\t 5 3-4 1\n" +
                     a + "\t100\tdeadcode\tB\t20-10\n" +
                     a + "\t100\tdeadcode\tL\t7 8\t9\n" +
                     dir.file("link.c") + "\t200\tinspected\tB\t 2-3 4-4\n";
  EXPECT_TRUE(read(body).empty());
  ASSERT_EQ(adjustmentList().size(), 2u);
  EXPECT_EQ(adjustmentList().entries()[0].givenName(), dir.path() + "/./a.c");
  EXPECT_EQ(adjustmentList().entries()[0].resolvedName(), a);
  EXPECT_EQ(writtenRecords(), (std::vector<std::string>{
                                  a + "\t100\tdeadcode\tL\t 7-9",
                                  a + "\t100\ttested\tL\t 1 3-5",
                                  a + "\t100\tdeadcode\tB\t 10-20",
                                  b + "\t200\tinspected\tB\t 2-4",
                              }));
  std::string text = readFile(path);
  EXPECT_NE(text.find("\n######\n# Kestrelgauge coverage adjustments written "), std::string::npos);
  EXPECT_NE(text.find("\n#   by Kestrelgauge viewer\n######\n"), std::string::npos);
  // Reading the written file again gives the same list.
  adjustmentList().clear();
  EXPECT_TRUE(readAdjustmentsFile(path).empty());
  ASSERT_EQ(adjustmentList().size(), 2u);
  EXPECT_EQ(adjustmentList().findSet(dir.path() + "/", "a.c")->lineKinds(3), adjLineTested);
}

TEST_F(AdjustmentsFile, TheNewerRecordForAFileWinsWhateverTheOrderAndEqualTimesAddUp) {
  std::string a = src("a.c");
  const std::string older = a + "\t100\tdeadcode\tL\t1-2\n";
  const std::string newer = a + "\t300\ttested\tL\t5\n";
  for (const std::string& body : {kBanner + older + newer, kBanner + newer + older}) {
    adjustmentList().clear();
    EXPECT_TRUE(read(body).empty());
    ASSERT_EQ(adjustmentList().size(), 1u);
    const AdjustEntry& e = adjustmentList().entries()[0];
    EXPECT_EQ(e.loadTime(), 300u);
    EXPECT_EQ(e.set()->lineKinds(5), adjLineTested);
    EXPECT_EQ(e.set()->lineKinds(1), 0u);
  }
  adjustmentList().clear();
  EXPECT_TRUE(read(kBanner + older + a + "\t100\tinspected\tB\t9\n").empty());
  CvgAdjustSet* set = adjustmentList().findSet(a);
  ASSERT_NE(set, nullptr);
  EXPECT_EQ(set->lineKinds(1), adjLineDead);
  EXPECT_EQ(set->lineKinds(9), adjRangeInspected);
}

TEST_F(AdjustmentsFile, EveryMalformedLineIsReportedAndTheGoodRecordsStay) {
  std::string a = src("a.c");
  std::string p = path;
  std::string body = kBanner +                                   // line 1
                     "\t1\tdeadcode\tL\t1\n" +                     // 2: no file name
                     a + "\n" +                                    // 3: name without tab
                     a + "\t12345678901\tdeadcode\tL\t1\n" +       // 4: time too long
                     a + "\t12x\tdeadcode\tL\t1\n" +               // 5: non-numeric time
                     a + "\t1\t\tL\t1\n" +                          // 6: no kind
                     a + "\t1\tDeadcode\tL\t1\n" +                  // 7: capitalised kind
                     a + "\t1\tdeadcode-and-more-stuff\tL\t1\n" +  // 8: kind too long
                     a + "\t1\ttested\tX\t1\n" +                   // 9: bad style
                     a + "\t1\ttested\tLL\t1\n" +                  // 10: style too long
                     a + "\t1\ttested\tL\n" +                      // 11: style without tab
                     a + "\t1\ttested\tL\t4 4- -4 4x 1-2-3 9-7 " +
                     "12345678901234567890123456789012345 5000000000 4294967289 8\n" +  // 12
                     a + "\t1\ttested";                            // 13: end of file
  std::vector<std::string> w = read(body);
  auto at = [&](int line) { return "Line " + std::to_string(line) + " of " + p + ":\n"; };
  std::vector<std::string> expected = {
      at(2) + "the filename is missing from the line",
      at(3) + "the filename is not followed by a tab",
      at(4) + "the time value is too long to be valid\n(the limit is 10 characters)",
      at(5) + "the time value '12x'\ncontains non-numeric characters",
      at(6) + "the coverage adjustment name is missing from the line",
      at(7) + "'Deadcode' does not name\na valid kind of coverage adjustment",
      at(8) + "the coverage adjustment name is too long to be valid\n(the limit is 20 characters)",
      at(9) + "'X' does not name\na valid coverage adjustment style",
      at(10) + "the coverage adjustment style is too long to be valid\n(the limit is 1 characters)",
      at(11) + "the coverage adjustment style is not followed by a tab",
  };
  for (const char* bad : {"4-", "-4", "4x", "1-2-3"}) {
    expected.push_back(at(12) + "the text '" + bad +
                       "' is\nnot a valid line range -- check that\nit is in the proper format "
                       "and the\nnumbers are not too large");
  }
  expected.push_back(at(12) +
                     "the line range 123456789012345678901234567890...\nis too long to be "
                     "valid\n(the limit is 30 characters)");
  for (const char* bad : {"5000000000"}) {
    expected.push_back(at(12) + "the text '" + bad +
                       "' is\nnot a valid line range -- check that\nit is in the proper format "
                       "and the\nnumbers are not too large");
  }
  expected.push_back(at(13) + "the coverage adjustment name is not followed by a tab");
  EXPECT_EQ(w, expected);
  CvgAdjustSet* set = adjustmentList().findSet(a);
  ASSERT_NE(set, nullptr);
  for (std::uint32_t line : {4u, 7u, 8u, 9u, 4294967289u}) {
    EXPECT_EQ(set->lineKinds(line), adjLineTested) << line;
  }
  EXPECT_EQ(set->lineKinds(1), 0u);
}

TEST_F(AdjustmentsFile, AFileNameOfMoreThan4095CharactersIsTooLong) {
  std::string longName(4096, 'n');
  std::vector<std::string> w = read(kBanner + longName + "\t1\tdeadcode\tL\t1\n");
  ASSERT_EQ(w.size(), 1u);
  EXPECT_EQ(w[0], "Line 2 of " + path +
                      ":\nthe filename is too long to be valid\n(the limit is 4095 characters)");
  adjustmentList().clear();
  std::string fits = "/" + std::string(4094, 'n');
  EXPECT_TRUE(read(kBanner + fits + "\t1\tdeadcode\tL\t1\n").empty());
  EXPECT_EQ(adjustmentList().size(), 1u);
}

TEST_F(AdjustmentsFile, AWrongBannerOrABinaryFileIsRejectedAsAWhole) {
  std::vector<std::string> w = read("Kestrelgauge Adjustments File 2.0\n/a.c\t1\tdeadcode\tL\t1\n");
  ASSERT_EQ(w.size(), 1u);
  EXPECT_EQ(w[0], "Line 1 of " + path +
                      ":\nthe file does not begin with the\nadjustments file banner:\n   "
                      "Kestrelgauge Adjustments File 1.0\nso it is not a valid "
                      "Kestrelgauge\nadjustments file.\n");
  w = read(kBanner + std::string("\x7f" "ELF\x02\x01\x01\0\0\0\0\x03\0\x3e\0", 16) + std::string(200, '\xff'));
  ASSERT_EQ(w.size(), 1u);
  EXPECT_EQ(w[0], "Line 1 of " + path +
                      ":\nthe file is not a plain text file\n(it contains a lot of non-ASCII "
                      "bytes),\nso it cannot be processed as a coverage\nadjustments file");
  EXPECT_TRUE(adjustmentList().empty());
  EXPECT_EQ(read(kBanner.substr(0, 20)).size(), 1u);
}

TEST_F(AdjustmentsFile, PathsInAnyScriptReadBackAsWritten) {
  // Long enough that nearly every byte of the head is non-ASCII: the test that lets binary
  // data in must still tell it from text.
  const std::vector<std::string> dirs = {
      "\xe6\x97\xa5\xe6\x9c\xac\xe8\xaa\x9e\xe3\x81\xae\xe3\x83\x87\xe3\x82\xa3\xe3\x83\xac"
      "\xe3\x82\xaf\xe3\x83\x88\xe3\x83\xaa\xe3\x81\xa7\xe3\x81\x99\xe3\x81\xad",  // Japanese
      "\xd0\xba\xd0\xb0\xd1\x82\xd0\xb0\xd0\xbb\xd0\xbe\xd0\xb3\xd0\xb8\xd1\x81\xd1\x85\xd0"
      "\xbe\xd0\xb4\xd0\xbd\xd0\xb8\xd0\xba\xd0\xbe\xd0\xb2",  // Cyrillic
      "\xce\xba\xcf\x8e\xce\xb4\xce\xb9\xce\xba\xce\xb1\xcf\x82",  // Greek
      "\xd8\xa7\xd9\x84\xd9\x85\xd8\xb5\xd8\xaf\xd8\xb1",  // Arabic
      "\xf0\x9f\x90\xa6\xf0\x9f\x90\xa6\xf0\x9f\x90\xa6",  // outside the basic plane
  };
  std::vector<std::string> files;
  for (size_t i = 0; i < dirs.size(); ++i) {
    ASSERT_EQ(mkdir(dir.file(dirs[i]).c_str(), 0755), 0);
    files.push_back(src(dirs[i] + "/" + dirs[(i + 1) % dirs.size()] + ".c"));
    auto set = std::make_unique<CvgAdjustSet>();
    set->addRange(adjLineDead, 1 + i, 3 + i);
    set->addRange(adjRangeTested, 40, 50 + i);
    adjustmentList().storeSet(std::move(set), files.back(), 1000 + i);
  }
  ASSERT_EQ(writeAdjustmentsFile(), allOK);
  std::string first = readFile(path);

  adjustmentList().clear();
  EXPECT_EQ(readAdjustmentsFile(path), std::vector<std::string>{});
  EXPECT_TRUE(adjustmentsWritable());
  ASSERT_EQ(adjustmentList().size(), files.size());
  for (size_t i = 0; i < files.size(); ++i) {
    const AdjustEntry& e = adjustmentList().entries()[i];
    EXPECT_EQ(e.resolvedName(), files[i]);
    EXPECT_EQ(e.loadTime(), 1000 + i);
    ASSERT_NE(e.set(), nullptr);
    EXPECT_EQ(e.set()->lineKinds(2 + i), adjLineDead);
    EXPECT_EQ(e.set()->lineKinds(50 + i), adjRangeTested);
  }
  // Written again, the file is the same except for the time in its header.
  ASSERT_EQ(writeAdjustmentsFile(), allOK);
  auto records = [](const std::string& t) { return t.substr(t.find("######\n", t.find("by "))); };
  EXPECT_EQ(records(readFile(path)), records(first));
}

TEST_F(AdjustmentsFile, PathsThatAreNotUtf8ReadBackToo) {
  // Folder names from older systems hold Latin-1 and other bytes that are not UTF-8.
  std::string latin1 = dir.file("r\xe9sum\xe9s-\xe0-\xe9t\xe9-\xfc\xf6\xe4\xdf-\xe5\xf8\xe6");
  ASSERT_EQ(mkdir(latin1.c_str(), 0755), 0);
  std::string a = src("r\xe9sum\xe9s-\xe0-\xe9t\xe9-\xfc\xf6\xe4\xdf-\xe5\xf8\xe6/\xe9\xe9\xe9\xe9.c");
  auto set = std::make_unique<CvgAdjustSet>();
  set->addRange(adjLineInspected, 4, 9);
  adjustmentList().storeSet(std::move(set), a, 77);
  ASSERT_EQ(writeAdjustmentsFile(), allOK);
  adjustmentList().clear();
  EXPECT_EQ(readAdjustmentsFile(path), std::vector<std::string>{});
  ASSERT_EQ(adjustmentList().size(), 1u);
  EXPECT_EQ(adjustmentList().entries()[0].resolvedName(), a);

  // The inputs the reader's fuzz target found: names holding bytes 0xff, and control bytes.
  for (const char* found : {"crash-fed75bc2b1528d7ba2f3881ff71f89fbb6d6975c-minimized",
                            "crash-6552bfb474d9ddca153f538ee1aa1e1e79551255-minimized",
                            "control-bytes-in-path.adjust"}) {
    std::string text = readFile(kgtest::sourceDir() + "/fuzz/regressions/adjustments_reader_fuzz/" + found);
    if (text.rfind(kBanner, 0) != 0) text = kBanner + text;
    AdjustmentList list;
    std::vector<std::string> warnings;
    parseAdjustments(text, "found", list, warnings);
    ASSERT_FALSE(list.empty()) << found;
    char* buf = nullptr;
    size_t len = 0;
    FILE* out = open_memstream(&buf, &len);
    ASSERT_TRUE(writeAdjustments(out, "test", list));
    fclose(out);
    std::string written(buf, len);
    free(buf);
    AdjustmentList again;
    warnings.clear();
    EXPECT_TRUE(parseAdjustments(written, "written", again, warnings)) << found;
    EXPECT_EQ(warnings, std::vector<std::string>{}) << found;
    EXPECT_EQ(again.size(), list.size()) << found;
  }
}

TEST_F(AdjustmentsFile, CarriageReturnLineEndsAreRead) {
  std::string a = src("a.c");
  std::string unixText = kBanner + "# notes\n" + a + "\t100\ttested\tL\t 5 3-4\n\n" + a +
                         "\t100\tdeadcode\tB\t 20-30\n";
  std::string dosText;
  for (char c : unixText) {
    if (c == '\n') dosText += '\r';
    dosText += c;
  }
  EXPECT_EQ(read(dosText), std::vector<std::string>{});
  std::vector<std::string> fromDos = writtenRecords();
  adjustmentList().clear();
  EXPECT_EQ(read(unixText), std::vector<std::string>{});
  EXPECT_EQ(writtenRecords(), fromDos);
  EXPECT_EQ(fromDos.size(), 2u);
}

TEST_F(AdjustmentsFile, AFileThatCouldNotBeReadIsNeverOverwritten) {
  std::string a = src("a.c");
  auto storeOne = [&] {
    auto set = std::make_unique<CvgAdjustSet>();
    set->addRange(adjLineDead, 3, 3);
    adjustmentList().storeSet(std::move(set), a, 7);
  };
  const std::vector<std::string> unreadable = {
      kBanner + std::string("\x01\x02\0\0\x05\x06\x07\0", 8) + std::string(600, '\xff'),  // binary
      "Kestrelgauge Adjustments File 9.9\n/a.c\t1\ttested\tL\t1\n",  // another format
  };
  for (const std::string& body : unreadable) {
    adjustmentList().clear();
    EXPECT_EQ(read(body).size(), 1u);
    EXPECT_FALSE(adjustmentsWritable());
    storeOne();
    EXPECT_EQ(writeAdjustmentsFile(), fileWriteFailed);
    EXPECT_NE(errorMessage(fileWriteFailed).find(path + " was not rewritten"), std::string::npos);
    EXPECT_EQ(readFile(path), body);
  }
  // Once a readable file was read, writing works again.
  adjustmentList().clear();
  EXPECT_TRUE(read(kBanner).empty());
  storeOne();
  EXPECT_EQ(writeAdjustmentsFile(), allOK);
}

TEST_F(AdjustmentsFile, AMissingFileIsNormalAndTheFirstStoreCreatesIt) {
  EXPECT_TRUE(readAdjustmentsFile(path).empty());
  EXPECT_TRUE(adjustmentsWritable());
  EXPECT_FALSE(kgtest::fileExists(path));
  auto set = std::make_unique<CvgAdjustSet>();
  set->addRange(adjLineInspected, 12, 12);
  std::string a = src("a.c");
  EXPECT_TRUE(adjustmentList().storeSet(std::move(set), a, 1234));
  EXPECT_EQ(writtenRecords(), std::vector<std::string>{a + "\t1234\tinspected\tL\t 12"});
}

TEST_F(AdjustmentsFile, ANameThatWouldBreakTheRecordFormatIsNotWritten) {
  std::string a = src("a.c");
  auto one = [] {
    auto s = std::make_unique<CvgAdjustSet>();
    s->addRange(adjLineDead, 3, 3);
    return s;
  };
  adjustmentList().storeSet(one(), "/x\n/etc/passwd\t1\tdeadcode\tL\t1", 7);
  adjustmentList().storeSet(one(), "/x\ty.c", 7);
  adjustmentList().storeSet(one(), a, 7);
  EXPECT_EQ(writtenRecords(), std::vector<std::string>{a + "\t7\tdeadcode\tL\t 3"});
}

TEST_F(AdjustmentsFile, TheDefaultFileLivesInTheHomeDirectory) {
  const char* oldHome = getenv("HOME");
  std::string saved = oldHome ? oldHome : "";
  setenv("HOME", dir.path().c_str(), 1);
  writeFile(dir.file(".kestrel.adjust"), kBanner + "/x/a.c\t5\ttested\tL\t3\n");
  std::vector<std::string> w = readStartupAdjustments(nullptr);
  EXPECT_TRUE(w.empty());
  EXPECT_EQ(adjustmentsFilePath(), dir.file(".kestrel.adjust"));
  EXPECT_EQ(adjustmentList().size(), 1u);
  EXPECT_EQ(expandHomePath("~"), dir.path());
  EXPECT_EQ(expandHomePath("~/x"), dir.path() + "/x");
  if (struct passwd* pw = getpwnam("root")) {
    EXPECT_EQ(expandHomePath("~root/x"), std::string(pw->pw_dir) + "/x");
  }
  EXPECT_EQ(expandHomePath("~no_such_user_kg/x"), "~no_such_user_kg/x");
  EXPECT_EQ(expandHomePath("/a/~b"), "/a/~b");
  setenv("HOME", "", 1);
  EXPECT_NE(expandHomePath("~/x"), "~/x");  // from the user database instead
  if (oldHome) {
    setenv("HOME", saved.c_str(), 1);
  } else {
    unsetenv("HOME");
  }
}

TEST_F(AdjustmentsFile, AFileThatCannotBeRewrittenIsStillRead) {
  if (geteuid() == 0) GTEST_SKIP() << "permissions do not bind the superuser";
  writeFile(path, kBanner + "/x/a.c\t5\ttested\tL\t3\n");
  chmod(path.c_str(), 0444);
  EXPECT_TRUE(readAdjustmentsFile(path).empty());
  EXPECT_FALSE(adjustmentsWritable());
  EXPECT_EQ(adjustmentList().size(), 1u);
}

TEST_F(AdjustmentsFile, AWriteThatRunsOutOfSpaceLeavesTheOldFileIntact) {
  std::string old = kBanner + "/x/a.c\t5\ttested\tL\t3\n";
  writeFile(path, old);
  ASSERT_TRUE(readAdjustmentsFile(path).empty());
  for (int i = 0; i < 2000; ++i) {
    auto set = std::make_unique<CvgAdjustSet>();
    for (std::uint32_t l = 1; l < 40; l += 2) set->addRange(adjLineDead, l, l);
    adjustmentList().storeSet(std::move(set), "/src/file" + std::to_string(i) + ".c", 99);
  }
  pid_t pid = fork();
  if (pid == 0) {
    signal(SIGXFSZ, SIG_IGN);
    struct rlimit rl = {4096, 4096};
    if (setrlimit(RLIMIT_FSIZE, &rl) != 0) _exit(2);
    _exit(writeAdjustmentsFile() == fileWriteFailed ? 0 : 1);
  }
  int status = 0;
  waitpid(pid, &status, 0);
  ASSERT_TRUE(WIFEXITED(status));
  EXPECT_EQ(WEXITSTATUS(status), 0);
  EXPECT_EQ(readFile(path), old);
  // No half-written copy is left beside it.
  std::vector<std::string> names;
  DIR* d = opendir(dir.path().c_str());
  while (dirent* e = readdir(d)) {
    if (std::string(e->d_name) != "." && std::string(e->d_name) != "..") names.push_back(e->d_name);
  }
  closedir(d);
  EXPECT_EQ(names, std::vector<std::string>{"adjust"});
  struct stat st;
  // The rewrite keeps the file's permission bits.
  chmod(path.c_str(), 0640);
  EXPECT_EQ(writeAdjustmentsFile(), allOK);
  ASSERT_EQ(stat(path.c_str(), &st), 0);
  EXPECT_EQ(st.st_mode & 0777, 0640u);
}

TEST(AdjustmentListRules, StoringAnEqualSetChangesNothingAndADifferentOneReplacesInPlace) {
  AdjustmentList list;
  auto make = [](std::uint32_t line) {
    auto s = std::make_unique<CvgAdjustSet>();
    s->addRange(adjLineDead, line, line);
    return s;
  };
  EXPECT_TRUE(list.storeSet(make(1), "/s/a.c", 10));
  EXPECT_TRUE(list.storeSet(make(1), "/s/b.c", 10));
  EXPECT_FALSE(list.storeSet(make(1), "/s/a.c", 20));
  EXPECT_EQ(list.findEntry("/s/a.c")->loadTime(), 10u);
  EXPECT_TRUE(list.storeSet(make(2), "/s/a.c", 30));
  int pos = -2;
  ASSERT_NE(list.findSet("/s/a.c", &pos), nullptr);
  EXPECT_EQ(pos, 0);
  EXPECT_EQ(list.findEntry("/s/a.c")->loadTime(), 30u);
  EXPECT_EQ(list.findSet("/s/", "a.c")->lineKinds(2), adjLineDead);
  EXPECT_EQ(list.findSet("/s/c.c", &pos), nullptr);
  EXPECT_EQ(pos, -1);
  // The payload of the file reference is the entry's set.
  EXPECT_EQ(list.entries()[0].ref().payload, list.entries()[0].set());
}

TEST(AdjustmentListRules, TheEditingWindowGetsTheStoredSetOrANewEmptyOne) {
  AdjustmentList list;
  CvgAdjustSet* fresh = list.setForPath("/s/new.c", nullptr, 5);
  ASSERT_NE(fresh, nullptr);
  EXPECT_TRUE(fresh->empty());
  EXPECT_EQ(list.setForPath("/s/new.c", nullptr, 6), fresh);  // equal: the stored one
  fresh->addRange(adjLineTested, 4, 4);                        // the window edits it
  CvgAdjustSetPtr before = copyAdjustSet(fresh);
  EXPECT_EQ(list.setForPath("/s/new.c", copyAdjustSet(fresh), 7), fresh);
  fresh->addRange(adjLineDead, 9, 9);
  // Discarding the edits stores the copy taken before them.
  CvgAdjustSet* restored = list.setForPath("/s/new.c", std::move(before), 8);
  ASSERT_NE(restored, nullptr);
  EXPECT_EQ(restored->lineKinds(9), 0u);
  EXPECT_EQ(restored->lineKinds(4), adjLineTested);
  EXPECT_EQ(list.size(), 1u);
  list.removeEntry(3);
  list.removeEntry(0);
  EXPECT_TRUE(list.empty());
}

TEST(AdjustmentListRules, MergingKeepsOldEntriesTheNewListLacks) {
  AdjustmentList old, fresh;
  auto one = [](CvgAdjust k) {
    auto s = std::make_unique<CvgAdjustSet>();
    s->addRange(k, 1, 1);
    return s;
  };
  old.storeSet(one(adjLineDead), "/s/a.c", 1);
  old.storeSet(one(adjLineDead), "/s/missing.c", 1);
  fresh.storeSet(one(adjLineTested), "/s/a.c", 2);
  AdjustmentList merged = AdjustmentList::merge(std::move(old), std::move(fresh));
  ASSERT_EQ(merged.size(), 2u);
  EXPECT_EQ(merged.entries()[0].set()->lineKinds(1), adjLineTested);
  EXPECT_EQ(merged.entries()[1].resolvedName(), "/s/missing.c");
  EXPECT_EQ(merged.entries()[1].loadTime(), 1u);
}

}  // namespace
