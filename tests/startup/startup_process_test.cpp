// The product command and the program as a user starts them: exact messages and statuses.
#include <gtest/gtest.h>
#include <sys/stat.h>
#include <unistd.h>

#include <regex>

#include "coverage/kgv_file.h"
#include "tests/common/test_support.h"

using kgtest::runProcess;

namespace {

const char kUsageError[] =
    "Kestrelgauge: Kestrelgauge must be invoked in one of these forms:\n"
    "    kestrel -view\n"
    "    kestrel -export\n"
    "    kestrel -merge=<file>\n"
    "    kestrel -extract\n"
    "For additional information, use 'kestrel -help'.\n\n";

const char kNoFiles[] =
    "Kestrelgauge: No files were specified on the command line.\n"
    "Please specify a list of one or more .kgv files.\n\n";

// Environment without a display and with a neutral language, so runs are reproducible.
std::vector<std::string> plainEnv(std::vector<std::string> extra = {}) {
  // HOME points at a directory without a per-user defaults file, so a developer's own
  // settings cannot change what the tests see.
  static kgtest::TempDir home;
  std::vector<std::string> env = {"DISPLAY", "QUOR_LANG", "LC_ALL", "LC_MESSAGES", "LC_CTYPE",
                                  "LANG=C", "QUOR_WHERE_AM_I", "HOME=" + home.path()};
  env.insert(env.end(), extra.begin(), extra.end());
  return env;
}

std::string viewer() { return kgtest::binPath("kestrel-viewer"); }
std::string kestrel() { return kgtest::binPath("kestrel"); }
std::string home() { return "-kestrelhome=" + kgtest::buildDir(); }

}  // namespace

TEST(ProductCommand, WithoutAModeOrWithAnUnknownOnePrintsTheUsageError) {
  for (auto args : std::vector<std::vector<std::string>>{{kestrel()}, {kestrel(), "-show", "a.kgv"},
                                                         {kestrel(), "-merge", "a.kgv"}}) {
    auto r = runProcess(args, plainEnv());
    EXPECT_EQ(r.status, 11);
    EXPECT_EQ(r.err, kUsageError);
    EXPECT_EQ(r.out, "");
  }
}

TEST(ProductCommand, PassesTheInstallationDirectoryToTheProgram) {
  auto r = runProcess({kestrel(), "-export", "-version"}, plainEnv());
  EXPECT_EQ(r.status, 0);
  std::string dir = kgtest::buildDir();
  EXPECT_NE(r.err.find("   Installed in:         " + dir + "\n"), std::string::npos) << r.err;
  EXPECT_NE(r.err.find("   Scripts installed in: " + dir + "/scripts\n"), std::string::npos);
}

TEST(StartUp, MissingOrEmptyInstallationDirectoryIsAUsageError) {
  for (auto args : std::vector<std::vector<std::string>>{
           {viewer(), "-export", "a.kgv"}, {viewer(), "-export", "-kestrelhome=", "a.kgv"},
           {viewer(), "-export", "-kestrelhome", "a.kgv"}}) {
    auto r = runProcess(args, plainEnv());
    EXPECT_EQ(r.status, 11);
    EXPECT_EQ(r.err, kUsageError);
  }
}

TEST(StartUp, NoFilesGivesItsMessageAndStatusNine) {
  auto r = runProcess({viewer(), "-export", home()}, plainEnv());
  EXPECT_EQ(r.status, 9);
  EXPECT_EQ(r.err, kNoFiles);
  // Empty arguments are dropped, not taken as file names.
  r = runProcess({viewer(), "-export", home(), "", ""}, plainEnv());
  EXPECT_EQ(r.status, 9);
  EXPECT_EQ(r.err, kNoFiles);
}

TEST(StartUp, HelpAndVersionPrintBothTextsAndSucceed) {
  auto r = runProcess({viewer(), "-export", home(), "-help", "-version"}, plainEnv());
  EXPECT_EQ(r.status, 0);
  EXPECT_EQ(r.err.rfind("Example:\n        kestrel -view a.out.kgv\n \n", 0), 0u) << r.err;
  std::regex banner(
      "will cause the files to be combined regardless of their versions\\.\n \n"
      "Kestrelgauge viewer [0-9.]+ \\(built [^)]+\\) for [^\n]+\n"
      "   Installed in:         [^\n]+\n"
      "   Scripts installed in: [^\n]+/scripts\n$");
  EXPECT_TRUE(std::regex_search(r.err, banner)) << r.err;
}

TEST(ProductCommand, HelpAndVersionWithoutAModeDoWhatTheUsageMessageAdvises) {
  for (const char* option : {"-help", "-version"}) {
    auto alone = runProcess({kestrel(), option}, plainEnv());
    auto withMode = runProcess({kestrel(), "-export", option}, plainEnv());
    EXPECT_EQ(alone.status, 0) << option;
    EXPECT_EQ(alone.err, withMode.err) << option;
    EXPECT_EQ(alone.out, "");
  }
  EXPECT_EQ(runProcess({kestrel(), "-help"}, plainEnv()).err.rfind("Example:\n", 0), 0u);
  EXPECT_EQ(runProcess({kestrel(), "-version"}, plainEnv()).err.rfind("Kestrelgauge viewer ", 0), 0u);
  // With anything else the mode is still needed.
  auto r = runProcess({kestrel(), "-help", "a.kgv"}, plainEnv());
  EXPECT_EQ(r.status, 11);
  EXPECT_EQ(r.err, kUsageError);
}

TEST(StartUp, TheLanguageGivenAsTheNextArgumentIsNoDataFile) {
  auto apart = runProcess({viewer(), "-export", home(), "-language", "fr"}, plainEnv());
  auto joined = runProcess({viewer(), "-export", home(), "-language=fr"}, plainEnv());
  EXPECT_EQ(apart.status, 9);
  EXPECT_EQ(apart.err, joined.err);
  EXPECT_EQ(apart.err, "Kestrelgauge viewer: Warning: Unknown language \"fr\", using English.\n" +
                           std::string(kNoFiles));
}

TEST(StartUp, OptionErrorsAreReportedAndStartUpGoesOn) {
  auto r = runProcess({viewer(), "-export", home(), "-help=1", "-sort", "-bogus", "-VERBOSE=1",
                       "-locking=OFF"},
                      plainEnv());
  EXPECT_EQ(r.err,
            "Kestrelgauge: kestrel -export: option -help=1 should not include a value.\n\n"
            "Kestrelgauge: kestrel -export: option -sort must include a value.\n\n"
            "Kestrelgauge: kestrel -export: unknown option '-bogus'.\n\n" +
                std::string(kNoFiles));
  EXPECT_EQ(r.status, 9);  // help stayed unset, so start-up went on to the file list
}

TEST(StartUp, ABooleanOptionWithAnotherValueStopsWithStatusSix) {
  auto r = runProcess({viewer(), "-export", home(), "-locking=maybe", "a.kgv"}, plainEnv());
  EXPECT_EQ(r.status, 6);
  EXPECT_EQ(r.err, "Kestrelgauge: Option 'locking=maybe' must be a boolean (usage: -locking=yes).\n\n");
}

TEST(StartUp, TheSameDataFileNamedTwiceIsNoticedOnce) {
  kgtest::TempDir dir;
  kgtest::writeFile(dir.file("a.kgv"), "");
  ASSERT_EQ(symlink("a.kgv", dir.file("b.kgv").c_str()), 0);
  auto r = runProcess({viewer(), "-export", home(), "a.kgv", "a.kgv", "b.kgv"}, plainEnv(), "",
                      dir.path());
  char real[4096];
  ASSERT_NE(realpath(dir.file("a.kgv").c_str(), real), nullptr);
  std::string expected =
      "Kestrelgauge: The filename arguments a.kgv\n(#1 among the names) and a.kgv\n"
      "(#2 among the names) both refer to the same file.\nIt will be loaded only once.\n\n"
      "Kestrelgauge: The filename arguments a.kgv\n(#1 among the names) and b.kgv\n"
      "(#3 among the names) both refer to the same file\n(" +
      std::string(real) + ").\nIt will be loaded only once.\n\n";
  EXPECT_EQ(r.err.substr(0, expected.size()), expected);
}

TEST(StartUp, UnknownLanguageWarnsAndTheCLocaleDoesNot) {
  auto r = runProcess({viewer(), "-export", home()}, plainEnv({"LANG=de_DE"}));
  EXPECT_EQ(r.err, "Kestrelgauge viewer: Warning: Unknown language \"de_DE\", using English.\n" +
                       std::string(kNoFiles));
  r = runProcess({viewer(), "-export", home()}, plainEnv({"LANG=C"}));
  EXPECT_EQ(r.err, kNoFiles);
  // Japanese is a known language (its message files may still be missing: that is another warning).
  r = runProcess({viewer(), "-export", home()}, plainEnv({"LANG=ja_JP.eucJP"}));
  EXPECT_EQ(r.err.find("Unknown language"), std::string::npos) << r.err;
  r = runProcess({viewer(), "-export", home(), "-language=fr"}, plainEnv());
  EXPECT_EQ(r.err, "Kestrelgauge viewer: Warning: Unknown language \"fr\", using English.\n" +
                       std::string(kNoFiles));
}

TEST(StartUp, TheWindowNeedsADisplay) {
  auto r = runProcess({viewer(), "-view", home(), "a.kgv"}, plainEnv());
  EXPECT_EQ(r.status, 1);
  EXPECT_EQ(r.err,
            "Kestrelgauge viewer: Error: The DISPLAY environment variable is not set.\n"
            "Please set DISPLAY before running Kestrelgauge.\nExiting.\n");
  // Xt keeps what it parsed when the display cannot be opened: not this program's leak.
  r = runProcess({viewer(), "-view", home(), "a.kgv"},
                 plainEnv({"DISPLAY=:987", "LSAN_OPTIONS=suppressions=" + kgtest::sourceDir() +
                                               "/tests/lsan_x11.supp:print_suppressions=0"}));
  EXPECT_EQ(r.status, 8);
  EXPECT_EQ(r.err, "Kestrelgauge: Cannot open graphics display.\n\n");
}

TEST(StartUp, WithADisplayTheWindowModeReachesTheOptions) {
  kgtest::XvfbServer x;
  ASSERT_FALSE(x.display().empty());
  auto r = runProcess({viewer(), "-view", home(), "-help", "-version"},
                      plainEnv({"DISPLAY=" + x.display()}));
  EXPECT_EQ(r.status, 0);
  EXPECT_EQ(r.err.rfind("Example:\n", 0), 0u);
  // "-display NAME" is the X layer's and never reaches the file list.
  r = runProcess({viewer(), "-view", home(), "-display", x.display()}, plainEnv());
  EXPECT_EQ(r.status, 9);
  EXPECT_EQ(r.err, kNoFiles);
}

TEST(StartUp, QuotedArgumentsLoseTheirQuotes) {
  auto r = runProcess({viewer(), "-export", "\"" + home() + "\"", "\"-userpath=/src\"", "\"-version\""},
                      plainEnv());
  EXPECT_EQ(r.status, 0);
  EXPECT_NE(r.err.find("Installed in:         " + kgtest::buildDir() + "\n"), std::string::npos);
}

TEST(FatalSignal, AFaultPrintsTheWholeReportAndExitsWithOne) {
  auto r = runProcess({kgtest::buildDir() + "/tests/startup_crash_helper"},
                      plainEnv({"ASAN_OPTIONS=handle_segv=0:handle_abort=0"}));
  EXPECT_EQ(r.status, 1);
  const std::string& e = r.err;
  EXPECT_EQ(e.rfind("cleanup ran\n", 0), 0u) << e;
  EXPECT_TRUE(std::regex_search(e, std::regex("\nKestrelgauge viewer [0-9.]+ got signal 11 \\(SIGSEGV - [^)]+\\)\n")))
      << e;
  EXPECT_TRUE(std::regex_search(e, std::regex("\n sigcode=[0-9]+; [^\n]*0x40\n"))) << e;
  EXPECT_NE(e.find("This is happening in Kestrelgauge viewer:\n0: 0x"), std::string::npos);
  EXPECT_TRUE(std::regex_search(e, std::regex("\n%rax = 0x[0-9a-f]+\n%rcx = ")));
  EXPECT_NE(e.find("\n%r15 = 0x"), std::string::npos);
  EXPECT_NE(e.find("memory contents from 0x0 to 0x80:\n\t0x00000000: (unreadable)\n"), std::string::npos);
  EXPECT_NE(e.find("\t0x0000007c: (unreadable)\n---- Prior information ----\nloading /data/a.kgv\n"),
            std::string::npos)
      << e;
}

TEST(FatalSignal, AbortIsReportedToo) {
  auto r = runProcess({kgtest::buildDir() + "/tests/startup_crash_helper", "abort"},
                      plainEnv({"ASAN_OPTIONS=handle_segv=0:handle_abort=0"}));
  EXPECT_EQ(r.status, 1);
  EXPECT_NE(r.err.find("got signal 6 (SIGABRT - "), std::string::npos) << r.err;
}

TEST(ProductCommand, AnInstalledCopyFindsItsInstallationDirectory) {
  kgtest::TempDir prefix;
  auto inst = runProcess({"/usr/bin/env", "cmake", "--install", kgtest::buildDir(), "--prefix",
                          prefix.path()});
  ASSERT_EQ(inst.status, 0) << inst.err;
  auto r = runProcess({prefix.file("bin/kestrel"), "-export", "-version"}, plainEnv());
  EXPECT_EQ(r.status, 0);
  std::string dir = prefix.path() + "/share/kestrelgauge";
  EXPECT_NE(r.err.find("   Installed in:         " + dir + "\n"), std::string::npos) << r.err;
  EXPECT_TRUE(kgtest::fileExists(dir + "/scripts/file-coverage"));
}

TEST(MergeCommand, AccumulatesRunsIntoOneOfItsInputs) {
  kgtest::TempDir dir;
  std::string run = "record src/a.c build=100 first=1700000000 last=1700000100\n"
                    "function main line=3 calls=1\nblock 4 hits=2\n";
  kgtest::writeFile(dir.file("run.txt"), run);
  ASSERT_EQ(runProcess({kgtest::binPath("kgv-make"), dir.file("run.txt"), dir.file("all.kgv")}).status, 0);
  ASSERT_EQ(runProcess({kgtest::binPath("kgv-make"), dir.file("run.txt"), dir.file("new.kgv")}).status, 0);
  auto r = runProcess({kestrel(), "-merge=all.kgv", "all.kgv", "new.kgv"}, plainEnv(), "", dir.path());
  EXPECT_EQ(r.status, 0) << r.err;
  EXPECT_EQ(r.err, "");
  // Merging once more adds the new run again: sessions and hits keep adding up.
  r = runProcess({kestrel(), "-merge=all.kgv", "all.kgv", "new.kgv", "-locking=no"}, plainEnv(), "",
                 dir.path());
  EXPECT_EQ(r.status, 0) << r.err;
  EXPECT_FALSE(kgtest::fileExists(dir.file(".lock.quor.all.kgv")));
  std::unique_ptr<KgvData> merged;
  ASSERT_EQ(readKgvFile(dir.file("all.kgv"), merged), allOK);
  ASSERT_EQ(merged->records.size(), 1u);
  EXPECT_EQ(merged->records[0]->counts[0], 3u);  // sessions
  EXPECT_EQ(merged->records[0]->counts.back(), 6u);  // block hits
  // A missing input fails with its code and leaves the target alone.
  std::string before = kgtest::readFile(dir.file("all.kgv"));
  r = runProcess({kestrel(), "-merge=all.kgv", "all.kgv", "gone.kgv"}, plainEnv(), "", dir.path());
  EXPECT_EQ(r.status, 18);
  EXPECT_EQ(r.err.rfind("Kestrelgauge: Can't load file gone.kgv.\n", 0), 0u) << r.err;
  EXPECT_EQ(kgtest::readFile(dir.file("all.kgv")), before);
}
