// One script run without a display: the shell line keeps odd paths in one piece, arguments
// stay shell text, nothing is left in the temporary directory, limits are refused.
#include "updates/script_run.h"

#include <gtest/gtest.h>
#include <sys/stat.h>

#include "coverage/adjustment_list.h"
#include "coverage/kgv_file.h"
#include "coverage/summary_build.h"
#include "support/temp_file.h"
#include "tests/common/test_support.h"
#include "tools/kgv_maker.h"

namespace {

class ScriptRun : public ::testing::Test {
 protected:
  void SetUp() override {
    setenv("TMPDIR", tmp.path().c_str(), 1);
    kgResetTempDirectory();
    install = dir.file("an 'odd' install");
    ASSERT_EQ(mkdir(install.c_str(), 0755), 0);
    ASSERT_EQ(mkdir((install + "/bin").c_str(), 0755), 0);
    ASSERT_EQ(symlink((kgtest::buildDir() + "/bin/kgmx").c_str(), (install + "/bin/kgmx").c_str()), 0);
    std::string error;
    ASSERT_TRUE(makeKgvFile("record d/a.c\nfunction f line=1 calls=1\nblock 2 hits=1\n", dir.file("a.kgv"), error));
    ASSERT_EQ(readKgvFile(dir.file("a.kgv"), data), allOK);
    MessageList messages;
    AdjustmentList none;
    ASSERT_EQ(buildSummary(*data, 1, 1, none, messages, summary), allOK);
  }
  void TearDown() override {
    unsetenv("TMPDIR");
    kgResetTempDirectory();
  }
  std::string script(const std::string& name, const std::string& body) {
    std::string path = install + "/" + name;
    kgtest::writeFile(path, "#!/bin/sh\n" + body);
    chmod(path.c_str(), 0755);
    return path;
  }

  kgtest::TempDir dir, tmp;
  std::string install;
  std::unique_ptr<KgvData> data;
  std::unique_ptr<SumRoot> summary;
  MessageList messages;
};

TEST_F(ScriptRun, OddPathsStayWholeAndArgumentsAreShellText) {
  std::string s = script("it's here", "echo \"$# args: $1|$2\"\ngrep -c '^fi\t'\nexit 0\n");
  ScriptOutput out;
  ASSERT_EQ(runScript(*summary, install, s, "one 'two three' $((40 + 2))", messages, out), allOK);
  EXPECT_EQ(out.text, "3 args: one|two three\n1\n");
  EXPECT_EQ(out.title, "it's here");
  EXPECT_EQ(kgtest::runProcess({"/bin/ls", "-A", tmp.path()}).out, "") << "the temporary files are gone";
}

TEST_F(ScriptRun, StatusAndLimits) {
  std::string s = script("fails", "cat > /dev/null\necho out; echo err >&2\nexit 7\n");
  ScriptOutput out;
  EXPECT_EQ(runScript(*summary, install, s, "", messages, out), cmdErrStatus);
  EXPECT_EQ(out.text, "out\nerr\n");
  EXPECT_TRUE(out.shown);

  std::string marker = dir.file("ran");
  std::string t = script("touches", "touch '" + marker + "'\n");
  EXPECT_EQ(runScript(*summary, install, t, std::string(kScriptArgumentLimit + 1, 'x'), messages, out), argError);
  EXPECT_NE(errorMessage(argError).find("limit is 4095"), std::string::npos);
  EXPECT_FALSE(out.shown);
  EXPECT_FALSE(kgtest::fileExists(marker)) << "refused, not cut and run";
  EXPECT_EQ(runScript(*summary, install, t, std::string(kScriptArgumentLimit - 10, ' '), messages, out), allOK);
  EXPECT_TRUE(kgtest::fileExists(marker));
}

TEST(ScriptsDirectory, ExecutableRegularFilesSortedAndTheTwoFailures) {
  kgtest::TempDir dir;
  for (const char* n : {"b", "a", "c.txt"}) kgtest::writeFile(dir.file(n), "#!/bin/sh\n");
  chmod(dir.file("a").c_str(), 0755);
  chmod(dir.file("b").c_str(), 0755);
  mkdir(dir.file("subdir").c_str(), 0755);
  std::vector<std::string> names;
  bool over = true;
  ASSERT_EQ(listScripts(dir.path(), names, over), allOK);
  EXPECT_EQ(names, (std::vector<std::string>{"a", "b"}));
  EXPECT_FALSE(over);
  EXPECT_EQ(listScripts(dir.file("missing"), names, over), dirNotRead);
  EXPECT_NE(errorMessage(dirNotRead).find("Directory " + dir.file("missing") + " can't be opened."), std::string::npos);
  chmod(dir.file("a").c_str(), 0644);
  chmod(dir.file("b").c_str(), 0644);
  EXPECT_EQ(listScripts(dir.path(), names, over), dirEmpty);
  EXPECT_NE(errorMessage(dirEmpty).find("The scripts are missing from " + dir.path() + "."), std::string::npos);
}

}  // namespace
