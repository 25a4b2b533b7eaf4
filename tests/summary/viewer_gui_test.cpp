// The viewer's main window as a user meets it: the data opened on a private X server, rows
// expanded with keys, clicks and menus, the sort order, separators and toolbar changed from the
// View menu, and the per-user settings file made at exit.
#include <gtest/gtest.h>
#include <unistd.h>

#include <fstream>

#include "coverage/sort_orders.h"
#include "tests/toolkit/gui_driver.h"
#include "tools/kgv_maker.h"

namespace kgtest {
namespace {

// Three directories of the generated kind, with names sorting differently by count and name.
const char kData[] =
    "clockTime 50\n"
    "generate records=6 first=0 functions=3 blocks=4 seed=1\n"
    "generate records=3 first=100 functions=2 blocks=6 seed=2\n"
    "generate records=2 first=200 functions=4 blocks=2 seed=3\n";

class ViewerWindow : public ::testing::Test {
 protected:
  void SetUp() override {
    ASSERT_FALSE(server.display().empty()) << "Xvfb did not start";
    std::string error;
    ASSERT_TRUE(makeKgvFile(kData, dir.file("app.kgv"), error)) << error;
    app = std::make_unique<GuiApp>(server, std::vector<std::string>{buildDir() + "/bin/kestrel", "-view", dir.file("app.kgv")},
                                   std::vector<std::string>{"HOME=" + dir.path(), "KESTREL_HOME=" + buildDir()});
    // The window is up with the overall row open on its three directories.
    ASSERT_TRUE(app->waitFor([](const GuiState& s) { return s.find("kgOutline") && s.find("kgOutline")->lines.size() == 4; },
                             &last))
        << app->errorOutput() << last.raw();
  }
  void TearDown() override {
    if (app && app->running()) {
      EXPECT_EQ(app->stop(), 0) << app->errorOutput();
    }
  }
  std::vector<std::string> outlineLines() {
    last = app->state();
    const WidgetInfo* t = last.find("kgOutline");
    return t ? t->lines : std::vector<std::string>{};
  }
  bool waitLineCount(size_t n) {
    return app->waitFor([n](const GuiState& s) { return s.find("kgOutline") && s.find("kgOutline")->lines.size() == n; },
                        &last);
  }
  bool waitSensitive(const std::string& widget, bool on) {
    return app->waitFor([&](const GuiState& s) { return s.find(widget) && s.find(widget)->flag("sensitive") == on; },
                        &last);
  }
  void cellPoint(int line, int col, int& x, int& y) {
    last = app->state();
    const WidgetInfo& t = *last.find("kgOutline");
    x = t.x + 2 + col * 8 + 4;
    y = t.y + (line - t.number("top")) * 17 + 8;
  }
  void clickCell(int line, int col) {
    int x, y;
    cellPoint(line, col, x, y);
    app->click(x, y);
  }
  void clickWidget(const std::string& name) {
    GuiState s;
    ASSERT_TRUE(app->waitViewable(name, &s)) << name << "\n" << s.raw();
    const WidgetInfo* w = s.find(name);
    usleep(150 * 1000);  // a menu just mapped takes a moment to accept the pointer
    app->click(w->x + w->width / 2, w->y + w->height / 2);
  }

  XvfbServer server;
  TempDir dir;
  std::unique_ptr<GuiApp> app;
  GuiState last;
};

TEST_F(ViewerWindow, OpensWithHeadingsToolbarAndTheDirectories) {
  const WidgetInfo* title = last.find("kgTitle");
  ASSERT_NE(title, nullptr);
  ASSERT_EQ(title->lines.size(), 2u);
  EXPECT_EQ(title->lines[0].rfind("Sorting order:", 0), 0u);
  EXPECT_NE(title->lines[0].find("FUNCTIONS"), std::string::npos);
  EXPECT_EQ(title->lines[1].rfind(sort_order_label(kDefaultSortOrder), 0), 0u);
  const std::vector<std::string> lines = last.find("kgOutline")->lines;
  EXPECT_EQ(lines[0].rfind("   Total Coverage", 0), 0u);
  for (int i = 1; i <= 3; ++i) EXPECT_EQ(lines[i].rfind("      gen/dir", 0), 0u) << lines[i];
  // Every row and both heading lines are equally long: the columns line up.
  for (const std::string& l : lines) EXPECT_EQ(l.size(), title->lines[1].size()) << l;
  // Six toolbar buttons; with nothing selected the outline's buttons offer nothing, and the
  // change-request button waits for a command to be configured.
  for (const char* b : {"toolbar.QR_OutlineNext", "toolbar.QR_OutlinePrevious",
                        "toolbar.QR_OutlineExpand,QR_OutlineMakeVisible", "toolbar.QR_OutlineCollapse",
                        "toolbar.KG_ScrollToFunction", "toolbar.kgStartCRMS"}) {
    ASSERT_TRUE(waitSensitive(b, false)) << b;
  }
  EXPECT_FALSE(last.find("kgFile.kgStartCRMS")->flag("sensitive"));
}

TEST_F(ViewerWindow, KeysClicksAndMenusOpenRowsWhileTheActionsFollowTheSelection) {
  clickCell(1, 10);  // the first directory
  ASSERT_TRUE(waitSensitive("toolbar.QR_OutlineNext", true));
  EXPECT_TRUE(last.find("kgExpandCollapseMenu.QR_OutlineExpandAll")->flag("sensitive"));
  EXPECT_FALSE(last.find("kgExpandCollapseMenu.QR_OutlineCollapse")->flag("sensitive"));
  // A directory row does not offer the annotated source (function rows do).
  EXPECT_FALSE(last.find("kgExpandCollapseMenu.KG_ScrollToFunction")->flag("sensitive"));
  app->key("Right");
  ASSERT_TRUE(waitLineCount(4 + 6)) << last.raw();
  EXPECT_EQ(outlineLines()[2].rfind("         file", 0), 0u) << last.raw();
  // Up to the overall row, then "Expand all" from the Actions menu: 11 files, 38 functions.
  app->key("Up");
  clickWidget("kgActions");
  clickWidget("kgExpandCollapseMenu.QR_OutlineExpandAll");
  ASSERT_TRUE(waitLineCount(1 + 3 + 11 + 6 * 3 + 3 * 2 + 2 * 4)) << last.raw();
  // The toolbar's Collapse closes it again.
  clickWidget("toolbar.QR_OutlineCollapse");
  ASSERT_TRUE(waitLineCount(1));
}

TEST_F(ViewerWindow, ViewMenuSortsDrawsSeparatorsAndHidesTheToolbar) {
  const std::vector<std::string> before = outlineLines();
  // Sorting by name puts the directories in name order and names the order in the heading.
  clickWidget("kgViewPulldown");
  clickWidget("kgView.kgSortBy");
  clickWidget(std::string("kgSort.") + sort_order_name(1));
  ASSERT_TRUE(app->waitFor([](const GuiState& s) {
    return s.find("kgTitle") && s.find("kgTitle")->lines.size() == 2 &&
           s.find("kgTitle")->lines[1].rfind(sort_order_label(1), 0) == 0;
  }, &last)) << last.raw();
  std::vector<std::string> after = outlineLines();
  ASSERT_EQ(after.size(), before.size());
  EXPECT_LT(after[1], after[2]);
  EXPECT_LT(after[2], after[3]);

  // Separators between all columns: the blank after the Runs column gets a line of ink.
  int x, y;
  cellPoint(0, 39, x, y);
  auto inkAt = [&](const Screenshot& shot) {
    int ink = 0;
    for (int dx = 0; dx < 8; ++dx) ink += (shot.at(x - 4 + dx, y) & 0xFF) < 0xC0;
    return ink;
  };
  EXPECT_EQ(inkAt(app->screenshot()), 0);
  clickWidget("kgViewPulldown");
  clickWidget("kgView.kgColSeparators");
  clickWidget("kgStripes.all");
  bool drawn = false;
  for (int i = 0; i < 40 && !drawn; ++i) {
    drawn = inkAt(app->screenshot()) > 0;
    if (!drawn) usleep(50 * 1000);
  }
  EXPECT_TRUE(drawn);

  // Hiding the toolbar: gone from the window, and the entry offers to bring it back.
  clickWidget("kgViewPulldown");
  clickWidget("kgView.kgToolbarToggle");
  ASSERT_TRUE(app->waitFor([](const GuiState& s) { return s.find("toolbar") && !s.find("toolbar")->flag("viewable"); },
                           &last));
  EXPECT_EQ(last.find("kgView.kgToolbarToggle")->field("label"), "Make toolbar visible");
}

TEST_F(ViewerWindow, AFileOpenedFromTheMenuJoinsTheDataAndTheSameFileTwiceIsRefused) {
  std::string error;
  ASSERT_TRUE(makeKgvFile("generate records=2 first=300 functions=2 blocks=3 seed=9\n", dir.file("more.kgv"), error));
  auto openFile = [&](const std::string& path) {
    clickWidget("kgFilePulldown");
    clickWidget("kgFile.kgOpen");
    clickWidget("kgFileDialog.Text");
    // The name field starts with the current directory: it is erased and the whole name typed.
    GuiState now = app->state();
    const WidgetInfo* field = now.find("kgFileDialog.Text");
    ASSERT_NE(field, nullptr);
    app->key("End");
    const size_t typed = field->field("value").size();
    if (typed > 0) app->xdotool({"key", "--repeat", std::to_string(typed), "BackSpace"});
    app->xdotool({"type", path});
    ASSERT_TRUE(app->waitFor([&](const GuiState& st) {
      const WidgetInfo* f = st.find("kgFileDialog.Text");
      return f && f->field("value") == path;
    }, &last)) << last.raw().substr(0, 400);
    clickWidget("kgFileDialog.OK");
  };
  openFile(dir.file("more.kgv"));
  // A fourth directory, and the totals count its functions too.
  ASSERT_TRUE(waitLineCount(5)) << app->errorOutput();
  EXPECT_NE(outlineLines()[4].find("gen/dir3/"), std::string::npos) << last.raw();

  openFile(dir.file("more.kgv"));
  ASSERT_TRUE(app->waitViewable("kgErrorDialog", &last)) << last.raw();
  EXPECT_NE(last.raw().find("Use 'Reload all' to reread previously loaded data."), std::string::npos);
  clickWidget("kgErrorDialog.kgOK");
  EXPECT_EQ(outlineLines().size(), 5u);
}

TEST_F(ViewerWindow, ReloadAllReadsTheChangedFileAndKeepsOpenRowsOpen) {
  clickCell(1, 10);
  app->key("Right");
  ASSERT_TRUE(waitLineCount(4 + 6));
  // The data file is rewritten with one more directory, as a new test run would.
  std::string error;
  ASSERT_TRUE(makeKgvFile(std::string(kData) + "generate records=1 first=400 functions=1 blocks=2 seed=4\n",
                          dir.file("app.kgv"), error)) << error;
  clickWidget("kgFilePulldown");
  clickWidget("kgFile.kgReloadAll");
  ASSERT_TRUE(waitLineCount(4 + 6 + 1)) << app->errorOutput();
  EXPECT_NE(outlineLines().back().find("gen/dir4/"), std::string::npos) << last.raw();
}

TEST_F(ViewerWindow, ExitMakesThePersonalSettingsFileFromItsTemplate) {
  clickWidget("kgFilePulldown");
  clickWidget("kgFile.kgExit");
  // The information dialog says the file was made; its OK ends the viewer.
  clickWidget("kgInformationDialog.kgOK");
  EXPECT_EQ(app->waitExit(10000), 0) << app->errorOutput();
  std::ifstream made(dir.file(".kestrel.Xdefaults"));
  EXPECT_TRUE(made.good());
}

// Two data files of which the first holds an older build of one source file.
TEST(ViewerNotes, OutOfDateDataAreListedInTheNoteWindowWhenTheViewerOpens) {
  XvfbServer server;
  ASSERT_FALSE(server.display().empty());
  TempDir dir;
  std::string error;
  ASSERT_TRUE(makeKgvFile("record src/a.c signature=1 build=100\nfunction fa line=1 calls=1\nblock 2 hits=1\n"
                          "record src/b.c signature=1 build=100\nfunction fb line=1 calls=0\nblock 2 hits=0\n",
                          dir.file("old.kgv"), error)) << error;
  ASSERT_TRUE(makeKgvFile("record src/a.c signature=2 build=200\nfunction fa line=1 calls=2\nblock 2 hits=2\n",
                          dir.file("new.kgv"), error)) << error;
  GuiApp app(server, {buildDir() + "/bin/kestrel", "-view", dir.file("old.kgv"), dir.file("new.kgv")},
             {"HOME=" + dir.path(), "KESTREL_HOME=" + buildDir()});
  GuiState s;
  ASSERT_TRUE(app.waitViewable("kgErrorList", &s)) << app.errorOutput() << s.raw();
  EXPECT_NE(s.raw().find("label=\"Some coverage for this file was out of date:\""), std::string::npos) << s.raw();
  EXPECT_NE(s.raw().find("  item: src/a.c\n"), std::string::npos) << s.raw();
  // The window lists the one directory with both files, the newer data of a.c counted.
  ASSERT_TRUE(app.waitFor([](const GuiState& st) { return st.find("kgOutline") && st.find("kgOutline")->lines.size() == 2; },
                          &s));
  EXPECT_EQ(app.stop(), 0) << app.errorOutput();
}

}  // namespace
}  // namespace kgtest
