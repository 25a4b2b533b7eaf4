// kestrel -export and kestrel -extract as users run them from a shell: the report on
// standard output, notes on standard error, the user's sort order, pipes closed early.
#include <gtest/gtest.h>
#include <sys/stat.h>
#include <unistd.h>

#include <map>
#include <sstream>

#include "tests/coverage/kgv_test_util.h"

using kgtest::runProcess;

namespace {

std::string kestrel() { return kgtest::binPath("kestrel"); }

// A home directory of its own for each test, and a neutral language.
struct Home {
  kgtest::TempDir dir;
  std::vector<std::string> env(std::vector<std::string> extra = {}) const {
    std::vector<std::string> e = {"DISPLAY",  "QUOR_LANG", "LC_ALL", "LC_MESSAGES", "LC_CTYPE",
                                  "LANG=C",   "KESTREL_HITS_POLICY", "PROCESS_CORRUPTED_LINES",
                                  "HOME=" + dir.path()};
    e.insert(e.end(), extra.begin(), extra.end());
    return e;
  }
};

// "big.c" has more unused lines; "a.c" sorts first by name.
const char kTwoFiles[] =
    "record d/big.c build=5\nfunction f line=1 calls=0\nblock 2\nblock 3\nblock 4\n"
    "record d/a.c build=5\nfunction g line=1 calls=1\nblock 2 hits=1\n";

std::vector<std::string> fileRecords(const std::string& report) {
  std::vector<std::string> names;
  std::size_t at = 0;
  while ((at = report.find("\nfi\t", at)) != std::string::npos) {
    at += 4;
    names.push_back(report.substr(at, report.find('\t', at) - at));
  }
  return names;
}

}  // namespace

TEST(ExportCommand, TheReportGoesToStandardOutputInTheUsersSortOrder) {
  Home home;
  std::string data = kgtest::makeKgv(home.dir, "two.kgv", kTwoFiles);
  auto r = runProcess({kestrel(), "-export", data}, home.env());
  ASSERT_EQ(r.status, 0) << r.err;
  EXPECT_EQ(r.err, "");
  EXPECT_EQ(r.out.rfind(std::string(79, '#') + "\n", 0), 0u);
  EXPECT_EQ(fileRecords(r.out), (std::vector<std::string>{"big.c", "a.c"}));  // al_unused

  kgtest::writeFile(home.dir.file(".kestrel.Xdefaults"), "Kestrelgauge*sortCriterion: alpha\n");
  r = runProcess({kestrel(), "-export", data}, home.env());
  ASSERT_EQ(r.status, 0) << r.err;
  EXPECT_EQ(fileRecords(r.out), (std::vector<std::string>{"a.c", "big.c"}));

  // The option wins over the settings.
  r = runProcess({kestrel(), "-export", "-sort=lines", data}, home.env());
  ASSERT_EQ(r.status, 0) << r.err;
  EXPECT_EQ(fileRecords(r.out), (std::vector<std::string>{"big.c", "a.c"}));
}

TEST(ExportCommand, AnUnknownSortNameStopsWithFortyTwo) {
  Home home;
  std::string data = kgtest::makeKgv(home.dir, "two.kgv", kTwoFiles);
  auto r = runProcess({kestrel(), "-export", "-sort=bogus", data}, home.env());
  EXPECT_EQ(r.status, 42);
  EXPECT_EQ(r.err, "Kestrelgauge: Couldn't interpret bogus as a sorting order.\n\n");
  EXPECT_EQ(r.out, "");
}

TEST(ExportCommand, AReaderThatStopsAfterOneLineIsSuccess) {
  Home home;
  std::string data =
      kgtest::makeKgv(home.dir, "gen.kgv", "generate records=400 functions=10 blocks=10\n");
  auto r = runProcess({"/bin/bash", "-c", "\"$0\" -export \"$1\" | head -1; exit ${PIPESTATUS[0]}",
                       kestrel(), data},
                      home.env());
  EXPECT_EQ(r.status, 0) << r.err;
  EXPECT_EQ(r.out, std::string(79, '#') + "\n");
  EXPECT_EQ(r.err, "");
}

TEST(ExportCommand, NotesForOldDataBadAdjustmentsAndAHelpWaitThatIsNoNumber) {
  Home home;
  std::string older = kgtest::makeKgv(
      home.dir, "old.kgv", "record s/m.c signature=1 build=10\nfunction f line=1\nblock 2\n");
  std::string newer = kgtest::makeKgv(
      home.dir, "new.kgv", "record s/m.c signature=2 build=20\nfunction f line=1\nblock 2 hits=1\n");
  kgtest::writeFile(home.dir.file(".kestrel.adjust"), "this is not an adjustments file\n");
  auto r = runProcess({kestrel(), "-export", "-QUOR_HELP_MAX_WAIT=12x", older, newer}, home.env());
  EXPECT_EQ(r.status, 0) << r.err;
  EXPECT_NE(r.err.find("Kestrelgauge: Option QUOR_HELP_MAX_WAIT=12x must have a numeric value.\n\n"),
            std::string::npos)
      << r.err;
  EXPECT_NE(r.err.find("Kestrelgauge: Some coverage for this file was out of date:\ns/m.c\n\n"),
            std::string::npos)
      << r.err;
  EXPECT_NE(r.err.find("Kestrelgauge: Problems reading adjustments:\n"), std::string::npos) << r.err;
  EXPECT_NE(r.out.find("li\t2\t1\n"), std::string::npos);  // the newer data
  r = runProcess({kestrel(), "-export", "-QUOR_HELP_MAX_WAIT=0x10", newer}, home.env());
  EXPECT_EQ(r.err.find("numeric"), std::string::npos) << r.err;
}

TEST(ExportCommand, DataThatCannotBeSummarisedStopWithTheirCode) {
  Home home;
  std::string data = kgtest::makeKgv(home.dir, "bad.kgv", "record x.c\nblock 3\n");
  auto r = runProcess({kestrel(), "-export", data}, home.env());
  EXPECT_EQ(r.status, 28);
  EXPECT_EQ(r.err.rfind("Kestrelgauge: Couldn't summarize information:\n", 0), 0u) << r.err;
  EXPECT_EQ(r.out, "");
}

TEST(ExportCommand, ControlCharactersInNamesCannotForgeRecords) {
  Home home;
  // Names of equal length stand in for the crafted ones, which the description cannot spell.
  const std::string fileName = "x\nfi\tevil\t0\t1\t99999\t1\t0\t0\t1\n.c";
  const std::string funcName = "f\tg\r\x01h\x7f";
  const std::string fileStandIn(fileName.size(), 'F');
  const std::string funcStandIn(funcName.size(), 'G');
  std::string image, error;
  ASSERT_TRUE(makeKgvImage("record d/" + fileStandIn + "\nfunction " + funcStandIn +
                               " line=1 calls=1\nblock 2 hits=1\n",
                           image, error)) << error;
  image.replace(image.find(fileStandIn), fileName.size(), fileName);
  image.replace(image.find(funcStandIn), funcName.size(), funcName);
  std::string data = home.dir.file("crafted.kgv");
  kgtest::writeFile(data, image);

  auto r = runProcess({kestrel(), "-export", data}, home.env());
  ASSERT_EQ(r.status, 0) << r.err;
  const std::map<std::string, size_t> fields = {{"to", 9}, {"di", 9},  {"fi", 9},  {"fu", 7},
                                                {"li", 3}, {"bl", 3},  {"efu", 2}, {"efi", 2},
                                                {"edi", 2}};
  std::istringstream lines(r.out);
  std::string line;
  std::vector<std::string> names;
  while (std::getline(lines, line)) {
    if (line[0] == '#') continue;
    std::vector<std::string> f;
    std::istringstream cells(line);
    for (std::string c; std::getline(cells, c, '\t');) f.push_back(c);
    ASSERT_TRUE(fields.count(f[0])) << "forged record: " << line;
    EXPECT_EQ(f.size(), fields.at(f[0])) << line;
    if (f[0] == "fi" || f[0] == "fu") names.push_back(f[1]);
  }
  EXPECT_EQ(names, (std::vector<std::string>{"x?fi?evil?0?1?99999?1?0?0?1?.c", "f?g??h?"}));
  // The bundled script sees one file, fully covered.
  auto table = runProcess({"/bin/sh", kgtest::buildDir() + "/scripts/file-coverage"}, {}, r.out);
  EXPECT_EQ(table.status, 0);
  EXPECT_EQ(table.out.find('-'), std::string::npos) << table.out;
  EXPECT_NE(table.out.find(" 100.0%"), std::string::npos) << table.out;
}

TEST(ExtractCommand, MarkersOfEverySourceFileGoToTheAdjustmentsFile) {
  Home home;
  std::string src = home.dir.file("m.c");
  kgtest::writeFile(src, "int m() {\n  return 1; /* kestrel: inspected */\n}\n");
  std::string data = kgtest::makeKgv(
      home.dir, "m.kgv",
      "record " + src + "\nfunction m line=1\nblock 2\nrecord " + home.dir.file("lost.c") +
          "\nfunction n line=1\nblock 2\n");
  auto r = runProcess({kestrel(), "-extract", data}, home.env());
  EXPECT_EQ(r.status, 0) << r.err;
  EXPECT_EQ(r.out, "Of 2 files in the Kestrelgauge data, 1 was missing\n"
                   "and 0 were ignored because they contained binary data.\n \n"
                   " *** " + home.dir.file("lost.c") + ": Cannot locate\n");
  std::string adjust = kgtest::readFile(home.dir.file(".kestrel.adjust"));
  EXPECT_NE(adjust.find(src), std::string::npos) << adjust;
  // The next export shows the inspected line.
  r = runProcess({kestrel(), "-export", data}, home.env());
  EXPECT_NE(r.out.find("li\t2\tINSP\n"), std::string::npos);
}

TEST(ExtractCommand, AdjustmentsOfSourcesInNonAsciiFoldersSurviveTheNextExtraction) {
  Home home;
  // A Japanese folder name: most bytes near the start of the adjustments file are then
  // multi-byte characters.
  const std::string folder = home.dir.file(
      "\xe6\x97\xa5\xe6\x9c\xac\xe8\xaa\x9e\xe3\x81\xae\xe3\x82\xbd\xe3\x83\xbc\xe3\x82\xb9"
      "\xe3\x83\x95\xe3\x82\xa9\xe3\x83\xab\xe3\x83\x80\xe3\x83\xbc\xe3\x81\xa7\xe3\x81\x99");
  ASSERT_EQ(mkdir(folder.c_str(), 0755), 0);
  std::string jp = folder + "/\xe8\xa7\xa3\xe6\x9e\x90.c";
  std::string other = home.dir.file("b.c");
  kgtest::writeFile(jp, "int m() {\n  return 1; /* kestrel: tested */\n}\n");
  kgtest::writeFile(other, "int n() {\n  return 2; /* kestrel: deadcode */\n}\n");
  std::string first = kgtest::makeKgv(home.dir, "first.kgv",
                                      "record \"" + jp + "\"\nfunction m line=1\nblock 2\n");
  std::string second = kgtest::makeKgv(home.dir, "second.kgv",
                                       "record " + other + "\nfunction n line=1\nblock 2\n");
  auto r = runProcess({kestrel(), "-extract", first}, home.env());
  ASSERT_EQ(r.status, 0) << r.err;
  // The second extraction knows only the other file; the first one's marks must stay.
  r = runProcess({kestrel(), "-extract", second}, home.env());
  ASSERT_EQ(r.status, 0) << r.err;
  EXPECT_EQ(r.err, "");
  std::string adjust = kgtest::readFile(home.dir.file(".kestrel.adjust"));
  EXPECT_NE(adjust.find(jp + "\t"), std::string::npos) << adjust;
  EXPECT_NE(adjust.find(other + "\t"), std::string::npos) << adjust;
  r = runProcess({kestrel(), "-export", first}, home.env());
  ASSERT_EQ(r.status, 0) << r.err;
  EXPECT_NE(r.out.find("li\t2\tTEST\n"), std::string::npos) << r.out;
}

TEST(ExtractCommand, AnAdjustmentsFileThatCannotBeReadIsLeftAsItIs) {
  Home home;
  std::string src = home.dir.file("m.c");
  kgtest::writeFile(src, "int m() {\n  return 1; /* kestrel: inspected */\n}\n");
  std::string data = kgtest::makeKgv(home.dir, "m.kgv", "record " + src + "\nfunction m line=1\nblock 2\n");
  const std::string foreign = "Some other tool's notes\n/x.c 1 2 3\n";
  kgtest::writeFile(home.dir.file(".kestrel.adjust"), foreign);
  auto r = runProcess({kestrel(), "-extract", data}, home.env());
  EXPECT_EQ(r.status, 21) << r.err;
  EXPECT_NE(r.err.find("Couldn't write the adjustments file " + home.dir.file(".kestrel.adjust")),
            std::string::npos) << r.err;
  EXPECT_NE(r.err.find("was not rewritten"), std::string::npos) << r.err;
  EXPECT_EQ(kgtest::readFile(home.dir.file(".kestrel.adjust")), foreign);
}

TEST(ViewCommand, TheWindowModeBuildsTheSummaryBeforeItsHandOver) {
  kgtest::XvfbServer x;
  if (x.display().empty()) GTEST_SKIP() << "no X server for the window mode";
  Home home;
  std::string data = kgtest::makeKgv(home.dir, "two.kgv", kTwoFiles);
  std::string bad = kgtest::makeKgv(home.dir, "bad.kgv", "record x.c\nblock 3\n");
  auto env = home.env({"DISPLAY=" + x.display()});
  auto r = runProcess({kestrel(), "-view", "-sort=bogus", data}, env);
  EXPECT_EQ(r.status, 42);
  EXPECT_EQ(r.err, "Kestrelgauge: Couldn't interpret bogus as a sorting order.\n\n");
  r = runProcess({kestrel(), "-view", bad}, env);
  EXPECT_EQ(r.status, 28);
  EXPECT_EQ(r.err.rfind("Kestrelgauge: Couldn't summarize information:\n", 0), 0u) << r.err;
}

TEST(ExportCommand, TheHitsPolicyComesFromTheEnvironment) {
  Home home;
  std::string data = kgtest::makeKgv(
      home.dir, "h.kgv", "record h.c\nfunction f line=1 calls=1\nblock 2 hits=3\nblock 2 hits=0\n");
  auto policy = [&](const std::string& value) {
    auto r = runProcess({kestrel(), "-export", data}, home.env({"KESTREL_HITS_POLICY=" + value}));
    EXPECT_EQ(r.status, 0) << r.err;
    std::size_t at = r.out.find("\nli\t2\t");
    return at == std::string::npos ? std::string("?") : r.out.substr(at + 6, r.out.find('\n', at + 1) - at - 6);
  };
  EXPECT_EQ(policy("max"), "3");
  EXPECT_EQ(policy("FIRST"), "3");
  EXPECT_EQ(policy("min"), "0");
  EXPECT_EQ(policy("la_st"), "0");
  EXPECT_EQ(policy("most"), "3");  // unknown: the default
}

TEST(ExportCommand, FunctionsAtTheHighestLineNumbersLoad) {
  Home home;
  for (const std::string text : {"record d/far.c\nfunction f line=0x0FFFFFF0 calls=1\nblock 0x0FFFFFF0 hits=3\n",
                                 "record d/far.c\nfunction f line=50000000\n",
                                 "record d/far.c\nfunction f line=1 calls=1\nblock 2 hits=1\nblock 0x0FFFFFFF\n"}) {
    std::string data = kgtest::makeKgv(home.dir, "far.kgv", text);
    auto r = runProcess({kestrel(), "-export", data}, home.env());
    ASSERT_EQ(r.status, 0) << text << r.err;
    EXPECT_EQ(r.err, "");
    EXPECT_NE(r.out.find("\nfi\tfar.c\t"), std::string::npos) << r.out;
    EXPECT_NE(r.out.find("\nfu\tf\t"), std::string::npos) << r.out;
  }
  // The highest line is reported with its count.
  std::string data = kgtest::makeKgv(home.dir, "far.kgv",
                                     "record d/far.c\nfunction f line=0x0FFFFFF0 calls=1\nblock 0x0FFFFFF0 hits=3\n");
  auto r = runProcess({kestrel(), "-export", data}, home.env());
  EXPECT_NE(r.out.find("li\t" + std::to_string(0x0FFFFFF0) + "\t3\n"), std::string::npos) << r.out;
}

TEST(ExportCommand, AdjustmentsMeetSourcesNamedRelativelyOrThroughALink) {
  Home home;
  ASSERT_EQ(mkdir(home.dir.file("real").c_str(), 0755), 0);
  ASSERT_EQ(mkdir(home.dir.file("real/src").c_str(), 0755), 0);
  ASSERT_EQ(symlink("real", home.dir.file("link").c_str()), 0);
  kgtest::writeFile(home.dir.file("real/src/m.c"), "int m() {\n  return 1; /* kestrel: inspected */\n}\n");
  const std::string relative =
      kgtest::makeKgv(home.dir, "rel.kgv", "record src/m.c\nfunction m line=1\nblock 2\n");
  const std::string linked = kgtest::makeKgv(
      home.dir, "link.kgv", "record " + home.dir.file("link/src/m.c") + "\nfunction m line=1\nblock 2\n");
  // Marks extracted by one name are seen by the other, run from inside the link.
  const std::string cwd = home.dir.file("link");
  auto r = runProcess({kestrel(), "-extract", relative}, home.env(), "", cwd);
  ASSERT_EQ(r.status, 0) << r.err;
  for (const std::string& data : {relative, linked}) {
    r = runProcess({kestrel(), "-export", data}, home.env(), "", cwd);
    ASSERT_EQ(r.status, 0) << r.err;
    EXPECT_NE(r.out.find("li\t2\tINSP\n"), std::string::npos) << data << "\n" << r.out;
  }
  // And the other way round, with a fresh adjustments file.
  ASSERT_EQ(unlink(home.dir.file(".kestrel.adjust").c_str()), 0);
  r = runProcess({kestrel(), "-extract", linked}, home.env(), "", home.dir.path());
  ASSERT_EQ(r.status, 0) << r.err;
  r = runProcess({kestrel(), "-export", relative}, home.env(), "", cwd);
  ASSERT_EQ(r.status, 0) << r.err;
  EXPECT_NE(r.out.find("li\t2\tINSP\n"), std::string::npos) << r.out;
}

TEST(ExportCommand, TheLanguageGivenAsTheNextArgumentLeavesTheDataFilesAlone) {
  Home home;
  std::string data = kgtest::makeKgv(home.dir, "two.kgv", kTwoFiles);
  auto r = runProcess({kestrel(), "-export", "-language", "C", data}, home.env());
  EXPECT_EQ(r.status, 0) << r.err;
  EXPECT_EQ(r.err, "");
  EXPECT_EQ(fileRecords(r.out), (std::vector<std::string>{"big.c", "a.c"}));
}
