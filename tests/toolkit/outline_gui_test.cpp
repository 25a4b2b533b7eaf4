// The outline on screen as a user works it: keys and clicks expand, collapse and select rows,
// glyphs and their menus act on their row, drags select whole subtrees, and the menu cells and
// toolbar buttons follow what the selection offers.
#include <gtest/gtest.h>
#include <unistd.h>

#include "tests/toolkit/gui_driver.h"

namespace kgtest {
namespace {

std::string outlineProbe() { return buildDir() + "/tests/outline_probe"; }

class OutlineWindow : public ::testing::Test {
 protected:
  void SetUp() override {
    ASSERT_FALSE(server.display().empty()) << "Xvfb did not start";
    app = std::make_unique<GuiApp>(server, std::vector<std::string>{outlineProbe()});
    ASSERT_TRUE(app->waitViewable("kgOutline", &last)) << app->errorOutput();
  }
  void TearDown() override {
    if (app && app->running()) {
      EXPECT_EQ(app->stop(), 0) << app->errorOutput();
    }
  }
  const WidgetInfo& outline() {
    last = app->state();
    const WidgetInfo* t = last.find("kgOutline");
    static WidgetInfo none;
    return t ? *t : none;
  }
  // Waits until the outline's lines are `want`.
  bool waitLines(const std::vector<std::string>& want) {
    return app->waitFor([&](const GuiState& s) { return s.find("kgOutline") && s.find("kgOutline")->lines == want; },
                        &last);
  }
  bool waitField(const std::string& name, const std::string& value) {
    return app->waitFor(
        [&](const GuiState& s) { return s.find("kgOutline") && s.find("kgOutline")->field(name) == value; }, &last);
  }
  bool sensitive(const std::string& widget) {
    const WidgetInfo* w = last.find(widget);
    return w && w->flag("sensitive");
  }
  // The screen point of a text cell of the outline.
  void cellPoint(int line, int col, int& x, int& y) {
    const WidgetInfo& t = outline();
    x = t.x + 2 + col * 8 + 4;
    y = t.y + (line - t.number("top")) * 17 + 8;
  }
  void clickCell(int line, int col, int button = 1) {
    int x, y;
    cellPoint(line, col, x, y);
    app->click(x, y, button);
  }
  void clickWidget(const std::string& name, int button = 1) {
    GuiState s;
    ASSERT_TRUE(app->waitViewable(name, &s)) << name;
    const WidgetInfo* w = s.find(name);
    usleep(150 * 1000);
    app->click(w->x + w->width / 2, w->y + w->height / 2, button);
  }

  XvfbServer server;
  std::unique_ptr<GuiApp> app;
  GuiState last;
};

TEST_F(OutlineWindow, RowsAreIndentedLinesWithGlyphsAndTabsCountedFromTheirText) {
  const WidgetInfo& t = outline();
  // Depth 0 text at column 3, depth 1 at column 6; a tab goes to the next multiple of 8 of the
  // row's own text, whatever the indentation.
  ASSERT_EQ(t.lines, (std::vector<std::string>{"   Total Coverage  12", "      src/    4", "      lib/    8"}));
  EXPECT_NE(last.raw().find("  glyph QR_OutlineCollapse at 0:0\n"), std::string::npos);
  EXPECT_NE(last.raw().find("  glyph QR_OutlineExpand,QR_OutlineMakeVisible at 1:3\n"), std::string::npos);
  EXPECT_EQ(t.field("rows"), "none");
  // Nothing selected: the menu cells and toolbar buttons offer nothing (once the 10 ms pass ran).
  ASSERT_TRUE(app->waitFor([](const GuiState& s) {
    for (const char* w : {"toolbar.QR_OutlineNext", "toolbar.QR_OutlinePrevious",
                          "kgExpandCollapseMenu.QR_OutlineNext", "kgExpandCollapseMenu.QR_OutlineCollapse"})
      if (!s.find(w) || s.find(w)->flag("sensitive")) return false;
    return true;
  }, &last));

  // The glyphs are drawn: the collapsed triangle has ink in its cell, the window's white elsewhere.
  Screenshot shot = app->screenshot();
  int x, y;
  cellPoint(1, 3, x, y);
  int ink = 0;
  for (int dx = -4; dx < 12; ++dx)
    for (int dy = -6; dy < 6; ++dy) ink += (shot.at(x + dx, y + dy) & 0xFF) < 0x40;
  EXPECT_GT(ink, 15);
  cellPoint(1, 40, x, y);
  EXPECT_EQ(shot.at(x, y), 0xFFFFFFu);
}

TEST_F(OutlineWindow, KeysExpandCollapseAndMoveTheSelectionWhileMenusFollow) {
  clickCell(1, 8);  // src/
  ASSERT_TRUE(waitField("rows", "1"));
  EXPECT_EQ(last.find("kgOutline")->field("selection"), "1:0-2:0");
  // A collapsed directory row offers Expand, Expand all and Next, not Collapse.
  ASSERT_TRUE(app->waitFor([&](const GuiState& s) {
    const WidgetInfo* w = s.find("toolbar.QR_OutlineNext");
    return w && w->flag("sensitive");
  }, &last));
  EXPECT_TRUE(sensitive("kgExpandCollapseMenu.QR_OutlineExpand,QR_OutlineMakeVisible"));
  EXPECT_TRUE(sensitive("kgExpandCollapseMenu.QR_OutlineExpandAll"));
  EXPECT_FALSE(sensitive("kgExpandCollapseMenu.QR_OutlineCollapse"));

  app->key("Right");
  ASSERT_TRUE(waitLines({"   Total Coverage  12", "      src/    4", "         a.c     3", "         b.c     1",
                         "      lib/    8"}));
  EXPECT_NE(last.raw().find("  glyph QR_OutlineCollapse at 1:3\n"), std::string::npos);
  EXPECT_NE(last.raw().find("  glyph QR_OutlineExpand,QR_OutlineMakeVisible at 2:6\n"), std::string::npos);
  app->key("Down");
  ASSERT_TRUE(waitField("rows", "2"));
  app->key("Return");
  // The marked current row shows "=>" over the two columns at its parent's text column.
  ASSERT_TRUE(waitLines({"   Total Coverage  12", "      src/    4", "         a.c     3", "            main    1",
                         "         => helper  unused", "         b.c     1", "      lib/    8"}));
  app->key("Down");
  app->key("Down");
  ASSERT_TRUE(waitField("rows", "4"));
  // Left collapses the selected row only when it can be collapsed: here on a leaf nothing changes.
  app->key("Up");
  app->key("Up");
  app->key("Left");
  ASSERT_TRUE(waitLines({"   Total Coverage  12", "      src/    4", "         a.c     3", "         b.c     1",
                         "      lib/    8"}));
  // The same commands from the menu bar.
  clickWidget("kgActions");
  clickWidget("kgExpandCollapseMenu.QR_OutlineNext");
  ASSERT_TRUE(waitField("rows", "3"));
}

TEST_F(OutlineWindow, GlyphsActOnTheirRowAndButtonThreeOffersTheirMenu) {
  clickCell(2, 3);  // lib/'s triangle: select it and expand it
  ASSERT_TRUE(waitLines({"   Total Coverage  12", "      src/    4", "      lib/    8", "         util.c  8"}));
  EXPECT_EQ(last.find("kgOutline")->field("rows"), "2");
  // Button 3 on an expanded glyph, pressed and held as menus are used: its menu comes from the
  // "cells" resource, each cell labelled by its "label"; the choice is made on release.
  int gx, gy;
  cellPoint(2, 3, gx, gy);
  app->moveTo(gx + 1, gy);
  app->xdotool({"mousedown", "3"});
  GuiState s;
  ASSERT_TRUE(app->waitViewable("QR_OutlineCollapse.QR_OutlineCollapseAll", &s)) << s.raw();
  EXPECT_EQ(s.find("QR_OutlineCollapse.QR_OutlineCollapse")->field("label"), "Collapse");
  const WidgetInfo* all = s.find("QR_OutlineCollapse.QR_OutlineCollapseAll");
  EXPECT_EQ(all->field("label"), "Collapse all");
  app->moveTo(all->x + all->width / 2, all->y + all->height / 2 - 2);
  app->moveTo(all->x + all->width / 2, all->y + all->height / 2);
  app->xdotool({"mouseup", "3"});
  ASSERT_TRUE(waitLines({"   Total Coverage  12", "      src/    4", "      lib/    8"}));
  // The menu lets the pointer go as it closes; a person clicks again a moment later.
  ASSERT_TRUE(app->waitFor([](const GuiState& st) { return !st.viewable("QR_OutlineCollapse.QR_OutlineCollapseAll"); }));
  usleep(200 * 1000);

  clickCell(2, 3);
  ASSERT_TRUE(waitLines({"   Total Coverage  12", "      src/    4", "      lib/    8", "         util.c  8"}));
  clickCell(3, 6);  // util.c's triangle: its thirty functions do not fit, so util.c goes to the top
  ASSERT_TRUE(app->waitFor([](const GuiState& st) { return st.find("kgOutline")->number("lines") == 34; }, &last));
  ASSERT_TRUE(waitField("top", "3"));
  EXPECT_EQ(last.find("kgOutline")->field("rows"), "3");
  app->key("ctrl+b");
  ASSERT_TRUE(waitField("top", "0"));
}

TEST_F(OutlineWindow, DraggingFromADeeperRowSelectsWholeSubtrees) {
  clickCell(1, 3);  // expand src/
  ASSERT_TRUE(app->waitFor([](const GuiState& s) { return s.find("kgOutline")->number("lines") == 5; }, &last));
  // From b.c (depth 2, line 3) up... down to lib/ (depth 1, line 4): the selection widens to
  // src/, b.c's depth-1 ancestor, and ends after lib/'s last visible line.
  int x1, y1, x2, y2;
  cellPoint(3, 12, x1, y1);
  cellPoint(4, 12, x2, y2);
  app->moveTo(x1, y1);
  app->xdotool({"mousedown", "1"});
  app->moveTo(x2, y2 - 3);
  app->moveTo(x2, y2);
  app->xdotool({"mouseup", "1"});
  ASSERT_TRUE(waitField("selection", "1:0-5:0")) << last.find("kgOutline")->field("selection");
  ASSERT_TRUE(waitField("rows", "1,2,3,4"));
  // Previous acts on the first selected row and leaves one row selected.
  app->key("Up");
  ASSERT_TRUE(waitField("rows", "0")) << last.find("kgOutline")->field("rows");
  ASSERT_TRUE(waitField("selection", "0:0-1:0"));
}

TEST_F(OutlineWindow, ADoubleClickActivatesTheRowAndKeepsItSelected) {
  int x, y;
  cellPoint(2, 8, x, y);  // lib/
  app->moveTo(x, y);
  app->xdotool({"click", "--repeat", "2", "--delay", "40", "1"});
  ASSERT_TRUE(app->waitFor([](const GuiState& s) {
    const WidgetInfo* t = s.find("kgTitle");
    return t && t->lines.size() == 2 && t->lines[1] == "activated lib/\t8";
  }, &last)) << last.raw().substr(0, 200);
  ASSERT_TRUE(waitField("rows", "2"));
}

TEST(OutlineStart, WithoutTheOutlineInitTheDisplayRefusesAPlainText) {
  XvfbServer server;
  ASSERT_FALSE(server.display().empty());
  ProcessResult r = runProcess({outlineProbe(), "-display", server.display()},
                               {"PROBE_WITHOUT_INIT=1", x11LeakSuppressions()});
  EXPECT_EQ(r.status, 1);
  EXPECT_EQ(r.err,
            "** QR_OI_Init was not called, or an OI_multi_text\n"
            "** object was created rather than a QR_OI_MultiText\n"
            "** You must call QR_OI_Init right after OI_init\n");
}

}  // namespace
}  // namespace kgtest
