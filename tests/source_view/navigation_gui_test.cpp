// Moving about the annotated source with the keys and the search bar, as a user does it in
// "kestrel -view" on a private X server: paging and line keys, the next and previous unused
// line, going to a line, finding text, and marking lines from the keyboard.
#include <gtest/gtest.h>
#include <sys/time.h>
#include <unistd.h>

#include <sstream>

#include "tests/toolkit/gui_driver.h"
#include "tools/kgv_maker.h"

namespace kgtest {
namespace {

// 60 lines: f1 (2-10) with two unused stretches around a blank and a comment line, f2 (11-13)
// all unused, filler, f3 (41-45) with its last line unused, more filler.
std::string navSource() {
  std::ostringstream s;
  s << "/* navigation */\n"        // 1
    << "int f1(void) {\n"          // 2
    << "  int a = 0;\n"            // 3
    << "  a++;\n"                  // 4
    << "  a++;\n"                  // 5
    << "\n"                        // 6
    << "  /* comment */\n"         // 7
    << "  a++;\n"                  // 8
    << "  return a;\n"             // 9
    << "}\n"                       // 10
    << "int f2(void) {\n"          // 11
    << "  return 2;\n"             // 12
    << "}\n";                      // 13
  for (int l = 14; l <= 40; ++l) s << "/* filler " << l << " */\n";
  s << "int f3(void) {\n"          // 41
    << "  int b = 1;\n"            // 42
    << "  b += 2; b += 3;\n"       // 43
    << "  return b;\n"             // 44
    << "}\n";                      // 45
  for (int l = 46; l <= 60; ++l) s << (l == 50 ? "/* find me here */\n" : "/* more " + std::to_string(l) + " */\n");
  return s.str();
}

class SourceKeys : public ::testing::Test {
 protected:
  void SetUp() override {
    ASSERT_FALSE(server.display().empty()) << "Xvfb did not start";
    source = dir.file("nav.c");
    writeFile(source, navSource());
    struct timeval old[2] = {{time(nullptr) - 60, 0}, {time(nullptr) - 60, 0}};
    utimes(source.c_str(), old);
    const std::string data = "record " + source + " build=" + std::to_string(time(nullptr)) +
                             "\n"
                             "function f1 line=2 calls=1\nblock 3 hits=1\nblock 4 hits=0\nblock 5 hits=0\n"
                             "block 8 hits=0\nblock 9 hits=1\n"
                             "function f2 line=11 calls=0\nblock 12 hits=0\n"
                             "function f3 line=41 calls=1\nblock 42 hits=1\nblock 43 hits=2\nblock 44 hits=0\n";
    std::string error;
    ASSERT_TRUE(makeKgvFile(data, dir.file("n.kgv"), error)) << error;
  }
  void start(const std::string& resources = {}) {
    writeFile(dir.file(".kestrel.Xdefaults"), "Kestrelgauge*kgAnnotatedSource.geometry: 570x540+700+0\n" + resources);
    app = std::make_unique<GuiApp>(server,
                                   std::vector<std::string>{buildDir() + "/bin/kestrel", "-view",
                                                            "-adjustmentfilename=" + dir.file("adjust"),
                                                            dir.file("n.kgv")},
                                   std::vector<std::string>{"HOME=" + dir.path(), "KESTREL_HOME=" + buildDir()});
    ASSERT_TRUE(app->waitFor([](const GuiState& s) { return s.find("kgOutline") && !s.find("kgOutline")->lines.empty(); },
                             &last))
        << app->errorOutput();
    // The directory, the file, then the first function by Return: the source at line 3.
    clickOutline(1, 10);
    app->key("Right");
    ASSERT_TRUE(app->waitFor([](const GuiState& s) { return s.find("kgOutline")->lines.size() >= 3; }, &last));
    app->key("Down");
    app->key("Right");
    ASSERT_TRUE(app->waitFor([](const GuiState& s) { return s.find("kgOutline")->lines.size() >= 6; }, &last));
    app->key("Down");
    app->key("Return");
    ASSERT_TRUE(app->waitFor([](const GuiState& s) { return s.viewable("kgLineNumbers"); }, &last))
        << app->errorOutput();
    // Keys go to the source pane: the pointer rests over it.
    const WidgetInfo* src = last.find("kgSource");
    app->moveTo(src->x + src->width / 2, src->y + src->height / 2);
  }
  void TearDown() override {
    if (app && app->running()) {
      EXPECT_EQ(app->stop(), 0) << app->errorOutput();
    }
  }
  void clickOutline(int line, int col) {
    last = app->state();
    const WidgetInfo& t = *last.find("kgOutline");
    app->click(t.x + 2 + col * 8 + 4, t.y + (line - t.number("top")) * 17 + 8);
  }
  // The point of a line (1-based) and column of the source pane.
  void sourcePoint(int line, int col, int& x, int& y) {
    last = app->state();
    const WidgetInfo& t = *last.find("kgSource");
    x = t.x + 2 + col * 8 + 1;
    y = t.y + (line - 1 - t.number("top")) * 17 + 8;
  }
  // After the keys, the current line (and the message, when asked).
  bool waitCurrent(int line) {
    return app->waitFor([line](const GuiState& s) { return s.find("kgLineNumbers")->number("current") == line; }, &last);
  }
  bool waitMessage(const std::string& text) {
    return app->waitFor([&](const GuiState& s) {
      return s.find("kgDetailMessage") && s.find("kgDetailMessage")->field("label") == text;
    }, &last);
  }
  int top() {
    last = app->state();
    return last.find("kgSource")->number("top");
  }
  void typeInto(const std::string& field, const std::string& text) {
    last = app->state();
    const WidgetInfo* f = last.find(field);
    ASSERT_NE(f, nullptr);
    app->click(f->x + f->width / 2, f->y + f->height / 2);
    app->xdotool({"type", text});
    app->key("Return");
  }

  XvfbServer server;
  TempDir dir;
  std::string source;
  std::unique_ptr<GuiApp> app;
  GuiState last;
};

TEST_F(SourceKeys, NextAndPreviousUnusedWalkTheRunsAndSayWhenThereAreNoMore) {
  start();
  ASSERT_TRUE(waitCurrent(3)) << last.raw().substr(0, 300);
  app->key("n");  // 3 is used: the first unused line after it
  ASSERT_TRUE(waitCurrent(4));
  app->key("n");  // the run of 4-5 goes on over the blank and the comment to 8: next is f2's
  ASSERT_TRUE(waitCurrent(12));
  app->key("n");
  ASSERT_TRUE(waitCurrent(44));
  app->key("n");
  ASSERT_TRUE(waitMessage("No unused lines below"));
  EXPECT_EQ(last.find("kgLineNumbers")->number("current"), 44);
  app->key("p");
  ASSERT_TRUE(waitCurrent(12));
  app->key("p");  // f2 starts a function: the run above ends at f1's last unused line
  ASSERT_TRUE(waitCurrent(8));
  app->key("p");
  ASSERT_TRUE(waitMessage("No unused lines above"));
  // The buttons do the same.
  GuiState s = app->state();
  const WidgetInfo* next = s.find("kgNextUnused");
  app->click(next->x + next->width / 2, next->y + next->height / 2);
  ASSERT_TRUE(waitCurrent(12));
}

TEST_F(SourceKeys, RunsStopAfterCodelessLinesWhenAsked) {
  start("Kestrelgauge*stopAfterCodelessRegions: true\n");
  ASSERT_TRUE(waitCurrent(3));
  app->key("n");
  ASSERT_TRUE(waitCurrent(4));
  app->key("n");  // the blank line ends the run now: 8 is the next unused line
  ASSERT_TRUE(waitCurrent(8));
}

TEST_F(SourceKeys, PagingAndLineKeysWithTheCurrentLineOutOfView) {
  start();
  ASSERT_TRUE(waitCurrent(3));
  app->key("ctrl+d");  // a page down: the view moves, the current line with it
  ASSERT_TRUE(app->waitFor([](const GuiState& s) { return s.find("kgSource")->number("top") > 0; }, &last));
  const int current = last.find("kgLineNumbers")->number("current");
  EXPECT_GT(current, 25);
  // The view alone moved back (the wheel), leaving the current line below it: line_down goes to
  // the top line of the view plus one, line_up to the line above the bottom.
  app->xdotool({"click", "--repeat", "15", "4"});
  ASSERT_TRUE(app->waitFor([](const GuiState& s) { return s.find("kgSource")->number("top") == 0; }, &last));
  app->key("Down");
  ASSERT_TRUE(waitCurrent(1));
  app->xdotool({"click", "--repeat", "15", "5"});
  ASSERT_TRUE(app->waitFor([](const GuiState& s) { return s.find("kgSource")->number("top") > 20; }, &last));
  last = app->state();
  const int t = last.find("kgSource")->number("top"), visible = last.find("kgSource")->number("visible");
  app->key("Up");
  // The view's last line: the one above the line just below the view.
  ASSERT_TRUE(waitCurrent(t + visible)) << last.raw().substr(last.raw().find("kgLineNumbers class"), 200);
  app->key("Home");
  ASSERT_TRUE(waitCurrent(1));
  EXPECT_EQ(top(), 0);
}

TEST_F(SourceKeys, GoToLineAndFind) {
  start();
  ASSERT_TRUE(waitCurrent(3));
  typeInto("kgGoto", "0");
  ASSERT_TRUE(waitCurrent(1));
  typeInto("kgGoto", "99999");
  ASSERT_TRUE(waitCurrent(60));
  EXPECT_EQ(last.find("kgGoto")->field("value"), "");
  typeInto("kgGoto", "4x2");  // letters are not taken
  ASSERT_TRUE(waitCurrent(42));

  // "f i" finds "fi" side by side; "?" stands for any one character.
  typeInto("kgGoto", "1");
  ASSERT_TRUE(waitCurrent(1));
  typeInto("kgFind", "f i");
  ASSERT_TRUE(waitCurrent(14));  // "/* filler 14 */"
  last = app->state();
  const WidgetInfo* f = last.find("kgFind");
  app->click(f->x + f->width / 2, f->y + f->height / 2);
  app->key("End");
  app->xdotool({"key", "--repeat", "10", "BackSpace"});
  app->xdotool({"type", "fi?d"});
  app->key("Return");
  ASSERT_TRUE(waitCurrent(50));
  // Only above the current line now: not found, no wrap-around.
  app->key("Return");
  ASSERT_TRUE(waitMessage("Pattern not found before end-of-file"));
  EXPECT_EQ(last.find("kgLineNumbers")->number("current"), 50);
}

TEST_F(SourceKeys, SelectedLinesAreMarkedFromTheKeyboard) {
  start();
  ASSERT_TRUE(waitCurrent(3));
  // Drag from line 3 to the start of line 8: lines 3 to 7.
  int x1, y1, x2, y2;
  sourcePoint(3, 0, x1, y1);
  sourcePoint(8, 0, x2, y2);
  app->moveTo(x1, y1);
  app->xdotool({"mousedown", "1"});
  app->moveTo(x2, y2);
  app->xdotool({"mouseup", "1"});
  app->key("d");
  ASSERT_TRUE(waitCurrent(8)) << last.raw().substr(0, 200);
  const std::vector<std::string>& letters = last.find("kgAdjustPane")->lines;
  for (int l = 3; l <= 7; ++l) EXPECT_EQ(letters[static_cast<size_t>(l - 1)], "D    ") << l;
  EXPECT_EQ(letters[7], "     ");
  EXPECT_EQ(last.find("kgSource")->lines[3], "  a++; /* kestrel: deadcode */");
  // A click on line 5 and a space take its marker off again, and the next line is current.
  sourcePoint(5, 2, x1, y1);
  app->click(x1, y1);
  app->key("space");
  ASSERT_TRUE(waitCurrent(6));
  EXPECT_EQ(last.find("kgAdjustPane")->lines[4], "     ");
  EXPECT_EQ(last.find("kgAdjustPane")->lines[3], "D    ");
  EXPECT_EQ(last.find("kgSource")->lines[4], "  a++;");
  // Typing never changes the text.
  app->xdotool({"type", "zq"});
  usleep(200 * 1000);
  EXPECT_EQ(app->state().find("kgSource")->lines[4], "  a++;");
}

TEST_F(SourceKeys, FromTheWorstFileToItsUnusedLinesByKeysAlone) {
  writeFile(dir.file(".kestrel.Xdefaults"), "Kestrelgauge*kgAnnotatedSource.geometry: 570x540+700+0\n");
  app = std::make_unique<GuiApp>(server,
                                 std::vector<std::string>{buildDir() + "/bin/kestrel", "-view",
                                                          "-adjustmentfilename=" + dir.file("adjust"), dir.file("n.kgv")},
                                 std::vector<std::string>{"HOME=" + dir.path(), "KESTREL_HOME=" + buildDir()});
  ASSERT_TRUE(app->waitFor([](const GuiState& s) { return s.find("kgOutline") && !s.find("kgOutline")->lines.empty(); },
                           &last));
  // Without a window manager the keyboard follows the pointer: it rests over each window in turn,
  // as a window manager gives a new window the keyboard. Everything else is keys.
  const WidgetInfo* outline = last.find("kgOutline");
  app->moveTo(outline->x + outline->width / 2, outline->y + outline->height - 20);
  // The rows are in the order of adjusted unused lines, the worst first.
  for (const char* k : {"Down", "Down", "Right", "Down", "Right", "Down", "Return"}) app->key(k);
  ASSERT_TRUE(app->waitFor([](const GuiState& s) { return s.viewable("kgLineNumbers"); }, &last))
      << last.raw().substr(0, 1500);
  const WidgetInfo* src = last.find("kgSource");
  app->moveTo(src->x + src->width / 2, src->y + src->height / 2);
  const int opened = last.find("kgLineNumbers")->number("current");
  EXPECT_GT(opened, 0);
  app->key("Home");
  ASSERT_TRUE(waitCurrent(1));
  std::vector<int> seen;
  for (int i = 0; i < 4; ++i) {
    app->key("n");
    usleep(150 * 1000);
    seen.push_back(app->state().find("kgLineNumbers")->number("current"));
  }
  EXPECT_EQ(seen, (std::vector<int>{4, 12, 44, 44}));
  ASSERT_TRUE(waitMessage("No unused lines below"));
  app->key("p");
  ASSERT_TRUE(waitCurrent(12));
  app->key("d");
  ASSERT_TRUE(waitCurrent(13));
  EXPECT_EQ(last.find("kgAdjustPane")->lines[11], "D    ");
  EXPECT_EQ(last.find("kgCounts")->lines[11], "DEAD");
}

}  // namespace
}  // namespace kgtest
