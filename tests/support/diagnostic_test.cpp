// Console diagnostics: layout, limits, current file, clean-up and settings.
#include "support/diagnostic.h"
#include "support/temp_file.h"

#include <gtest/gtest.h>

#include <cstdlib>

namespace {

class Diagnostics : public testing::Test {
 protected:
  void SetUp() override {
    diag::setIdentity("Kestrelgauge viewer", "Kestrelgauge", "kestrel");
    diag::setQuiet(false);
    diag::setLevel(0);
    diag::setWarningLimit(0);
    diag::setCurrentFile(nullptr);
    unsetenv("QUOR_WHERE_AM_I");
  }
};

std::string captured(void (*f)()) {
  testing::internal::CaptureStderr();
  f();
  return testing::internal::GetCapturedStderr();
}

int gCleanups = 0;
void countCleanup(void*) { ++gCleanups; }

}  // namespace

TEST_F(Diagnostics, MessagesEndWithExactlyOneNewline) {
  EXPECT_EQ(captured([] { kgWarning("no newline"); }),
            "Kestrelgauge viewer: Warning: no newline\n");
  EXPECT_EQ(captured([] { kgWarning("has one\n"); }), "Kestrelgauge viewer: Warning: has one\n");
  EXPECT_EQ(captured([] { kgError("%d files", 3); }).rfind("Kestrelgauge viewer: Error: 3 files\n", 0),
            0u);
}

TEST_F(Diagnostics, LevelsGateNotesAndDebugMessages) {
  EXPECT_EQ(captured([] { kgNote("hidden"); }), "");
  diag::setLevel(1);
  EXPECT_EQ(captured([] { kgNote("shown"); }), "Kestrelgauge viewer: Note: shown\n");
  EXPECT_EQ(captured([] { kgDiag("hidden"); }), "");
  diag::setLevel(4);
  EXPECT_EQ(captured([] { kgDebug("deep"); }), "Kestrelgauge viewer: Debug: deep\n");
  diag::setQuiet(true);
  EXPECT_EQ(captured([] { kgWarning("quiet"); }), "");
  EXPECT_EQ(captured([] { kgTracedNote("quiet"); }), "");
}

TEST_F(Diagnostics, CurrentFileIsNamedOnceForItsMessages) {
  diag::setCurrentFile("a.kgv");
  EXPECT_EQ(captured([] {
              kgWarning("first");
              kgWarning("second");
            }),
            "While processing file a.kgv:\nKestrelgauge viewer: Warning: first\n"
            "Kestrelgauge viewer: Warning: second\n");
  diag::setCurrentFile("b.kgv");
  EXPECT_EQ(captured([] { kgWarning("third"); }),
            "While processing file b.kgv:\nKestrelgauge viewer: Warning: third\n");
}

TEST_F(Diagnostics, WarningsOverTheLimitAreCountedNotPrinted) {
  diag::setWarningLimit(3);
  unsigned before = diag::warningCount();
  unsigned suppressedBefore = diag::suppressedCount();
  std::string out = captured([] {
    for (int i = 1; i <= 5; ++i) kgWarning("w%d", i);
  });
  EXPECT_EQ(out,
            "Kestrelgauge viewer: Warning: w1\nKestrelgauge viewer: Warning: w2\n"
            "Kestrelgauge viewer: Warning: w3\n");
  EXPECT_EQ(diag::warningCount() - before, 5u);
  EXPECT_EQ(diag::suppressedCount() - suppressedBefore, 2u);
}

TEST_F(Diagnostics, WhereAmIAddsACallChain) {
  setenv("QUOR_WHERE_AM_I", "1", 1);
  std::string out = captured([] { kgWarning("traced"); });
  EXPECT_NE(out.find("This is happening in Kestrelgauge viewer:\n0: 0x"), std::string::npos) << out;
}

TEST_F(Diagnostics, FatalErrorsRunCleanupsAndExitWithOne) {
  EXPECT_EXIT(
      {
        diag::addCleanup([](void*) { fputs("cleaned\n", stderr); }, nullptr);
        kgFatal("stop here");
      },
      testing::ExitedWithCode(1), "Error: stop here\n(.|\n)*cleaned|cleaned");
  EXPECT_EXIT(kgStrdup(nullptr), testing::ExitedWithCode(1),
              "Internal error: NULL passed to strdup\\.");
  EXPECT_EXIT(
      {
        char small[4];
        Strcpyn(small, "too long", sizeof small);
      },
      testing::ExitedWithCode(1), "Strcpyn: bad argument: 0x[0-9a-f]+ 0x[0-9a-f]+ 4");
}

TEST_F(Diagnostics, CleanupsCanBeRemovedAndRunOnce) {
  gCleanups = 0;
  diag::addCleanup(countCleanup, &gCleanups);
  diag::addCleanup(countCleanup, nullptr);
  diag::removeCleanup(countCleanup, nullptr);
  diag::runCleanups();
  diag::runCleanups();
  EXPECT_EQ(gCleanups, 1);
}

TEST_F(Diagnostics, AllocationFailureNamesTheRequest) {
#if defined(__SANITIZE_ADDRESS__)
  GTEST_SKIP() << "the sanitizer's allocator stops the process before malloc can fail";
#endif
  EXPECT_EXIT(kgMalloc(static_cast<size_t>(1) << 62), testing::ExitedWithCode(1),
              "Memory allocation failed during a request for 4611686018427387904 bytes\\.\n"
              "This is usually caused by exhausting the available swap space\\.");
}

TEST_F(Diagnostics, TemporaryDirectoryAndLanguage) {
  setenv("TMPDIR", "", 1);
  kgResetTempDirectory();
  EXPECT_STREQ(kgTempDirectory(), "");
  unsetenv("TMPDIR");
  kgResetTempDirectory();
  EXPECT_STREQ(kgTempDirectory(), "/tmp");

  for (const char* v : {"QUOR_LANG", "LC_ALL", "LC_MESSAGES", "LC_CTYPE", "LANG"}) unsetenv(v);
  EXPECT_EQ(kgChooseLanguage(nullptr), 0);
  setenv("LANG", "ja_JP", 1);
  EXPECT_EQ(kgChooseLanguage(nullptr), 1);
  setenv("LC_CTYPE", "C", 1);  // the first non-empty variable decides
  EXPECT_EQ(kgChooseLanguage(nullptr), 0);
  EXPECT_EQ(kgChooseLanguage("Japanese"), 1);
  EXPECT_EQ(captured([] { EXPECT_EQ(kgChooseLanguage("de_DE"), 0); }),
            "Kestrelgauge viewer: Warning: Unknown language \"de_DE\", using English.\n");
  unsetenv("LC_CTYPE");
  unsetenv("LANG");
}

TEST_F(Diagnostics, DemanglerFallsBackToTheInternalOne) {
  std::string out = captured([] { EXPECT_FALSE(kgStartDemangler("no-such-demangler-program")); });
  EXPECT_NE(out.find("Using internal demangler."), std::string::npos);
  EXPECT_EQ(kgDemangle("_ZN3foo3barEi"), "foo::bar(int)");
  EXPECT_EQ(kgDemangle("main"), "main");
}
