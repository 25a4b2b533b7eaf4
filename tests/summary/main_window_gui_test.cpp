// The main window's dialogs, its display details and the X conventions, as a user meets them
// on a private X server: the Columns and Name style dialogs, the name column following the
// window's width, the glyph popups, the toolbar's tips and room, the full name of the row
// under the pointer, and resources from every source in the order X users know.
#include <gtest/gtest.h>
#include <unistd.h>

#include <regex>

#include "tests/toolkit/gui_driver.h"
#include "tools/kgv_maker.h"

namespace kgtest {
namespace {

const char kData[] =
    "generate records=6 first=0 functions=3 blocks=4 seed=1\n"
    "generate records=3 first=100 functions=2 blocks=6 seed=2\n";

class MainWindow : public ::testing::Test {
 protected:
  void SetUp() override {
    ASSERT_FALSE(server.display().empty()) << "Xvfb did not start";
    std::string error;
    ASSERT_TRUE(makeKgvFile(kData, dir.file("app.kgv"), error)) << error;
  }
  void TearDown() override {
    if (app && app->running()) {
      EXPECT_EQ(app->stop(), 0) << app->errorOutput();
    }
  }
  void start(const std::vector<std::string>& extra = {}, const std::string& userResources = {}) {
    if (!userResources.empty()) writeFile(dir.file(".kestrel.Xdefaults"), userResources);
    std::vector<std::string> argv = {buildDir() + "/bin/kestrel", "-view"};
    argv.insert(argv.end(), extra.begin(), extra.end());
    argv.push_back(dir.file("app.kgv"));
    app = std::make_unique<GuiApp>(server, argv, std::vector<std::string>{"HOME=" + dir.path()});
    ASSERT_TRUE(app->waitFor([](const GuiState& s) { return s.find("kgOutline") && s.find("kgOutline")->lines.size() == 3; },
                             &last)) << app->errorOutput() << last.raw().substr(0, 2000);
  }
  void click(const std::string& name) {
    GuiState s;
    ASSERT_TRUE(app->waitViewable(name, &s)) << name << "\n" << s.raw().substr(0, 3000);
    const WidgetInfo* w = s.find(name);
    usleep(150 * 1000);
    app->click(w->x + w->width / 2, w->y + w->height / 2);
  }
  void menu(const std::string& pulldown, const std::string& entry) {
    click(pulldown);
    click(entry);
  }
  const std::vector<std::string>& headings() {
    last = app->state();
    return last.find("kgTitle")->lines;
  }
  std::vector<std::string> rows() {
    last = app->state();
    return last.find("kgOutline")->lines;
  }
  // Expands every row from the overall one.
  void expandAll() {
    const WidgetInfo& t = *last.find("kgOutline");
    app->click(t.x + 40, t.y + 8);
    menu("kgActions", "kgExpandCollapseMenu.QR_OutlineExpandAll");
    ASSERT_TRUE(app->waitFor([](const GuiState& s) { return s.find("kgOutline")->lines.size() > 20; }, &last));
  }
  // Types into a text field, replacing what it holds.
  void type(const std::string& field, const std::string& text) {
    click(field);
    app->key("End");
    const size_t typed = app->state().find(field)->field("value").size();
    if (typed > 0) app->xdotool({"key", "--repeat", std::to_string(typed), "BackSpace"});
    app->xdotool({"type", text});
    ASSERT_TRUE(app->waitFor([&](const GuiState& s) { return s.find(field)->field("value") == text; }, &last));
  }
  std::string windowId() {
    auto r = runProcess({"/usr/bin/xdotool", "search", "--name", "^Kestrelgauge$"}, {"DISPLAY=" + server.display()});
    return r.out.substr(0, r.out.find('\n'));
  }

  XvfbServer server;
  TempDir dir;
  std::unique_ptr<GuiApp> app;
  GuiState last;
};

TEST_F(MainWindow, TheColumnsDialogChangesTheHeadingsAndTheChoiceIsSaved) {
  start();
  EXPECT_FALSE(std::regex_search(headings()[0], std::regex("ADJUSTED LINES .* LINES ")));
  menu("kgViewPulldown", "kgView.kgColumns");
  ASSERT_TRUE(app->waitViewable("kgColumnsDialog", &last));
  EXPECT_EQ(last.find("kgColumnsDialog_popup")->field("title"), "Column selections");
  // The restricted columns have no toggle; the others are set as the settings say.
  EXPECT_EQ(last.find("kgMiscellaneous.kgColumnsSubmenu.showNumberOfDirectories"), nullptr);
  EXPECT_EQ(last.find("kgMiscellaneous.kgColumnsSubmenu.showNumberOfRuns")->field("set"), "1");
  EXPECT_EQ(last.find("kgLines.kgColumnsSubmenu.showLinesTotal")->field("set"), "0");
  click("kgLines.kgColumnsSubmenu.showLinesTotal");
  click("kgMiscellaneous.kgColumnsSubmenu.showNumberOfRuns");
  // The actual lines' group appears (its short title when narrow), the runs go.
  ASSERT_TRUE(app->waitFor([](const GuiState& s) {
    return std::regex_search(s.find("kgTitle")->lines[0], std::regex("ADJUSTED LINES .* LINES ")) &&
           s.find("kgTitle")->lines[1].find("Runs") == std::string::npos;
  }, &last)) << last.find("kgTitle")->lines[0];
  click("kgColumnsDialog.kgOK");

  // "Write view settings to..." proposes the per-user file, and the choice is in it.
  menu("kgViewPulldown", "kgView.kgSaveXdefaults");
  ASSERT_TRUE(app->waitViewable("kgFileDialog.Text", &last));
  EXPECT_EQ(last.find("kgFileDialog.Text")->field("value"), dir.file(".kestrel.Xdefaults"));
  click("kgFileDialog.OK");
  ASSERT_TRUE(app->waitFor([&](const GuiState&) { return fileExists(dir.file(".kestrel.Xdefaults")); }, &last));
  const std::string saved = readFile(dir.file(".kestrel.Xdefaults"));
  EXPECT_TRUE(std::regex_search(saved, std::regex("showLinesTotal:\\s*[Tt]rue"))) << saved;
  EXPECT_TRUE(std::regex_search(saved, std::regex("showNumberOfRuns:\\s*[Ff]alse"))) << saved;
}

TEST_F(MainWindow, TheNameStyleDialogAppliesOnOkAndCancelPutsTheControlsBack) {
  start();
  const size_t width = rows()[1].size();
  EXPECT_NE(rows()[1].find("gen/dir0/"), std::string::npos);
  menu("kgViewPulldown", "kgView.kgNames");
  ASSERT_TRUE(app->waitViewable("kgNameColumnWidthEntry", &last));
  EXPECT_EQ(last.find("kgNames_popup")->field("title"), "Name style settings");
  type("kgNameColumnWidthEntry", "250");  // clamped to 200
  click("kgDirectoryNamesChoice.kgRightSegment");
  click("kgNames.kgOK");
  ASSERT_TRUE(app->waitFor([&](const GuiState& s) { return s.find("kgOutline")->lines[1].size() == width + 200 - 32; },
                           &last)) << last.find("kgOutline")->lines[1].size();
  EXPECT_NE(rows()[1].find(" dir0/ "), std::string::npos) << rows()[1];
  EXPECT_EQ(rows()[1].find("gen/dir0/"), std::string::npos);
  // Changed and cancelled: nothing changes, and the dialog shows the settings again.
  menu("kgViewPulldown", "kgView.kgNames");
  ASSERT_TRUE(app->waitViewable("kgNameColumnWidthEntry", &last));
  EXPECT_EQ(last.find("kgNameColumnWidthEntry")->field("value"), "200");
  type("kgNameColumnWidthEntry", "10");
  click("kgNames.kgCancel");
  usleep(300 * 1000);
  EXPECT_EQ(rows()[1].size(), width + 200 - 32);
  menu("kgViewPulldown", "kgView.kgNames");
  ASSERT_TRUE(app->waitViewable("kgNameColumnWidthEntry", &last));
  EXPECT_EQ(last.find("kgNameColumnWidthEntry")->field("value"), "200");
  click("kgNames.kgCancel");
}

TEST_F(MainWindow, TheNameColumnFollowsTheWindowBackDownAndTheLastColumnStaysVisible) {
  start();
  expandAll();
  const size_t chosen = rows()[0].size();
  const std::string id = windowId();
  ASSERT_FALSE(id.empty());
  auto visibleColumns = [&] {
    last = app->state();
    const WidgetInfo* t = last.find("kgOutline");
    return static_cast<size_t>((t->width - 4) / 8);
  };
  // The vertical bar has room of its own: every character of a row fits.
  EXPECT_LE(rows()[0].size(), visibleColumns()) << last.raw().substr(0, 200);
  const WidgetInfo* shell = last.find("kestrel.kestrel");
  const std::string width = std::to_string(shell->width), height = std::to_string(shell->height);
  app->xdotool({"windowsize", id, std::to_string(shell->width + 300), height});
  ASSERT_TRUE(app->waitFor([&](const GuiState& s) { return s.find("kgOutline")->lines[0].size() > chosen + 20; },
                           &last));
  app->xdotool({"windowsize", id, width, height});
  ASSERT_TRUE(app->waitFor([&](const GuiState& s) { return s.find("kgOutline")->lines[0].size() == chosen; }, &last))
      << last.find("kgOutline")->lines[0].size() << " " << chosen;
  // A screenshot of the right edge: the last column's digits stand left of the bar.
  Screenshot shot = app->screenshot();
  ASSERT_TRUE(shot.ok());
  const WidgetInfo* t = last.find("kgOutline");
  const int lastDigit = t->x + 2 + static_cast<int>(chosen) * 8 - 4;
  ASSERT_LT(lastDigit, t->x + t->width);
  bool ink = false;
  for (int y = t->y + 17; y < t->y + 17 * 4; ++y)
    for (int x = lastDigit - 6; x <= lastDigit; ++x) ink |= (shot.at(x, y) & 0xFF) < 0x80;
  EXPECT_TRUE(ink) << "the last column's digits are drawn";
}

TEST_F(MainWindow, AGlyphsPopupOffersItsOwnEntriesAndTheyWorkByMouse) {
  start();
  const WidgetInfo t = *last.find("kgOutline");  // a copy: `last` is replaced below
  // Button 3 on the triangle of the first directory row.
  app->click(t.x + 2 + 3 * 8 + 4, t.y + 17 + 8, 3);
  ASSERT_TRUE(app->waitViewable("QR_OutlineExpand.QR_OutlineExpandAll", &last)) << last.raw().substr(0, 3000);
  EXPECT_FALSE(last.viewable("kgOutlinePopup"));
  EXPECT_EQ(last.find("QR_OutlineExpand.QR_OutlineExpandAll")->field("label"), "Expand all");
  click("QR_OutlineExpand.QR_OutlineExpandAll");
  ASSERT_TRUE(app->waitFor([](const GuiState& s) { return s.find("kgOutline")->lines.size() > 8; }, &last))
      << last.raw().substr(0, 2000);
  // The keyboard is free again: Down moves the selection.
  app->key("Down");
  EXPECT_TRUE(app->running());
  // Elsewhere on a row, button 3 gives the Actions popup.
  app->click(t.x + 2 + 20 * 8, t.y + 8, 3);
  ASSERT_TRUE(app->waitViewable("kgOutlinePopup", &last));
  app->key("Escape");
}

TEST_F(MainWindow, TheToolbarHasTipsAndHidingItLeavesNoBand) {
  start();
  // A tip comes up when the pointer rests on a button.
  last = app->state();
  const WidgetInfo* next = last.find("toolbar.QR_OutlineNext");
  ASSERT_NE(next, nullptr);
  app->moveTo(next->x + next->width / 2, next->y + next->height / 2);
  EXPECT_TRUE(app->waitFor([](const GuiState& s) { return s.raw().find("label=\"Next\"") != std::string::npos; }, &last,
                           5000)) << last.raw().substr(0, 3000);
  app->moveTo(600, 500);
  const int gangTop = last.find("kgGangContainer")->y;
  const int toolbarTop = last.find("toolbar")->y;
  menu("kgViewPulldown", "kgView.kgToolbarToggle");
  ASSERT_TRUE(app->waitFor([&](const GuiState& s) { return s.find("kgGangContainer")->y == toolbarTop; }, &last))
      << last.find("kgGangContainer")->y << " " << toolbarTop << " " << gangTop;
  // Where the toolbar was the headings are drawn now, not the window's grey.
  Screenshot shot = app->screenshot();
  ASSERT_TRUE(shot.ok());
  const WidgetInfo* bar = last.find("kgTopMenu");
  const uint32_t grey = shot.at(bar->x + bar->width - 3, bar->y + 3);
  int greyPixels = 0;
  for (int x = last.find("kgTitle")->x; x < last.find("kgTitle")->x + 300; ++x) greyPixels += shot.at(x, toolbarTop + 4) == grey;
  EXPECT_LT(greyPixels, 30) << "no band of the toolbar's grey is left";
}

TEST_F(MainWindow, TheRowUnderThePointerIsNamedInFullAndTheWindowHasItsIcon) {
  start();
  expandAll();
  const std::vector<std::string> lines = rows();
  size_t fn = 0;
  while (fn < lines.size() && lines[fn].find("function_") == std::string::npos) ++fn;
  ASSERT_LT(fn, lines.size());
  const WidgetInfo& t = *last.find("kgOutline");
  app->moveTo(t.x + 100, t.y + static_cast<int>(fn - static_cast<size_t>(t.number("top"))) * 17 + 8);
  ASSERT_TRUE(app->waitFor([](const GuiState& s) {
    return std::regex_match(s.find("kgRowName")->field("label"),
                            std::regex("function_[0-9_]+  \\(gen/dir[0-9]/file[0-9]+\\.c\\)"));
  }, &last)) << last.find("kgRowName")->field("label");
  auto hints = runProcess({"/usr/bin/xprop", "-id", windowId(), "WM_HINTS"}, {"DISPLAY=" + server.display()});
  EXPECT_NE(hints.out.find("bitmap id # to use for icon"), std::string::npos) << hints.out;
}

TEST_F(MainWindow, ResourcesComeFromEveryPlaceInTheOrderXUsersKnow) {
  auto sortLabel = [&] {
    const std::string line = headings()[1];
    return line.substr(0, line.find("  "));
  };
  auto setServerResources = [&](const std::string& lines) {
    auto r = runProcess({"/usr/bin/xrdb", "-display", server.display(), "-nocpp", "-load", "-"}, {}, lines);
    ASSERT_EQ(r.status, 0) << r.err;
  };
  // The display's resources (as xrdb leaves them) over the application defaults.
  setServerResources("Kestrelgauge*sortCriterion: alpha\nKestrelgauge*kgReloadAll.labelString: From the server\n");
  start();
  EXPECT_EQ(sortLabel(), "Alphabetical");
  EXPECT_EQ(last.find("kgFile.kgReloadAll")->field("label"), "From the server");
  EXPECT_EQ(app->stop(), 0);
  // The per-user file over the display's.
  start({}, "Kestrelgauge*sortCriterion: lines\n");
  EXPECT_EQ(sortLabel(), "Number of lines");
  EXPECT_EQ(app->stop(), 0);
  // -xrm over everything; the toolkit's options are its own, not the viewer's.
  start({"-xrm", "Kestrelgauge*sortCriterion: blocks", "-geometry", "800x500+5+5", "-synchronous"});
  EXPECT_EQ(sortLabel(), "Number of basic blocks");
  EXPECT_EQ(app->errorOutput().find("unknown option"), std::string::npos) << app->errorOutput();
  // The window's own width, as the geometry asked (the frame's border aside).
  EXPECT_NEAR(last.find("kestrel.kestrel")->width, 800, 4) << last.raw().substr(0, 400);
  runProcess({"/usr/bin/xrdb", "-display", server.display(), "-remove"});
}

}  // namespace
}  // namespace kgtest
