// Watching the data files while "kestrel -view" runs on a private X server: a test run
// rewrites the data with "kestrel -merge", the viewer notices when the user is idle, asks,
// and reloads into the outline and the open source window as the user chose.
#include <gtest/gtest.h>
#include <sys/stat.h>
#include <unistd.h>

#include <regex>
#include <sstream>

#include "tests/toolkit/gui_driver.h"
#include "tools/kgv_maker.h"

namespace kgtest {
namespace {

class FileMonitor : public ::testing::Test {
 protected:
  void SetUp() override {
    ASSERT_FALSE(server.display().empty()) << "Xvfb did not start";
    source = dir.file("prog.c");
    const std::string run = writeOneFunctionProgram(source);
    std::string error;
    ASSERT_TRUE(makeKgvFile(run, dir.file("p.kgv"), error)) << error;
    ASSERT_TRUE(makeKgvFile(run, dir.file("run.kgv"), error)) << error;
  }
  void TearDown() override {
    if (app && app->running()) {
      EXPECT_EQ(app->stop(), 0) << app->errorOutput();
    }
  }
  // Short pauses, so that a check follows a second of idleness, and the trace on.
  void start(const std::string& resources = {}) {
    writeFile(dir.file(".kestrel.Xdefaults"),
              "Kestrelgauge*filePollPauseInterval: 1\nKestrelgauge*filePollRetryInterval: 1\n"
              "Kestrelgauge*debugRevealIdlerActivity: true\n"
              "Kestrelgauge*kgAnnotatedSource.geometry: 570x400+700+0\n" + resources);
    app = std::make_unique<GuiApp>(server,
                                   std::vector<std::string>{buildDir() + "/bin/kestrel", "-view",
                                                            "-adjustmentfilename=" + dir.file("adjust"),
                                                            dir.file("p.kgv")},
                                   std::vector<std::string>{"HOME=" + dir.path()});
    ASSERT_TRUE(app->waitFor([](const GuiState& s) { return s.find("kgOutline") && !s.find("kgOutline")->lines.empty(); },
                             &last)) << app->errorOutput();
    // A rewrite within the second of the load would not look newer than it.
    sleep(1);
  }
  // What a test run does: its data merged into the file the viewer shows.
  void rewrite() {
    auto r = runProcess({buildDir() + "/bin/kestrel", "-merge=p.kgv", "p.kgv", "run.kgv"},
                        {"HOME=" + dir.path(), "DISPLAY"}, "", dir.path());
    ASSERT_EQ(r.status, 0) << r.err;
    ++runs;
  }
  bool dialogShown(int timeoutMs = 8000) {
    return app->waitFor([](const GuiState& s) { return s.viewable("kgFilesChangedList"); }, &last, timeoutMs);
  }
  void choose(const std::string& option) {
    click(option);
    click("kgUpdatedFiles.kgOK");
    ASSERT_TRUE(app->waitFor([](const GuiState& s) { return !s.viewable("kgFilesChangedList"); }, &last));
  }
  void click(const std::string& name) {
    GuiState s;
    ASSERT_TRUE(app->waitFor([&](const GuiState& st) { return st.viewable(name); }, &s)) << name;
    const WidgetInfo* w = s.find(name);
    usleep(150 * 1000);
    app->click(w->x + w->width / 2, w->y + w->height / 2);
  }
  // The outline's line of the file, expanded once.
  std::string fileRow() {
    last = app->state();
    const WidgetInfo* t = last.find("kgOutline");
    for (size_t i = 0; t && i < t->lines.size(); ++i)
      if (t->lines[i].find(" prog.c ") != std::string::npos) return t->lines[i];
    return {};
  }
  // The runs column of the file's row: the sessions in the data shown.
  bool showsRuns(int n, int timeoutMs = 8000) {
    return app->waitFor([&](const GuiState& s) {
      const WidgetInfo* t = s.find("kgOutline");
      for (size_t i = 0; t && i < t->lines.size(); ++i) {
        std::smatch m;
        if (std::regex_search(t->lines[i], m, std::regex(" prog\\.c +([0-9]+) +([0-9]+)")))
          return std::stoi(m[1]) == n;
      }
      return false;
    }, &last, timeoutMs);
  }
  void expandToFile() {
    last = app->state();
    const WidgetInfo& t = *last.find("kgOutline");
    app->click(t.x + 2 + 10 * 8 + 4, t.y + (1 - t.number("top")) * 17 + 8);
    app->key("Right");
    ASSERT_TRUE(app->waitFor([](const GuiState& s) { return s.find("kgOutline")->lines.size() >= 3; }, &last));
  }
  // The trace lines printed so far, without their time stamps.
  std::vector<std::string> trace() {
    std::vector<std::string> lines;
    std::istringstream in(app->errorOutput());
    static const std::regex stamp(R"(^[0-9: .]+: timer\(([0-9]+)\): (.*)$)");
    std::string l;
    std::smatch m;
    while (std::getline(in, l)) {
      if (std::regex_match(l, m, stamp)) lines.push_back(m[2]);
    }
    return lines;
  }
  size_t traceCount(const std::string& text) {
    size_t n = 0;
    for (const std::string& l : trace()) n += l == text;
    return n;
  }

  XvfbServer server;
  TempDir dir;
  std::string source;
  std::unique_ptr<GuiApp> app;
  GuiState last;
  int runs = 1;
};

TEST_F(FileMonitor, ANewTestRunIsOfferedAndReloadedIntoTheOutlineAndTheSourceWindow) {
  start();
  expandToFile();
  ASSERT_TRUE(showsRuns(1)) << last.raw().substr(0, 3000);
  // The source window on the file, with its counts.
  app->key("Down");
  app->key("Right");
  ASSERT_TRUE(app->waitFor([](const GuiState& s) { return s.find("kgOutline")->lines.size() >= 4; }, &last));
  app->key("Down");
  app->key("Return");
  ASSERT_TRUE(app->waitFor([](const GuiState& s) {
    const WidgetInfo* c = s.find("kgCounts");
    return c && c->flag("viewable") && c->lines.size() == 3 && c->lines[1].find(" 3") != std::string::npos;
  }, &last)) << app->errorOutput();

  rewrite();
  ASSERT_TRUE(dialogShown()) << app->errorOutput();
  const WidgetInfo* list = last.find("kgFilesChangedList");
  ASSERT_EQ(list->lines.size(), 1u) << last.raw();
  EXPECT_TRUE(std::regex_match(list->lines[0], std::regex("[ 0-9/:]{11} - " + dir.file("p.kgv"))))
      << list->lines[0];
  EXPECT_EQ(last.find("kgUpdatedFiles_popup")->field("title"), "Some Kestrelgauge data changed");
  choose("kgReloadChangedKgvs");
  EXPECT_TRUE(showsRuns(2)) << last.raw().substr(0, 3000);
  // The source window follows: hits 3 + 3.
  EXPECT_TRUE(app->waitFor([](const GuiState& s) {
    const WidgetInfo* c = s.find("kgCounts");
    return c && c->lines.size() == 3 && c->lines[1].find(" 6") != std::string::npos;
  }, &last)) << last.raw().substr(last.raw().find("kgCounts"), 300);

  const std::vector<std::string> expected = {
      "OI says we are idle after enough time.  Perform idle actions?",
      "==> Yes.  Performing idle actions.",
      "Running update dialog API",
      "Request is 2",
      "Firing reload buttons",
  };
  std::vector<std::string> t = trace();
  ASSERT_FALSE(t.empty());
  EXPECT_EQ(t[0], "Turning timer ON.");
  EXPECT_EQ(traceCount("Need to create the update dialog"), 1u);
  auto at = std::search(t.begin(), t.end(), expected.begin() + 3, expected.end());
  EXPECT_NE(at, t.end()) << app->errorOutput();
  EXPECT_GE(traceCount("OI says we are idle after enough time.  Perform idle actions?"), 2u);
}

TEST_F(FileMonitor, InformMeLaterWaitsForTheNextRewriteAndAutomaticReloadsWithoutAsking) {
  start();
  expandToFile();
  rewrite();
  ASSERT_TRUE(dialogShown()) << app->errorOutput();
  choose("kgCheckKgvsLater");
  EXPECT_GE(traceCount("Resetting load times"), 1u);
  // Several checks pass without a report, and the data stay as they were.
  const size_t checks = traceCount("Request is 1");
  ASSERT_TRUE(app->waitFor([&](const GuiState&) { return traceCount("Request is 1") >= checks + 2; }, &last, 10000));
  EXPECT_FALSE(last.viewable("kgFilesChangedList"));
  EXPECT_TRUE(showsRuns(1));

  sleep(1);
  rewrite();
  ASSERT_TRUE(dialogShown()) << app->errorOutput();
  choose("kgReloadAutomatically");
  EXPECT_TRUE(showsRuns(3)) << "both runs are in the reloaded data";
  // From now on a rewrite is reloaded without the dialog.
  sleep(1);
  rewrite();
  EXPECT_TRUE(showsRuns(4, 10000)) << app->errorOutput();
  EXPECT_EQ(traceCount("Request is 3"), 2u);
  EXPECT_EQ(traceCount("Request is 4"), 1u);
}

TEST_F(FileMonitor, AFileThatNoLongerLoadsLeavesTheDataShown) {
  start();
  expandToFile();
  // Something else wrote the file: it is cut short.
  const std::string whole = readFile(dir.file("p.kgv"));
  writeFile(dir.file("p.kgv"), whole.substr(0, whole.size() / 2));
  ASSERT_TRUE(dialogShown()) << app->errorOutput();
  choose("kgReloadChangedKgvs");
  ASSERT_TRUE(app->waitViewable("kgErrorDialog", &last)) << app->errorOutput();
  const std::string message = last.find("kgErrorDialog")->field("message");
  EXPECT_EQ(message.find("Couldn't reload files due to problem reloading"), 0u) << message;
  EXPECT_NE(message.find(dir.file("p.kgv") + ": The file was too short."), std::string::npos) << message;
  click("kgErrorDialog.kgOK");
  EXPECT_TRUE(showsRuns(1)) << "the data loaded before stay";
}

TEST_F(FileMonitor, DontInformMeTurnsTheTimerOff) {
  start();
  expandToFile();
  rewrite();
  ASSERT_TRUE(dialogShown());
  choose("kgDontCheckKgvs");
  ASSERT_TRUE(app->waitFor([&](const GuiState&) { return traceCount("Turning timer OFF.") == 1; }, &last));
  const size_t lines = trace().size();
  sleep(1);
  rewrite();
  sleep(4);
  EXPECT_EQ(trace().size(), lines) << "no checks any more";
  EXPECT_FALSE(app->state().viewable("kgFilesChangedList"));
  EXPECT_TRUE(showsRuns(1));
}

TEST_F(FileMonitor, ThePreferenceIgnoreStopsTheChecksAtTheFirstIdleMoment) {
  start("Kestrelgauge*coverageChangesOption: ignore\n");
  ASSERT_TRUE(app->waitFor([&](const GuiState&) { return traceCount("Turning timer OFF.") == 1; }, &last));
  const std::vector<std::string> t = trace();
  ASSERT_GE(t.size(), 4u);
  EXPECT_EQ(t[t.size() - 2], "==> Yes.  Performing idle actions.");
  rewrite();
  sleep(3);
  EXPECT_EQ(trace().size(), t.size());
  EXPECT_FALSE(app->state().viewable("kgFilesChangedList"));
}

TEST_F(FileMonitor, NothingIsCheckedWhileTheWindowIsGoneOrAMenuIsOpen) {
  start();
  expandToFile();
  // The window withdrawn (as when iconified): checks are refused.
  auto id = runProcess({"/usr/bin/xdotool", "search", "--name", "^Kestrelgauge"}, {"DISPLAY=" + server.display()});
  std::istringstream ids(id.out);
  std::vector<std::string> windows;
  for (std::string w; std::getline(ids, w);) windows.push_back(w);
  ASSERT_FALSE(windows.empty()) << id.err;
  for (const std::string& w : windows) app->xdotool({"windowunmap", w});
  rewrite();
  ASSERT_TRUE(app->waitFor([&](const GuiState&) {
    return traceCount("==> No.  None of my windows are open.") >= 2;
  }, &last, 10000)) << app->errorOutput();
  EXPECT_FALSE(last.viewable("kgFilesChangedList"));
  for (const std::string& w : windows) app->xdotool({"windowmap", w});
  ASSERT_TRUE(dialogShown()) << app->errorOutput();
  choose("kgCheckKgvsLater");

  // A menu posted by the user: checks wait until it is closed.
  sleep(1);
  click("kgFilePulldown");
  ASSERT_TRUE(app->waitFor([](const GuiState& s) { return s.viewable("kgReloadAll"); }, &last));
  rewrite();
  ASSERT_TRUE(app->waitFor([&](const GuiState&) {
    return traceCount("==> No.  A GUI action is in progress.") >= 2;
  }, &last, 10000)) << app->errorOutput();
  EXPECT_FALSE(last.viewable("kgFilesChangedList"));
  std::vector<std::string> t = trace();
  auto busy = std::find(t.begin(), t.end(), "==> No.  A GUI action is in progress.");
  ASSERT_NE(busy, t.end());
  ASSERT_LT(busy + 2, t.end());
  EXPECT_TRUE(std::regex_match(busy[1], std::regex("    Found a busy child: .+"))) << busy[1];
  EXPECT_TRUE(std::regex_match(busy[2], std::regex("      \\(child of .+\\)"))) << busy[2];
  app->key("Escape");
  EXPECT_TRUE(dialogShown()) << app->errorOutput();
  choose("kgCheckKgvsLater");
}

}  // namespace
}  // namespace kgtest
