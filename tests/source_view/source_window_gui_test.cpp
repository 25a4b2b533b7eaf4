// The annotated source window as a user meets it in "kestrel -view" on a private X server:
// opened from the summary in every way offered, its panes, colours and title, edits by click
// that reach the summary, saving byte for byte, the questions about unsaved edits, snapshots.
#include <gtest/gtest.h>
#include <sys/stat.h>
#include <sys/time.h>
#include <unistd.h>

#include <sstream>

#include "tests/toolkit/gui_driver.h"
#include "tools/kgv_maker.h"

namespace kgtest {
namespace {

const char kSource[] =
    "int helper(int x);\n"                   // 1
    "\n"                                     // 2
    "int main(void) {\n"                     // 3
    "  int a = 1;\n"                         // 4
    "  return helper(a) - 2;\n"              // 5
    "}\n"                                    // 6
    "int helper(int x) {\n"                  // 7
    "  if (x > 100)\n"                       // 8
    "    return 0; /* kestrel: deadcode */\n"  // 9
    "  return x * 2;\n"                      // 10
    "}\n"                                    // 11
    "void unused_fn(void) {\n"               // 12
    "  int z = 0;\n"                         // 13
    "  (void)z;\n"                           // 14
    "}\n";                                   // 15

class SourceWindow : public ::testing::Test {
 protected:
  void SetUp() override {
    ASSERT_FALSE(server.display().empty()) << "Xvfb did not start";
    mkdir(dir.file("src").c_str(), 0755);
    source = dir.file("src/prog.c");
    writeFile(source, kSource);
    // A source a minute older than its build, as after a real compile.
    struct timeval old[2] = {{time(nullptr) - 60, 0}, {time(nullptr) - 60, 0}};
    utimes(source.c_str(), old);
    // A second file, all used, so that it sorts after prog.c.
    other = dir.file("src/other.c");
    writeFile(other, "int other(void) {\n  return 7;\n}\n");
    utimes(other.c_str(), old);
    makeData(1, true);
  }
  // The data of both files (prog.c only when asked), helper's line 8 run `hits` times.
  void makeData(int hits, bool withProg) {
    const std::string build = " build=" + std::to_string(time(nullptr)) + "\n";
    std::string data;
    if (withProg) {
      data = "record " + source + build +
             "function main line=3 calls=1\nblock 4 hits=1\nblock 5 hits=12345\n"
             "function helper line=7 calls=1\nblock 8 hits=" + std::to_string(hits) +
             "\nblock 9 hits=0\nblock 10 hits=1\n"
             "function unused_fn line=12 calls=0\nblock 13 hits=0\nblock 14 hits=0\n";
    }
    data += "record " + other + build + "function other line=1 calls=3\nblock 2 hits=3\n";
    std::string error;
    ASSERT_TRUE(makeKgvFile(data, dir.file("p.kgv"), error)) << error;
  }
  // `resources`: lines of the per-user defaults file.
  void start(const std::string& resources = {}) {
    // No window manager places the windows: the source window goes beside the main window.
    writeFile(dir.file(".kestrel.Xdefaults"), "Kestrelgauge*kgAnnotatedSource.geometry: 570x540+700+0\n" + resources);
    std::vector<std::string> argv = {buildDir() + "/bin/kestrel", "-view",
                                     "-adjustmentfilename=" + dir.file("adjust"), dir.file("p.kgv")};
    app = std::make_unique<GuiApp>(server, argv,
                                   std::vector<std::string>{"HOME=" + dir.path(), "KESTREL_HOME=" + buildDir()});
    ASSERT_TRUE(app->waitFor([](const GuiState& s) { return s.find("kgOutline") && !s.find("kgOutline")->lines.empty(); },
                             &last))
        << app->errorOutput();
    // Open the directory and the file: their functions are listed.
    clickOutline(1, 10);
    app->key("Right");
    ASSERT_TRUE(waitOutline([](const std::vector<std::string>& l) { return l.size() >= 3; }));
    app->key("Down");
    app->key("Right");
    ASSERT_TRUE(waitOutline([](const std::vector<std::string>& l) { return l.size() >= 6; })) << last.raw();
  }
  void TearDown() override {
    if (app && app->running()) {
      EXPECT_EQ(app->stop(), 0) << app->errorOutput();
    }
  }
  bool waitOutline(const std::function<bool(const std::vector<std::string>&)>& ok) {
    return app->waitFor([&](const GuiState& s) { return s.find("kgOutline") && ok(s.find("kgOutline")->lines); },
                        &last);
  }
  int outlineLine(const std::string& name) {
    last = app->state();
    const WidgetInfo* t = last.find("kgOutline");
    for (size_t i = 0; t && i < t->lines.size(); ++i)
      if (t->lines[i].find(" " + name + " ") != std::string::npos) return static_cast<int>(i);
    return -1;
  }
  void outlinePoint(int line, int col, int& x, int& y) {
    last = app->state();
    const WidgetInfo& t = *last.find("kgOutline");
    x = t.x + 2 + col * 8 + 4;
    y = t.y + (line - t.number("top")) * 17 + 8;
  }
  void clickOutline(int line, int col, int button = 1) {
    int x, y;
    outlinePoint(line, col, x, y);
    app->click(x, y, button);
  }
  // The widget of that name in the n-th window that has one (0: the first made).
  void clickWidget(const std::string& name, size_t n = 0) {
    GuiState s;
    ASSERT_TRUE(app->waitFor([&](const GuiState& st) {
      std::vector<const WidgetInfo*> all = st.findAll(name);
      return all.size() > n && all[n]->flag("viewable");
    }, &s)) << name << "\n" << s.raw().substr(0, 2000);
    const WidgetInfo* w = s.findAll(name)[n];
    usleep(150 * 1000);  // a menu just mapped takes a moment to accept the pointer
    app->click(w->x + w->width / 2, w->y + w->height / 2);
  }
  // The source window is up on the file at the line (a function opens at its first line of code).
  bool waitSourceAt(int line) {
    return app->waitFor([line](const GuiState& s) {
      const WidgetInfo* n = s.find("kgLineNumbers");
      return n && n->flag("viewable") && n->number("current") == line && s.find("kgSource")->lines.size() == 15;
    }, &last);
  }
  // A cell of a pane of the source window, on the screen.
  void panePoint(const std::string& pane, int line, int col, int& x, int& y) {
    last = app->state();
    const WidgetInfo& t = *last.find(pane);
    x = t.x + 2 + col * 8 + 4;
    y = t.y + (line - 1 - t.number("top")) * 17 + 8;
  }
  std::string title() {
    last = app->state();
    const WidgetInfo* w = last.find("kgAnnotatedSource");
    return w ? w->field("title") : std::string();
  }
  int shells(const std::string& name) {
    last = app->state();
    int n = 0;
    std::istringstream in(last.raw());
    std::string l;
    while (std::getline(in, l))
      if (l.rfind("kestrel." + name + " class=TopLevelShell", 0) == 0 && l.find("viewable=1") != std::string::npos) ++n;
    return n;
  }

  XvfbServer server;
  TempDir dir;
  std::string source, other;
  std::unique_ptr<GuiApp> app;
  GuiState last;
};

TEST_F(SourceWindow, EveryWayOfOpeningShowsTheFunctionInTheOneWindow) {
  start();
  const int mainRow = outlineLine("main"), helperRow = outlineLine("helper");
  ASSERT_GE(mainRow, 0);
  ASSERT_GE(helperRow, 0);
  // The glyph in front of the function.
  clickOutline(helperRow, 9);
  ASSERT_TRUE(waitSourceAt(8)) << last.raw().substr(last.raw().find("kgLineNumbers class"), 300) << app->errorOutput();
  // Return on the selected row.
  clickOutline(mainRow, 20);
  app->key("Return");
  ASSERT_TRUE(waitSourceAt(4));
  // The Actions menu.
  clickOutline(helperRow, 20);
  clickWidget("kgActions");
  clickWidget("kgExpandCollapseMenu.KG_ScrollToFunction");
  ASSERT_TRUE(waitSourceAt(8));
  // Ctrl+A.
  clickOutline(mainRow, 20);
  app->key("ctrl+a");
  ASSERT_TRUE(waitSourceAt(4));
  // The toolbar.
  clickOutline(helperRow, 20);
  clickWidget("toolbar.KG_ScrollToFunction");
  ASSERT_TRUE(waitSourceAt(8));
  // The outline's popup menu.
  clickOutline(mainRow, 20);
  clickOutline(mainRow, 20, 3);
  clickWidget("kgOutlinePopup.KG_ScrollToFunction");
  ASSERT_TRUE(waitSourceAt(4));
  EXPECT_EQ(shells("kgAnnotatedSource"), 1);
}

TEST_F(SourceWindow, PanesShowCountsLettersColoursAndTheTitle) {
  start("Kestrelgauge*hideDeadcodeCounts: true\nKestrelgauge*highlightUsedLines: true\n");
  clickOutline(outlineLine("helper"), 9);
  ASSERT_TRUE(waitSourceAt(8)) << app->errorOutput();
  const WidgetInfo* src = last.find("kgSource");
  EXPECT_EQ(src->lines[8], "    return 0; /* kestrel: deadcode */");
  EXPECT_EQ(last.find("kgLineNumbers")->lines[14], "   15");
  const std::vector<std::string>& counts = last.find("kgCounts")->lines;
  ASSERT_EQ(counts.size(), 15u);
  EXPECT_EQ(counts[4], "10K+");
  EXPECT_EQ(counts[3], "   1");
  EXPECT_EQ(counts[8], "    ");  // DEAD, hidden by the resource
  EXPECT_EQ(counts[12], "   0");
  EXPECT_EQ(counts[1], "    ");
  EXPECT_EQ(last.find("kgAdjustPane")->lines[8], "D    ");
  // Used lines coloured (the switch is on), the unused function's lines too; dead code not.
  const std::string h = src->field("highlights");
  ASSERT_EQ(h.size(), 15u);
  EXPECT_EQ(h[3], 'u');
  EXPECT_EQ(h[12], 'n');
  EXPECT_NE(h[8], 'd');
  EXPECT_EQ(title(), "prog.c (Adjusted coverage) ");
  EXPECT_EQ(last.find("kgAnnotatedSource")->field("iconName"), source);
  // On the screen, an unused line shows the reverse colours: dark behind the text.
  int x, y;
  panePoint("kgSource", 13, 4, x, y);
  Screenshot shot = app->screenshot();
  ASSERT_TRUE(shot.ok());
  EXPECT_LT(shot.at(x, y - 6) & 0xFF, 0x40u);
  panePoint("kgSource", 2, 20, x, y);
  EXPECT_GT(app->screenshot().at(x, y) & 0xFF, 0xC0u);  // an empty line keeps the background

  // Actual coverage: the count shows, the letters' pane goes, the title says so.
  clickWidget("kgAnnotatedSource.mainWindow.kgTopMenu.kgViewPulldown");
  clickWidget("kgView.kgAdjustedAnnotations");
  ASSERT_TRUE(app->waitFor([](const GuiState& s) { return s.find("kgCounts")->lines[8] == "   0"; }, &last));
  EXPECT_FALSE(last.find("kgAdjustPane")->flag("viewable"));
  EXPECT_EQ(title(), "prog.c (Actual coverage) ");
}

TEST_F(SourceWindow, AClickMarksALineThatTheSummaryCountsAndSaveWritesOnlyThat) {
  start();
  clickOutline(outlineLine("unused_fn"), 9);
  ASSERT_TRUE(waitSourceAt(13)) << app->errorOutput();
  const auto adjCell = [&] {
    const int at = outlineLine("unused_fn");  // reads the state into `last`
    const std::string row = last.find("kgOutline")->lines[static_cast<size_t>(at)];
    return row.substr(row.find_last_not_of(' ') - 5);
  };
  const std::string before = adjCell();
  // Column 0 of line 13 in the letters' pane: dead code.
  int x, y;
  panePoint("kgAdjustPane", 13, 0, x, y);
  app->click(x, y);
  ASSERT_TRUE(app->waitFor([](const GuiState& s) { return s.find("kgAdjustPane")->lines[12] == "D    "; }, &last));
  EXPECT_EQ(last.find("kgSource")->lines[12], "  int z = 0; /* kestrel: deadcode */");
  EXPECT_EQ(last.find("kgCounts")->lines[12], "DEAD");
  EXPECT_TRUE(last.find("kgFile.kgWritePlainSource")->flag("sensitive"));
  EXPECT_NE(adjCell(), before) << "the function's row counts the new adjustment";
  // Save: the file changes in that line only.
  clickWidget("kgAnnotatedSource.mainWindow.kgTopMenu.kgFilePulldown");
  clickWidget("kgFile.kgWritePlainSource");
  ASSERT_TRUE(app->waitFor([](const GuiState& s) { return !s.find("kgFile.kgWritePlainSource")->flag("sensitive"); },
                           &last));
  std::string want = kSource;
  want.replace(want.find("  int z = 0;\n"), 13, "  int z = 0; /* kestrel: deadcode */\n");
  EXPECT_EQ(readFile(source), want);
  // The marker of line 9 from the source, and the new one.
  EXPECT_NE(readFile(dir.file("adjust")).find("\tdeadcode\tL\t 9 13\n"), std::string::npos) << readFile(dir.file("adjust"));
}

TEST_F(SourceWindow, UnsavedEditsAreAskedAboutWhenClosingSwitchingOrExiting) {
  start();
  clickOutline(outlineLine("unused_fn"), 9);
  ASSERT_TRUE(waitSourceAt(13)) << app->errorOutput();
  int x, y;
  panePoint("kgAdjustPane", 14, 4, x, y);
  app->click(x, y);
  ASSERT_TRUE(app->waitFor([](const GuiState& s) { return s.find("kgAdjustPane")->lines[13] == "    T"; }, &last));
  // Close: asked; Cancel keeps the window.
  clickWidget("kgAnnotatedSource.mainWindow.kgTopMenu.kgFilePulldown");
  clickWidget("kgFile.kgClose");
  ASSERT_TRUE(app->waitViewable("kgSaveAndClose", &last)) << last.raw().substr(0, 2000);
  EXPECT_TRUE(last.find("kgCloseOnly") != nullptr);
  clickWidget("kgCancel");
  ASSERT_TRUE(app->waitFor([](const GuiState& s) { return !s.viewable("kgQuestionDialog"); }, &last));
  EXPECT_EQ(shells("kgAnnotatedSource"), 1);
  // Another function of the same file: no question. The same window follows.
  clickOutline(outlineLine("main"), 9);
  ASSERT_TRUE(waitSourceAt(4));
  EXPECT_FALSE(last.viewable("kgQuestionDialog"));
  // Another file: asked; Cancel keeps the edited file in the window.
  clickOutline(outlineLine("other.c"), 10);
  app->key("Right");
  ASSERT_TRUE(waitOutline([](const std::vector<std::string>& l) { return l.size() >= 7; }));
  clickOutline(outlineLine("other"), 9);
  ASSERT_TRUE(app->waitViewable("kgSaveAndReload", &last)) << last.raw().substr(0, 2000);
  EXPECT_TRUE(last.find("kgReloadOnly") != nullptr);
  clickWidget("kgCancel");
  ASSERT_TRUE(app->waitFor([](const GuiState& s) { return !s.viewable("kgQuestionDialog"); }, &last));
  EXPECT_EQ(title(), "prog.c (Adjusted coverage) ");
  EXPECT_EQ(last.find("kgAdjustPane")->lines[13], "    T");
  // Exit: asked with the exit buttons; "Exit" leaves without saving.
  clickWidget("kgFilePulldown");
  clickWidget("kgFile.kgExit");
  ASSERT_TRUE(app->waitViewable("kgSaveAndExit", &last)) << last.raw().substr(0, 2000);
  clickWidget("kgExitOnly");
  EXPECT_EQ(app->waitExit(10000), 0) << app->errorOutput();
  EXPECT_EQ(readFile(source), kSource);
}

TEST_F(SourceWindow, SnapshotsAreReadOnlyCopiesAndCloseAndReopenWork) {
  start();
  clickOutline(outlineLine("helper"), 9);
  ASSERT_TRUE(waitSourceAt(8)) << app->errorOutput();
  clickWidget("kgAnnotatedSource.mainWindow.kgTopMenu.kgFilePulldown");
  clickWidget("kgFile.kgSnapshot");
  ASSERT_TRUE(app->waitFor([this](const GuiState&) { return shells("kgAnnotatedSource") == 2; }, &last))
      << last.raw().substr(0, 2000);
  EXPECT_NE(last.raw().find("title=\"Snapshot of prog.c (Adjusted coverage) [Read only]\""), std::string::npos);
  // The snapshot (the later window, in front) shows the same lines and refuses edits.
  ASSERT_EQ(last.findAll("kgSource").size(), 2u);
  EXPECT_EQ(last.findAll("kgSource")[1]->lines, last.findAll("kgSource")[0]->lines);
  const WidgetInfo& pane = *last.findAll("kgAdjustPane")[1];
  app->click(pane.x + 6, pane.y + (12 - pane.number("top")) * 17 + 8);
  ASSERT_TRUE(app->waitFor([](const GuiState& s) {
    std::vector<const WidgetInfo*> m = s.findAll("kgDetailMessage");
    return m.size() == 2 && m[1]->field("label") == "Source is read only";
  }, &last)) << last.raw().substr(0, 2000);
  EXPECT_EQ(last.findAll("kgAdjustPane")[1]->lines[12], "     ");

  // Closing the snapshot (in front), then the window; the function opens again in a new one.
  clickWidget("kgAnnotatedSource.mainWindow.kgTopMenu.kgFilePulldown", 1);
  clickWidget("kgFile.kgClose", 1);
  ASSERT_TRUE(app->waitFor([this](const GuiState&) { return shells("kgAnnotatedSource") == 1; }, &last));
  clickWidget("kgAnnotatedSource.mainWindow.kgTopMenu.kgFilePulldown");
  clickWidget("kgFile.kgClose");
  ASSERT_TRUE(app->waitFor([this](const GuiState&) { return shells("kgAnnotatedSource") == 0; }, &last));
  clickOutline(outlineLine("main"), 9);
  ASSERT_TRUE(waitSourceAt(4));
}

TEST_F(SourceWindow, ReloadedDataReachTheWindowAndAFileNoLongerThereClosesIt) {
  start();
  clickOutline(outlineLine("helper"), 9);
  ASSERT_TRUE(waitSourceAt(8)) << app->errorOutput();
  EXPECT_EQ(last.find("kgCounts")->lines[7], "   1");
  // New runs of the program: the counts change in the window, which stays where it was.
  makeData(5, true);
  clickWidget("kestrel.mainWindow.kgTopMenu.kgFilePulldown");
  clickWidget("kgFile.kgReloadAll");
  ASSERT_TRUE(app->waitFor([](const GuiState& s) { return s.find("kgCounts")->lines[7] == "   5"; }, &last))
      << app->errorOutput();
  EXPECT_EQ(last.find("kgLineNumbers")->number("current"), 8);
  // Data without the file, while an edit is unsaved: asked first, then the window goes and
  // says why.
  int x, y;
  panePoint("kgAdjustPane", 9, 4, x, y);
  app->click(x, y);
  ASSERT_TRUE(app->waitFor([](const GuiState& s) { return s.find("kgAdjustPane")->lines[8].back() == 'T'; }, &last));
  makeData(5, false);
  clickWidget("kestrel.mainWindow.kgTopMenu.kgFilePulldown");
  clickWidget("kgFile.kgReloadAll");
  ASSERT_TRUE(app->waitViewable("kgSaveAndClose", &last)) << app->errorOutput();
  clickWidget("kgCloseOnly");
  ASSERT_TRUE(app->waitViewable("kgInformationDialog", &last)) << app->errorOutput();
  EXPECT_NE(last.raw().find("This file is no longer part of the .kgv data:"), std::string::npos);
  EXPECT_EQ(shells("kgAnnotatedSource"), 0);
  EXPECT_EQ(readFile(source), kSource) << "closed without saving, as chosen";
}

TEST_F(SourceWindow, ASourceThatCannotBeWrittenIsShownReadOnly) {
  if (geteuid() == 0) GTEST_SKIP() << "root may write any file";
  ASSERT_EQ(chmod(source.c_str(), 0444), 0);
  start();
  clickOutline(outlineLine("unused_fn"), 9);
  ASSERT_TRUE(waitSourceAt(13)) << app->errorOutput();
  EXPECT_EQ(title(), "prog.c (Adjusted coverage) [Read only]");
  int x, y;
  panePoint("kgAdjustPane", 13, 0, x, y);
  app->click(x, y);
  ASSERT_TRUE(app->waitFor([](const GuiState& s) {
    return s.find("kgDetailMessage") && s.find("kgDetailMessage")->field("label") == "Source is read only";
  }, &last));
  EXPECT_EQ(last.find("kgAdjustPane")->lines[12], "     ");
}

}  // namespace
}  // namespace kgtest
