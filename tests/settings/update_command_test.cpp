// "Update ~/.kestrel.Xdefaults": the real update command merges the changed settings into the
// user's file; failures of the command come back as error 33.
#include <dirent.h>
#include <fcntl.h>
#include <gtest/gtest.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cstdlib>
#include <optional>

#include "settings/settings_writer.h"
#include "settings_test_util.h"
#include "tests/common/test_support.h"

namespace {

// Runs each case with its own temporary directory for the settings file of the command.
class UpdateCommand : public ::testing::Test {
 protected:
  void SetUp() override {
    for (const char* name : {"TMPDIR", "PATH"}) {
      const char* v = getenv(name);
      saved.emplace_back(name, v ? std::optional<std::string>(v) : std::nullopt);
    }
    setenv("TMPDIR", tmp.path().c_str(), 1);
    // The installation's bin/ holds the command; PATH does not.
    setenv("PATH", "/usr/bin:/bin", 1);
    settings = &kgtest::settingsFrom(none);
  }
  void TearDown() override {
    clearPendingSystemError();
    for (const auto& [name, v] : saved) {
      if (v)
        setenv(name.c_str(), v->c_str(), 1);
      else
        unsetenv(name.c_str());
    }
  }

  size_t leftoverTempFiles() const {
    size_t n = 0;
    DIR* d = opendir(tmp.path().c_str());
    while (dirent* e = readdir(d))
      if (std::string(e->d_name).rfind("kgXdf", 0) == 0) ++n;
    closedir(d);
    return n;
  }

  kgtest::TempDir home;
  kgtest::TempDir tmp;
  kgtest::TextDatabase none{""};
  KG_Settings* settings = nullptr;
  std::vector<std::pair<std::string, std::optional<std::string>>> saved;
  std::string install = kgtest::buildDir();
};

}  // namespace

TEST_F(UpdateCommand, MergesIntoTheUsersFileKeepingTheirOtherLines) {
  std::string user = home.file(".kestrel.Xdefaults");
  kgtest::writeFile(user,
                    "! my own settings\n"
                    "XTerm*background: black\n"
                    "Kestrelgauge*summaryLines: 50\n"
                    "*showCounts:   false\n"
                    "Kestrelgauge*loadingKgvDataBusyMsg: Patience,\\n\\\n please.\n"
                    "#include \".Xresources.local\"\n"
                    "kestrel*nameColumnWidth: \\\n   48\n");
  settings->summaryLines.setValue(64);
  settings->coverageChangesOption.set(KG_FileUpdateResource::reload);
  SettingsOutcome o = updateUserDefaultsFile(install, user);
  ASSERT_EQ(o.code, allOK) << pendingSystemError();
  EXPECT_TRUE(o.consoleWarnings.empty());
  std::string text = kgtest::readFile(user);
  EXPECT_EQ(text.rfind("! my own settings\nXTerm*background: black\nKestrelgauge*summaryLines: 64\n"
                       "Kestrelgauge*showCounts: true\n"
                       "Kestrelgauge*loadingKgvDataBusyMsg: Patience,\\n\\\n please.\n"
                       "#include \".Xresources.local\"\n"
                       "Kestrelgauge*nameColumnWidth: 32\n",
                       0),
            0u)
      << text;
  EXPECT_NE(text.find("\nKestrelgauge*coverageChangesOption: reload\n"), std::string::npos);
  EXPECT_EQ(text.find("summaryLines: 50"), std::string::npos);
  EXPECT_EQ(leftoverTempFiles(), 0u);

  // The next session reads what was merged.
  kgtest::TextDatabase next(text);
  KG_Settings& n = kgtest::settingsFrom(next);
  EXPECT_EQ(n.summaryLines.value, 64);
  EXPECT_EQ(n.coverageChangesOption.value, 3);
  EXPECT_EQ(n.loadingKgvDataBusyMsg.value, "Patience,\n please.");

  // Updating again changes nothing that is already right.
  ASSERT_EQ(updateUserDefaultsFile(install, user).code, allOK);
  EXPECT_EQ(kgtest::readFile(user), text);
}

TEST_F(UpdateCommand, CreatesTheUsersFileWhenThereIsNone) {
  std::string user = home.file("it's a dir/.kestrel.Xdefaults");
  ASSERT_EQ(mkdir(home.file("it's a dir").c_str(), 0755), 0);
  settings->showToolbar = false;
  SettingsOutcome o = updateUserDefaultsFile(install, user);
  ASSERT_EQ(o.code, allOK) << pendingSystemError();
  kgtest::TextDatabase back(kgtest::readFile(user));
  KG_Settings& b = kgtest::settingsFrom(back);
  EXPECT_FALSE(b.showToolbar.value);
  EXPECT_TRUE(b.showToolbar.found);
  EXPECT_FALSE(b.adjustmentCommentFormat.found);  // only what the GUI changes
}

TEST_F(UpdateCommand, ACommandThatIsNowhereToBeFoundGivesError33AndAWarning) {
  settings->xdefaultsUpdateCommandString.value = "no_such_xdef_editor --merge";
  SettingsOutcome o = updateUserDefaultsFile(install, home.file(".kestrel.Xdefaults"));
  EXPECT_EQ(o.code, cmdErrStatus);
  EXPECT_EQ(o.messageName, "noUpdateResourceFile");
  EXPECT_EQ(o.context, "Unable to update your resource file");
  ASSERT_EQ(o.consoleWarnings.size(), 1u);
  EXPECT_EQ(o.consoleWarnings[0], "\n\nWarning: Command 'no_such_xdef_editor' not found in PATH:\n\n"
                                  "/usr/bin:/bin:" + install + ":" + install + "/bin\n");
  EXPECT_EQ(leftoverTempFiles(), 0u);
  EXPECT_FALSE(kgtest::fileExists(home.file(".kestrel.Xdefaults")));
}

TEST_F(UpdateCommand, ACommandThatFailsGivesError33) {
  settings->xdefaultsUpdateCommandString.value = "false";
  SettingsOutcome o = updateUserDefaultsFile(install, home.file(".kestrel.Xdefaults"));
  EXPECT_EQ(o.code, cmdErrStatus);
  EXPECT_NE(pendingSystemError().find("Exit status: 1"), std::string::npos);
  EXPECT_EQ(leftoverTempFiles(), 0u);
}

TEST_F(UpdateCommand, AnEmptyCommandOnlySaysSo) {
  settings->xdefaultsUpdateCommandString.value = "";
  SettingsOutcome o = updateUserDefaultsFile(install, home.file(".kestrel.Xdefaults"));
  EXPECT_EQ(o.code, allOK);
  EXPECT_EQ(o.notice, "Kestrelgauge*xdefaultsUpdateCommandString is unset");
  EXPECT_EQ(leftoverTempFiles(), 0u);
}

TEST_F(UpdateCommand, TheCommandGetsItsArgumentsAndNoneOfTheViewersOpenFiles) {
  // A command of the user's own that records what it was given.
  std::string record = home.file("record");
  std::string script = home.file("my-editor");
  kgtest::writeFile(script, "#!/bin/sh\nprintf '%s|' \"$@\" > '" + record +
                                "'\ncat \"$5\" >> '" + record + "'\nls /proc/$$/fd >> '" + record + "'\n");
  chmod(script.c_str(), 0755);
  int fd = open("/dev/null", O_RDONLY);  // an open descriptor without close-on-exec
  ASSERT_GE(fd, 3);
  settings->xdefaultsUpdateCommandString.value = script + " extra";
  settings->summaryLines.setValue(77);
  SettingsOutcome o = updateUserDefaultsFile(install, home.file("user file"));
  close(fd);
  ASSERT_EQ(o.code, allOK) << pendingSystemError();
  std::string got = kgtest::readFile(record);
  std::string head = "extra|Kestrelgauge|" + install + "|" + home.file("user file") + "|" + tmp.path() + "/kgXdf";
  EXPECT_EQ(got.rfind(head, 0), 0u) << got;
  EXPECT_NE(got.find("Kestrelgauge*summaryLines: 77\n"), std::string::npos);
  // Only the standard descriptors (and the one ls itself opens) are left.
  size_t list = got.find("showBlocksTotal");
  list = got.find('\n', list) + 1;
  std::string fds = got.substr(list);
  EXPECT_EQ(fds.find("\n" + std::to_string(fd) + "\n"), std::string::npos) << fds;
  EXPECT_EQ(leftoverTempFiles(), 0u);
}

TEST_F(UpdateCommand, ATemporaryDirectoryThatIsNotThereGivesError19) {
  setenv("TMPDIR", home.file("gone").c_str(), 1);
  SettingsOutcome o = updateUserDefaultsFile(install, home.file(".kestrel.Xdefaults"));
  EXPECT_EQ(o.code, writeError);
  EXPECT_EQ(o.messageName, "noCreateTempFile");
  EXPECT_EQ(o.context, "Unable to create temporary file");
  EXPECT_EQ(pendingSystemError().rfind("Temp file name: " + home.file("gone") + "/kgXdf", 0), 0u)
      << pendingSystemError();
  EXPECT_FALSE(kgtest::fileExists(home.file(".kestrel.Xdefaults")));
}

TEST(UpdateCommandLine, PathsAreQuotedForTheShell) {
  EXPECT_EQ(updateCommandLine("edit", "/opt/kg", "/home/o'brien/.kestrel.Xdefaults", "/tmp/kgXdf1"),
            "edit Kestrelgauge '/opt/kg' '/home/o'\\''brien/.kestrel.Xdefaults' '/tmp/kgXdf1'");
}
