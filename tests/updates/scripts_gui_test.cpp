// Scripts over the coverage data as a user runs them from "kestrel -view" on a private X
// server: the scripts menu, a script's output window, failing scripts, saving the output,
// installations whose scripts are missing, and the Debug menu.
#include <gtest/gtest.h>
#include <sys/stat.h>
#include <unistd.h>

#include <regex>

#include "tests/toolkit/gui_driver.h"
#include "tools/kgv_maker.h"

namespace kgtest {
namespace {

class Scripts : public ::testing::Test {
 protected:
  void SetUp() override {
    ASSERT_FALSE(server.display().empty()) << "Xvfb did not start";
    // Output windows beside the main window: no window manager places them.
    writeFile(dir.file(".kestrel.Xdefaults"), "Kestrelgauge*kgScriptOutput.geometry: 600x400+660+0\n");
    // An installation of our own (with a blank in its name), whose scripts the test chooses.
    install = dir.file("my install");
    ASSERT_EQ(mkdir(install.c_str(), 0755), 0);
    ASSERT_EQ(mkdir((install + "/bin").c_str(), 0755), 0);
    ASSERT_EQ(mkdir((install + "/scripts").c_str(), 0755), 0);
    ASSERT_EQ(symlink((buildDir() + "/bin/kgmx").c_str(), (install + "/bin/kgmx").c_str()), 0);
    ASSERT_EQ(symlink((buildDir() + "/UI").c_str(), (install + "/UI").c_str()), 0);
    std::string error;
    ASSERT_TRUE(makeKgvFile("generate records=40 functions=5 blocks=6 seed=3\n", dir.file("p.kgv"), error)) << error;
  }
  void TearDown() override {
    if (app && app->running()) {
      EXPECT_EQ(app->stop(), 0) << app->errorOutput();
    }
  }
  void script(const std::string& name, const std::string& body, mode_t mode = 0755) {
    const std::string path = install + "/scripts/" + name;
    writeFile(path, "#!/bin/sh\n" + body);
    ASSERT_EQ(chmod(path.c_str(), mode), 0);
  }
  std::vector<std::string> argv() const {
    return {buildDir() + "/bin/kestrel-viewer", "-view", "-kestrelhome=" + install,
            "-adjustmentfilename=" + dir.file("adjust"), dir.file("p.kgv")};
  }
  void start() {
    app = std::make_unique<GuiApp>(server, argv(), std::vector<std::string>{"HOME=" + dir.path()});
    ASSERT_TRUE(app->waitFor([](const GuiState& s) { return s.find("kgOutline") && !s.find("kgOutline")->lines.empty(); },
                             &last)) << app->errorOutput();
  }
  void click(const std::string& name, size_t n = 0) {
    GuiState s;
    ASSERT_TRUE(app->waitFor([&](const GuiState& st) {
      std::vector<const WidgetInfo*> all = st.findAll(name);
      return all.size() > n && all[n]->flag("viewable");
    }, &s)) << name << "\n" << s.raw().substr(0, 1500);
    const WidgetInfo* w = s.findAll(name)[n];
    usleep(150 * 1000);
    app->click(w->x + w->width / 2, w->y + w->height / 2);
  }
  // Runs a script from the File menu with the arguments typed into the field.
  void runScript(const std::string& name, const std::string& arguments = {}) {
    click("kgFilePulldown");
    click("kgFile.kgRunScript");
    click("kgScriptMenu");
    click("kgScriptMenuPane." + name);
    ASSERT_TRUE(app->waitFor([&](const GuiState& s) {
      const WidgetInfo* m = s.find("kgScriptMenu");
      return m && m->field("choice") == name && !s.viewable("kgScriptMenuPane");
    }, &last)) << last.raw().substr(0, 1000);
    if (!arguments.empty()) {
      click("kgScriptArgs");
      app->xdotool({"type", arguments});
      ASSERT_TRUE(app->waitFor([&](const GuiState& s) { return s.find("kgScriptArgs")->field("value") == arguments; },
                               &last));
    }
    click("kgRunScript.OK");
  }
  // The lines of the n-th output window, once it shows them.
  std::vector<std::string> output(size_t n = 0) {
    EXPECT_TRUE(app->waitFor([&](const GuiState& s) {
      std::vector<const WidgetInfo*> texts = s.findAll("kgScriptOutputScroll.kgScriptOutput");
      return texts.size() > n && texts[n]->flag("viewable");
    }, &last, 10000)) << app->errorOutput();
    std::vector<const WidgetInfo*> texts = last.findAll("kgScriptOutputScroll.kgScriptOutput");
    return texts.size() > n ? texts[n]->lines : std::vector<std::string>{};
  }
  std::string outputTitle(size_t n = 0) {
    last = app->state();
    std::vector<const WidgetInfo*> shells;
    for (const WidgetInfo* w : last.findAll("kgScriptOutput"))
      if (w->field("class") == "TopLevelShell") shells.push_back(w);
    return shells.size() > n ? shells[n]->field("title") : std::string();
  }

  XvfbServer server;
  TempDir dir;
  std::string install;
  std::unique_ptr<GuiApp> app;
  GuiState last;
};

TEST_F(Scripts, AScriptGetsTheExportAndItsOutputAndArgumentsAreShown) {
  script("count-files", "echo \"args: $*\"\ngrep -c '^fi\t'\n");
  script("z-other", "cat > /dev/null\n");
  script("not-a-script", "exit 0\n", 0644);
  start();
  runScript("count-files", "alpha 'two words' gamma");
  std::vector<std::string> lines = output();
  ASSERT_EQ(lines.size(), 2u) << app->errorOutput();
  EXPECT_EQ(lines[0], "args: alpha two words gamma");
  EXPECT_EQ(lines[1], "40");
  EXPECT_EQ(outputTitle(), "count-files");
  EXPECT_FALSE(app->state().viewable("kgErrorDialog"));
  // The menu offers the executable files only, sorted.
  last = app->state();
  std::vector<std::string> offered;
  for (const char* n : {"count-files", "z-other", "not-a-script"})
    if (last.find(std::string("kgScriptMenuPane.") + n)) offered.push_back(n);
  EXPECT_EQ(offered, (std::vector<std::string>{"count-files", "z-other"}));

  // A second run opens a second window beside the first.
  runScript("z-other");
  EXPECT_TRUE(output(1).empty());
  EXPECT_EQ(outputTitle(0), "count-files");
  EXPECT_EQ(outputTitle(1), "z-other");
}

TEST_F(Scripts, AFailingScriptStillShowsItsOutputAndTheFailure) {
  script("fails", "read first\necho \"read: $first\"\necho 'to stderr' >&2\nexit 3\n");
  script("reads-nothing", "echo ignored the data\n");
  // Enough data that the report cannot fit into a pipe the script never reads.
  std::string error;
  ASSERT_TRUE(makeKgvFile("generate records=3000 functions=10 blocks=10 seed=4\n", dir.file("p.kgv"), error)) << error;
  start();
  runScript("fails");
  std::vector<std::string> lines = output();
  ASSERT_EQ(lines.size(), 2u);
  EXPECT_EQ(lines[0], "read: " + std::string(79, '#'));
  EXPECT_EQ(lines[1], "to stderr");
  ASSERT_TRUE(app->waitViewable("kgErrorDialog", &last));
  const std::string message = last.find("kgErrorDialog")->field("message");
  EXPECT_EQ(message.find("Requested script failed"), 0u) << message;
  EXPECT_NE(message.find("The command returned an error status."), std::string::npos) << message;
  click("kgErrorDialog.kgOK");

  // The viewer survives a reader that stops early, and it is no failure.
  runScript("reads-nothing");
  EXPECT_EQ(output(1), std::vector<std::string>{"ignored the data"});
  EXPECT_TRUE(app->running());
  usleep(300 * 1000);
  EXPECT_FALSE(app->state().viewable("kgErrorDialog"));
}

TEST_F(Scripts, SavedOutputIsTheOutputByteForByte) {
  script("bytes", "cat > /dev/null\nprintf 'one\\n\\ttabbed \\303\\251\\n\\nlast'\n");
  start();
  runScript("bytes");
  ASSERT_EQ(output().size(), 4u);
  click("kgScriptOutput.mainWindow.kgTopMenu.kgFilePulldown");
  click("kgFile.kgSaveScriptOutput", 0);
  const std::string target = dir.file("saved output.txt");
  click("kgFileDialog.Text");
  GuiState now = app->state();
  app->key("End");
  const size_t typed = now.find("kgFileDialog.Text")->field("value").size();
  if (typed > 0) app->xdotool({"key", "--repeat", std::to_string(typed), "BackSpace"});
  app->xdotool({"type", target});
  ASSERT_TRUE(app->waitFor([&](const GuiState& s) { return s.find("kgFileDialog.Text")->field("value") == target; },
                           &last));
  click("kgFileDialog.OK");
  ASSERT_TRUE(app->waitFor([&](const GuiState&) { return fileExists(target); }, &last));
  EXPECT_EQ(readFile(target), "one\n\ttabbed \xc3\xa9\n\nlast");
  // Close: the window goes.
  click("kgScriptOutput.mainWindow.kgTopMenu.kgFilePulldown");
  click("kgFile.kgClose", 0);
  EXPECT_TRUE(app->waitFor([](const GuiState& s) { return !s.viewable("kgScriptOutputScroll"); }, &last));
}

TEST_F(Scripts, TooManyScriptsAreCutAtTheLimitWithAWarning) {
  for (int i = 0; i < 300; ++i) {
    char name[16];
    snprintf(name, sizeof name, "s%03d", (i * 7) % 300);
    script(name, "cat > /dev/null\necho " + std::string(name) + "\n");
  }
  start();
  ASSERT_TRUE(app->waitViewable("kgWarningDialog", &last)) << app->errorOutput();
  EXPECT_EQ(last.find("kgWarningDialog")->field("message"),
            "Some scripts were not added to the scripts menu becausethere were more than the limit of 250.");
  click("kgWarningDialog.kgOK");
  last = app->state();
  std::vector<std::string> offered;
  const std::string prefix = "kgScriptMenuPane.";
  std::istringstream in(last.raw());
  for (std::string l; std::getline(in, l);) {
    size_t at = l.rfind(prefix, l.find(" "));
    if (at != std::string::npos && l.find(" class=XmPushButton") != std::string::npos)
      offered.push_back(l.substr(at + prefix.size(), l.find(' ', at) - at - prefix.size()));
  }
  EXPECT_EQ(offered.size(), 250u);
  EXPECT_TRUE(std::is_sorted(offered.begin(), offered.end()));
  // 25 to a column.
  const WidgetInfo* first = last.find(prefix + offered[0]);
  const WidgetInfo* next = last.find(prefix + offered[25]);
  ASSERT_TRUE(first && next);
  EXPECT_GT(next->x, first->x);
}

TEST_F(Scripts, AnInstallationWithoutScriptsDoesNotStart) {
  script("readme", "not a script\n", 0644);
  auto r = runProcess(argv(), {"DISPLAY=" + server.display(), "HOME=" + dir.path(), x11LeakSuppressions()});
  EXPECT_EQ(r.status, 24);
  EXPECT_NE(r.err.find("Couldn't construct viewer window:\nThe directory contained no appropriate entries.\n"
                       "Your Kestrelgauge installation is corrupted.\nThe scripts are missing from " +
                       install + "/scripts."),
            std::string::npos) << r.err;
  ASSERT_EQ(rename((install + "/scripts").c_str(), (install + "/gone").c_str()), 0);
  r = runProcess(argv(), {"DISPLAY=" + server.display(), "HOME=" + dir.path(), x11LeakSuppressions()});
  EXPECT_EQ(r.status, 23);
  EXPECT_NE(r.err.find("Directory " + install + "/scripts can't be opened."), std::string::npos) << r.err;
}

TEST_F(Scripts, TheDebugMenuCallsTheCollectionInterfaceAndDumpsResources) {
  script("x", "cat > /dev/null\n");
  start();
  click("kgDebugPulldown");
  click("kgDebug.kgAPI");
  click("kgAPIMenu.kgAPIClearData");
  ASSERT_TRUE(app->waitViewable("kgInformationDialog", &last));
  EXPECT_EQ(last.find("kgInformationDialog")->field("message"), "The api call    kestrel_clear_data()returned 0 (0x0)");
  click("kgInformationDialog.kgOK");
}

}  // namespace
}  // namespace kgtest
