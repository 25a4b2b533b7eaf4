// The resource files of an installation and of the user: which wins, what is missing,
// the shipped defaults, users' texts for error messages, and the per-user file at exit.
#include <gtest/gtest.h>
#include <sys/stat.h>

#include <cstdlib>

#include "settings/fallback_resources.h"
#include "settings/resource_database.h"
#include "settings/settings_startup.h"
#include "settings/settings_writer.h"
#include "settings_test_util.h"
#include "tests/common/test_support.h"

namespace {

// An installation directory with the given application-defaults files.
struct Installation {
  kgtest::TempDir dir;
  Installation() {
    mkdir(dir.file("UI").c_str(), 0755);
    mkdir(dir.file("UI/app-defaults").c_str(), 0755);
  }
  void appDefaults(const std::string& name, const std::string& text) {
    kgtest::writeFile(dir.file("UI/app-defaults/" + name), text);
  }
  ResourceSettingsInput input(const std::string& userFile) {
    ResourceSettingsInput in;
    in.installDir = dir.path();
    in.userDefaultsFile = userFile;
    return in;
  }
};

std::string value(const char* name) {
  std::string v;
  return lookupNamedText(name, v) ? v : "<none>";
}

}  // namespace

TEST(ResourceFiles, TheUsersFileBeatsTheApplicationDefaultsWhichBeatTheFallbackLines) {
  Installation inst;
  inst.appDefaults("Kestrelgauge", "*summaryLines: 40\n*helpFile: app_help.txt\n*showCounts: false\n");
  kgtest::writeFile(inst.dir.file("user"), "*summaryLines: 60\n");
  std::vector<std::string> warnings = loadResourceSettings(inst.input(inst.dir.file("user")));
  EXPECT_TRUE(warnings.empty());
  KG_Settings& s = kgSettings();
  EXPECT_EQ(s.summaryLines.value, 60);       // user over application defaults
  EXPECT_FALSE(s.showCounts.value);          // application defaults over the built-in value
  EXPECT_EQ(value("helpFile"), "app_help.txt");  // application defaults over a fallback line
  EXPECT_EQ(value("viewportFitsText"), "true");  // fallback lines are there
  EXPECT_EQ(getenv("OI_LIB"), inst.dir.file("UI"));
}

TEST(ResourceFiles, AUsersFileThatIsNoRegularFileIsSkipped) {
  Installation inst;
  std::string fifo = inst.dir.file("user");
  ASSERT_EQ(mkfifo(fifo.c_str(), 0600), 0);
  // Reading a pipe nobody writes to would wait for ever.
  EXPECT_TRUE(loadResourceSettings(inst.input(fifo)).empty());
  EXPECT_EQ(kgSettings().summaryLines.value, 30);
}

TEST(ResourceFiles, DisplayResourcesAndCommandLineLinesSitBelowTheUsersFile) {
  Installation inst;
  kgtest::writeFile(inst.dir.file("user"), "Kestrelgauge*summaryLines: 70\n");
  ResourceSettingsInput in = inst.input(inst.dir.file("user"));
  in.displayResources = "*summaryLines: 20\n*nameColumnWidth: 50\n";
  in.commandLineResources = {"*nameColumnWidth: 60", "*showToolbar: off"};
  in.greyBackground = true;
  loadResourceSettings(in);
  EXPECT_EQ(kgSettings().summaryLines.value, 70);
  EXPECT_EQ(kgSettings().nameColumnWidth.value, 60);
  EXPECT_FALSE(kgSettings().showToolbar.value);
  XrmDatabase db = resourceDatabase();
  char* type = nullptr;
  XrmValue v;
  ASSERT_TRUE(XrmGetResource(db, "kestrel.motif.background", "Kestrelgauge.Look.Background", &type, &v));
  EXPECT_STREQ(v.addr, "grey");
}

TEST(ResourceFiles, TheShippedApplicationDefaultsAgreeWithTheBuiltInValues) {
  std::string shipped = kgtest::sourceDir() + "/data/UI/app-defaults/Kestrelgauge";
  kgtest::TextDatabase none("");
  buildSettings(none.source());
  std::string builtIn = kgtest::writtenAll(true);

  kgtest::TextDatabase file(kgtest::readFile(shipped));
  KG_Settings& s = kgtest::settingsFrom(file);
  EXPECT_TRUE(file.warnings.empty());
  for (KG_Resource* r : registeredResources()) EXPECT_TRUE(r->found) << r->name() << " not shipped";
  EXPECT_EQ(kgtest::writtenAll(true), builtIn);
  EXPECT_EQ(s.lineNumberPaneTitle.value, " Line");

  // The template for the user's file only holds comments until the user edits it.
  kgtest::TextDatabase templ(kgtest::readFile(kgtest::sourceDir() + "/data/UI/app-defaults/Kestrelgauge.Xdefaults"));
  kgtest::settingsFrom(templ);
  for (KG_Resource* r : registeredResources()) EXPECT_FALSE(r->found) << r->name();
}

TEST(ResourceFiles, MissingLanguageFilesAreReportedAndEnglishIsShown) {
  Installation inst;
  inst.appDefaults("Kestrelgauge.msg", "*loadingKgvDataBusyMsg: Loading (ja)\n");
  ResourceSettingsInput in = inst.input(inst.dir.file("no-user-file"));
  in.language = 1;
  std::vector<std::string> warnings = loadResourceSettings(in);
  ASSERT_EQ(warnings.size(), 2u);
  std::string dir = inst.dir.file("UI/app-defaults");
  EXPECT_EQ(warnings[0], "The Japanese message file (" + dir +
                             "/Kestrelgauge.msg2) does not exist or is not readable.\n"
                             "Messages will be displayed in English.");
  EXPECT_EQ(warnings[1], "The Japanese label file (" + dir +
                             "/Kestrelgauge.label) does not exist or is not readable.\n"
                             "Labels will be displayed in English.");
  EXPECT_EQ(kgSettings().loadingKgvDataBusyMsg.value, "Loading (ja)");

  // English reads no language files and says nothing.
  in.language = 0;
  EXPECT_TRUE(loadResourceSettings(in).empty());
  EXPECT_EQ(kgSettings().loadingKgvDataBusyMsg.value, "Loading requested data.");
}

TEST(ResourceFiles, JavaTextsAreMergedAfterLoadingWhenTheFilesAreReadable) {
  Installation inst;
  inst.appDefaults("Kestrelgauge.java.msg", "*usedFunctionText: used method\n");
  loadResourceSettings(inst.input(inst.dir.file("no-user-file")));
  EXPECT_EQ(kgSettings().usedFunctionText.value, "used");
  std::vector<std::string> merged = mergeJavaResourceFiles(inst.dir.path());
  ASSERT_EQ(merged.size(), 1u);
  EXPECT_EQ(kgSettings().usedFunctionText.value, "used method");
}

TEST(ResourceFiles, ValuesTheConvertersRejectComeBackAsWarnings) {
  Installation inst;
  kgtest::writeFile(inst.dir.file("user"), "*summaryLines: many\n*sortCriterion: nonsense\n");
  std::vector<std::string> w = loadResourceSettings(inst.input(inst.dir.file("user")));
  EXPECT_EQ(w.size(), 2u);
  EXPECT_EQ(kgSettings().summaryLines.value, 30);
  EXPECT_EQ(defaultSortOrder(), 11);
}

TEST(ResourceFiles, TheDefaultSortOrderComesFromTheUsersSortCriterion) {
  Installation inst;
  kgtest::writeFile(inst.dir.file("user"), "Kestrelgauge*sortCriterion: l_unused%\n");
  loadResourceSettings(inst.input(inst.dir.file("user")));
  EXPECT_EQ(defaultSortOrder(), 7);
  kgSettings().sortCriterion.set(99);
  EXPECT_EQ(defaultSortOrder(), 11);
}

TEST(ResourceFiles, AUsersMessageForAnErrorReplacesTheTableText) {
  Installation inst;
  kgtest::writeFile(inst.dir.file("user"),
                    "Kestrelgauge*corruptKgvFile: Your data file is damaged;\\n collect it again.\n"
                    "Kestrelgauge*noOverWriteFile: Your settings could not be saved\n");
  loadResourceSettings(inst.input(inst.dir.file("user")));
  EXPECT_EQ(errorMessageWithName(corruptKgvFile), "Your data file is damaged;\n collect it again.");
  EXPECT_EQ(errorMessageWithName(fileTooShort), errorText(fileTooShort));
  // The console form keeps the table's text.
  EXPECT_EQ(errorMessage(corruptKgvFile), errorShortText(corruptKgvFile));
  // Dialog context texts are the user's too.
  SettingsOutcome o = writeViewSettings(inst.dir.file("no/such/dir/file"));
  EXPECT_EQ(o.context, "Your settings could not be saved");
  clearPendingSystemError();
  setErrorTextLookup(nullptr);
}

TEST(ResourceFiles, FallbackLinesAreComplete) {
  EXPECT_EQ(viewerFallbackLines().size(), 42u);
  Installation inst;
  loadResourceSettings(inst.input(inst.dir.file("none")));
  EXPECT_EQ(value("kgOutlineGang.kgFunctionUsedGlyph.translations"),
            "#override\n<Key>:      drop_through()\n<Btn3Down>: drop_through()\n<Btn3Up>:   drop_through()\n");
  EXPECT_EQ(value("KG_ScrollToFunction.label"), "Show annotated source");
  EXPECT_EQ(value("QR_OutlineExpand.helpFile"), "qr_help.txt");
  EXPECT_EQ(value("KG_ScrollToFunction.helpFile"), "kestrel_help.txt");
}

TEST(UserPaths, TildeAndEnvironmentReferencesAreExpanded) {
  const char* oldHome = getenv("HOME");
  std::string saved = oldHome ? oldHome : "";
  setenv("HOME", "/home/tester", 1);
  setenv("KG_TEST_DIR", "/data", 1);
  unsetenv("KG_TEST_UNSET");
  EXPECT_EQ(userDefaultsPath(), "/home/tester/.kestrel.Xdefaults");
  EXPECT_EQ(expandUserPath("~"), "/home/tester");
  EXPECT_EQ(expandUserPath("$KG_TEST_DIR/x"), "/data/x");
  EXPECT_EQ(expandUserPath("${KG_TEST_DIR}y/${KG_TEST_UNSET}z"), "/datay/z");
  EXPECT_EQ(expandUserPath("a$/b${unterminated"), "a$/b${unterminated");
  EXPECT_EQ(expandUserPath("/plain/path"), "/plain/path");
  EXPECT_EQ(expandUserPath("~root/x").rfind("/", 0), 0u);
  if (oldHome)
    setenv("HOME", saved.c_str(), 1);
  else
    unsetenv("HOME");
}

TEST(UserDefaultsFile, IsCreatedFromTheTemplateWhenMissing) {
  Installation inst;
  inst.appDefaults("Kestrelgauge.Xdefaults", std::string(3000, '!') + "\n*showCounts: false\n");
  std::string user = inst.dir.file(".kestrel.Xdefaults");
  std::string info = createUserDefaultsFileFromTemplate(inst.dir.path(), user);
  EXPECT_EQ(info.rfind("The file " + user + " has been created for you.\n"
                       "This file allows you to customize the look-and-feel of the Kestrelgauge Viewer.\n\n",
                       0),
            0u);
  EXPECT_NE(info.find("Please refer to the Kestrelgauge User's Guide for more information.\n"),
            std::string::npos);
  EXPECT_EQ(kgtest::readFile(user), kgtest::readFile(inst.dir.file("UI/app-defaults/Kestrelgauge.Xdefaults")));

  // Once it is there it is the user's: nothing happens again.
  kgtest::writeFile(user, "! edited\n");
  EXPECT_EQ(createUserDefaultsFileFromTemplate(inst.dir.path(), user), "");
  EXPECT_EQ(kgtest::readFile(user), "! edited\n");
}

TEST(UserDefaultsFile, AFileTheUserCannotReadIsNeverReplaced) {
  Installation inst;
  inst.appDefaults("Kestrelgauge.Xdefaults", "! template\n");
  // A link whose target is gone (a dot-files directory not mounted) is left alone.
  std::string link = inst.dir.file(".kestrel.Xdefaults");
  ASSERT_EQ(symlink("unmounted/kestrel.Xdefaults", link.c_str()), 0);
  EXPECT_EQ(createUserDefaultsFileFromTemplate(inst.dir.path(), link), "");
  struct stat st;
  ASSERT_EQ(lstat(link.c_str(), &st), 0);
  EXPECT_TRUE(S_ISLNK(st.st_mode));
}

TEST(UserDefaultsFile, AnUnreadableFileIsNeverReplaced) {
  if (geteuid() == 0) GTEST_SKIP() << "root reads every file";
  Installation inst;
  inst.appDefaults("Kestrelgauge.Xdefaults", "! template\n");
  std::string user = inst.dir.file(".kestrel.Xdefaults");
  kgtest::writeFile(user, "secret\n");
  chmod(user.c_str(), 0);
  EXPECT_EQ(createUserDefaultsFileFromTemplate(inst.dir.path(), user), "");
  chmod(user.c_str(), 0600);
  EXPECT_EQ(kgtest::readFile(user), "secret\n");
}

TEST(UserDefaultsFile, NoTemplateNoFile) {
  Installation inst;
  std::string user = inst.dir.file(".kestrel.Xdefaults");
  EXPECT_EQ(createUserDefaultsFileFromTemplate(inst.dir.path(), user), "");
  EXPECT_FALSE(kgtest::fileExists(user));
}
