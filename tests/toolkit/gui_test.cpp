// The toolkit as a user meets it: a small window on a private X server, driven with keys and
// clicks, read back through the test hook and checked on screenshots.
#include <gtest/gtest.h>

#include <unistd.h>

#include <cstdlib>

#include "tests/toolkit/gui_driver.h"

namespace kgtest {
namespace {

std::string probe() { return buildDir() + "/tests/toolkit_probe"; }

// Colours the text draws with by default.
constexpr uint32_t white = 0xFFFFFF, selectBlue = 0x3465A4, separatorGrey = 0x8C8C8C, headingBlue = 0xDFE5EE;

// The screen point in the middle of a text cell.
struct Cell {
  int x, y;
};
Cell cellCentre(const WidgetInfo& text, int line, int col) {
  int cw = 8, ch = 16;
  sscanf(text.field("cell").c_str(), "%dx%d", &cw, &ch);
  int top = text.number("top");
  return {text.x + 2 + col * cw + cw / 2, text.y + (line - top) * ch + ch / 2};
}

class ProbeWindow : public ::testing::Test {
 protected:
  void start(const std::vector<std::string>& extra = {}) {
    ASSERT_FALSE(server.display().empty()) << "Xvfb did not start";
    std::vector<std::string> argv{probe()};
    argv.insert(argv.end(), extra.begin(), extra.end());
    app = std::make_unique<GuiApp>(server, argv);
    ASSERT_TRUE(app->waitViewable("probeText", &last)) << app->errorOutput() << last.raw();
  }
  void TearDown() override {
    // Every window comes down in order; the sanitizer build reports any fault on the way.
    if (app && app->running()) {
      EXPECT_EQ(app->stop(), 0) << app->errorOutput();
    }
  }
  const WidgetInfo& text() {
    last = app->state();
    const WidgetInfo* t = last.find("probeText");
    EXPECT_NE(t, nullptr);
    static WidgetInfo none;
    return t ? *t : none;
  }
  std::string status() {
    GuiState s = app->state();
    const WidgetInfo* c = s.find("probeCounts");
    return c && !c->lines.empty() ? c->lines[0] : "";
  }
  bool waitStatus(const std::string& want) {
    return app->waitFor([&](const GuiState& s) {
      const WidgetInfo* c = s.find("probeCounts");
      return c && !c->lines.empty() && c->lines[0] == want;
    });
  }
  void clickWidget(const std::string& name, int button = 1) {
    GuiState s;
    ASSERT_TRUE(app->waitViewable(name, &s)) << name << "\n" << s.raw();
    const WidgetInfo* w = s.find(name);
    // A person takes a moment before clicking what just appeared; menus need it to settle.
    usleep(150 * 1000);
    app->click(w->x + w->width / 2, w->y + w->height / 2, button);
  }

  XvfbServer server;
  std::unique_ptr<GuiApp> app;
  GuiState last;
};

TEST_F(ProbeWindow, TextShowsItsLinesAttributesAndScrollsWithKeysAndWheel) {
  start();
  WidgetInfo t = text();
  EXPECT_EQ(t.number("lines"), 200);
  EXPECT_EQ(t.number("top"), 0);
  ASSERT_GE(t.lines.size(), 2u);
  EXPECT_EQ(t.lines[1], "Line 1    value 7");
  int visible = t.number("visible");
  ASSERT_GT(visible, 5);

  Screenshot shot = app->screenshot();
  ASSERT_TRUE(shot.ok());
  // Some ink in the first characters of line 1, white around it.
  Cell c = cellCentre(t, 1, 0);
  bool ink = false;
  for (int dx = -4; dx < 4 * 8; ++dx)
    for (int dy = -6; dy < 6; ++dy)
      if ((shot.at(c.x + dx, c.y + dy) & 0xFF) < 0x60) ink = true;
  EXPECT_TRUE(ink) << "no text drawn on line 1";
  EXPECT_EQ(shot.at(cellCentre(t, 1, 60).x, cellCentre(t, 1, 60).y), white);
  // The separator attribute is a thin grey line through the middle of its cell.
  for (int line : {1, 5, 9}) {
    Cell s = cellCentre(t, line, 9);
    EXPECT_EQ(shot.at(s.x, s.y), separatorGrey) << "line " << line;
    EXPECT_EQ(shot.at(s.x + 2, s.y), white) << "line " << line;
  }
  // The heading attribute has its own background; the red word is red.
  Cell h = cellCentre(t, 0, 14);
  EXPECT_EQ(shot.at(h.x, h.y - 5), headingBlue);
  bool red = false;
  for (int col = 11; col < 16; ++col) {
    Cell r = cellCentre(t, 3, col);
    for (int dy = -5; dy < 5; ++dy)
      for (int dx = -3; dx < 3; ++dx) {
        uint32_t p = shot.at(r.x + dx, r.y + dy);
        if ((p >> 16) > 0x90 && ((p >> 8) & 0xFF) < 0x60) red = true;
      }
  }
  EXPECT_TRUE(red);

  // Page Down moves a page less one line; the counts pane shares the bar and follows.
  app->moveTo(t.x + 100, t.y + 100);
  app->key("Next");
  GuiState s;
  ASSERT_TRUE(app->waitFor(
      [&](const GuiState& st) { return st.find("probeText") && st.find("probeText")->number("top") == visible - 1; },
      &s))
      << s.raw().substr(0, 400);
  EXPECT_EQ(s.find("probeCounts")->number("top"), visible - 1);
  EXPECT_EQ(s.find("QR_right_sb")->number("value"), visible - 1);
  // The wheel scrolls three lines; Ctrl+End goes to the last page.
  app->click(t.x + 100, t.y + 100, 5);
  ASSERT_TRUE(app->waitFor([&](const GuiState& st) { return st.find("probeText")->number("top") == visible + 2; }));
  app->key("ctrl+End");
  ASSERT_TRUE(app->waitFor(
      [&](const GuiState& st) { return st.find("probeText")->number("top") == 200 - visible; }, &s));
  EXPECT_EQ(s.find("probeCounts")->number("top"), 200 - visible);
}

TEST_F(ProbeWindow, DraggingSelectsTextThatIsDrawnHighlighted) {
  start();
  WidgetInfo t = text();
  Cell from = cellCentre(t, 3, 0), to = cellCentre(t, 5, 4);
  app->moveTo(from.x - 3, from.y);
  app->xdotool({"mousedown", "1"});
  app->moveTo(to.x - 3, to.y - 2);
  app->moveTo(to.x - 3, to.y);
  app->xdotool({"mouseup", "1"});
  GuiState s;
  ASSERT_TRUE(app->waitFor(
      [&](const GuiState& st) { return st.find("probeText")->field("selection") == "3:0-5:4"; }, &s))
      << s.find("probeText")->field("selection");
  Screenshot shot = app->screenshot();
  // Line 4 is selected from end to end, line 5 up to its fourth character, line 7 not at all.
  EXPECT_EQ(shot.at(cellCentre(t, 4, 40).x, cellCentre(t, 4, 40).y), selectBlue);
  EXPECT_EQ(shot.at(cellCentre(t, 5, 2).x, cellCentre(t, 5, 2).y - 6), selectBlue);
  EXPECT_EQ(shot.at(cellCentre(t, 5, 6).x, cellCentre(t, 5, 6).y - 6), white);
  EXPECT_EQ(shot.at(cellCentre(t, 7, 2).x, cellCentre(t, 7, 2).y - 6), white);

  // A double click takes the word under the pointer (a moment after the drag, as a person would).
  usleep(400 * 1000);
  Cell word = cellCentre(t, 8, 12);
  app->moveTo(word.x, word.y);
  app->xdotool({"click", "--repeat", "2", "--delay", "40", "1"});
  ASSERT_TRUE(app->waitFor(
      [&](const GuiState& st) { return st.find("probeText")->field("selection") == "8:10-8:15"; }, &s))
      << s.find("probeText")->field("selection") << app->errorOutput();
}

TEST_F(ProbeWindow, DialogsWaitForTheUserAndReturnThePressedButton) {
  start();
  // A question with named buttons.
  clickWidget("probeFile");
  clickWidget("probeAsk");
  GuiState s;
  ASSERT_TRUE(app->waitViewable("probeContinue", &s)) << s.raw();
  const WidgetInfo* q = s.find("probeQuestion");
  ASSERT_NE(q, nullptr);
  clickWidget("probeCancel");
  ASSERT_TRUE(waitStatus("answer: probeCancel")) << status();
  ASSERT_TRUE(app->waitFor([](const GuiState& st) { return !st.viewable("probeContinue"); }));

  // The information dialog is made once and shown again with its one button.
  for (int round = 0; round < 2; ++round) {
    clickWidget("probeFile");
    clickWidget("probeInfo");
    ASSERT_TRUE(app->waitViewable("probeInformation", &s));
    EXPECT_EQ(s.find("probeInformation")->field("message"), "Nothing to report.");
    clickWidget("probeInformation.kgOK");
    ASSERT_TRUE(waitStatus("message closed: kgOK"));
    app->xdotool({"mousemove", "5", "5"});
    ASSERT_TRUE(app->waitFor([](const GuiState& st) { return !st.viewable("probeInformation"); }));
    if (round == 0) {
      // Reset the status so the second round proves itself.
      clickWidget("probeFile");
      clickWidget("probeWrap");
      ASSERT_TRUE(waitStatus("wrap on"));
    }
  }

  // The note list shows its heading and items.
  clickWidget("probeFile");
  clickWidget("probeNotes");
  ASSERT_TRUE(app->waitViewable("noteList", &s));
  EXPECT_EQ(s.find("noteHeading")->field("label"), "Some coverage for these files was out of date:");
  EXPECT_NE(s.raw().find("  item: a.kgv\n  item: b.kgv\n"), std::string::npos);
  clickWidget("probeNote.kgOK");
  ASSERT_TRUE(waitStatus("notes closed"));

  // The file dialog: Cancel answers nothing; OK answers the name typed, and Home in the name
  // field goes to its start rather than to the list's first file.
  clickWidget("probeFile");
  clickWidget("probeOpen");
  ASSERT_TRUE(app->waitViewable("probeFileDialog", &s));
  clickWidget("probeFileDialog.Cancel");
  ASSERT_TRUE(waitStatus("file: cancelled"));
  clickWidget("probeFile");
  clickWidget("probeOpen");
  ASSERT_TRUE(app->waitViewable("probeFileDialog.Text", &s)) << s.raw().substr(0, 300);
  clickWidget("probeFileDialog.Text");
  app->key("End");
  app->xdotool({"type", "data.kgv"});
  app->key("Home");
  app->xdotool({"type", "/tmp"});
  ASSERT_TRUE(app->waitFor([](const GuiState& st) {
    const WidgetInfo* f = st.find("probeFileDialog.Text");
    return f && f->field("value").rfind("/tmp", 0) == 0 && f->field("value").find("data.kgv") != std::string::npos;
  }, &s)) << s.find("probeFileDialog.Text")->field("value");
  std::string typed = s.find("probeFileDialog.Text")->field("value");
  clickWidget("probeFileDialog.OK");
  ASSERT_TRUE(waitStatus("file: " + typed)) << status();
}

TEST_F(ProbeWindow, GlyphsTakePressesAndButtonThreeOpensThePopupMenu) {
  start();
  WidgetInfo t = text();
  Cell g = cellCentre(t, 2, 20);
  app->click(g.x - 4 + 5, g.y, 1);  // the 11-pixel glyph starts at the cell's left edge
  ASSERT_TRUE(waitStatus("glyph probeGlyph button 1")) << status();
  app->click(g.x + 1, g.y, 3);
  ASSERT_TRUE(waitStatus("glyph probeGlyph button 3")) << status();
  // Elsewhere, button 3 is the text's popup menu.
  Cell e = cellCentre(t, 6, 30);
  app->click(e.x, e.y, 3);
  GuiState s;
  ASSERT_TRUE(app->waitViewable("probePopupHello", &s));
  EXPECT_EQ(s.find("probePopupTitle")->field("label"), "Actions");
  clickWidget("probePopupHello", 3);  // a popup's cells answer the button that posted it
  ASSERT_TRUE(waitStatus("popup hello")) << status();
}

TEST_F(ProbeWindow, OptionMenuGivesTheKeyboardBackToTheText) {
  start();
  clickWidget("probeOption.OptionButton");
  clickWidget("probeModeB");
  ASSERT_TRUE(waitStatus("option: probeModeB"));
  GuiState s;
  ASSERT_TRUE(app->waitFor([](const GuiState& st) {
    return st.raw().find("focus kestrel.probe = kestrel.probe.mainWindow.probeBox.probeGang.probeTextScroll."
                         "probeText\n") != std::string::npos;
  }, &s)) << s.raw().substr(0, 300);
  WidgetInfo t = text();
  app->moveTo(t.x + 50, t.y + 50);
  app->key("Next");
  ASSERT_TRUE(app->waitFor([](const GuiState& st) { return st.find("probeText")->number("top") > 0; }));
  // The busy pointer is counted and ends with its time-out.
  clickWidget("probeFile");
  clickWidget("probeBusy");
  ASSERT_TRUE(waitStatus("busy over")) << status() << app->errorOutput();
  EXPECT_NE(app->state().raw().find("busy=0\n"), std::string::npos);
}

TEST_F(ProbeWindow, ResourcesOnTheCommandLineReachWidgetsByName) {
  start({"-xrm", "*probeGang*rows: 10", "-xrm", "*probeOpen.labelString: Open data file",
         "-xrm", "*probeText.textBackground: #ffffe0", "-xrm", "*probeQuit.accelerators: Ctrl<Key>Q: fire()"});
  GuiState s;
  ASSERT_TRUE(app->waitFor([](const GuiState& st) { return st.find("probeText")->number("visible") == 10; }, &s))
      << s.find("probeText")->field("visible");
  EXPECT_EQ(s.find("probeOpen")->field("label"), "Open data file");
  EXPECT_EQ(s.find("probeAsk")->field("label"), "Ask...");
  Screenshot shot = app->screenshot();
  const WidgetInfo* t = s.find("probeText");
  EXPECT_EQ(shot.at(cellCentre(*t, 2, 60).x, cellCentre(*t, 2, 60).y), 0xFFFFE0u);
  // The accelerator from the resources quits without opening the menu.
  app->moveTo(t->x + 40, t->y + 40);
  app->key("ctrl+q");
  EXPECT_EQ(app->waitExit(5000), 0) << app->errorOutput();
}

TEST_F(ProbeWindow, ADatabaseInstalledByTheProgramGivesWidgetsTheirResources) {
  // The database comes from the program (as the settings build it); -xrm still wins over it.
  ASSERT_FALSE(server.display().empty());
  app = std::make_unique<GuiApp>(
      server, std::vector<std::string>{probe(), "-xrm", "*probeInfo.labelString: From the command line"},
      std::vector<std::string>{"PROBE_RESOURCES=*probeOpen.labelString: From the database\n"
                               "*probeInfo.labelString: Overridden\n*probeGang*rows: 12\n"});
  GuiState s;
  ASSERT_TRUE(app->waitViewable("probeText", &s)) << app->errorOutput();
  EXPECT_EQ(s.find("probeOpen")->field("label"), "From the database");
  EXPECT_EQ(s.find("probeInfo")->field("label"), "From the command line");
  EXPECT_EQ(s.find("probeText")->number("visible"), 12);
}

TEST_F(ProbeWindow, WithNoFontNamedTheTextFallsBackToTheCoreFixedFont) {
  start({"-xrm", "*probeText.fontName:"});
  const WidgetInfo& t = text();
  EXPECT_EQ(t.field("cell"), "6x13");
  Screenshot shot = app->screenshot();
  int ink = 0;
  for (int x = t.x + 2; x < t.x + 2 + 6 * 6; ++x)
    for (int y = t.y + 13; y < t.y + 26; ++y) ink += (shot.at(x, y) & 0xFF) < 0x60;
  EXPECT_GT(ink, 10) << "no text drawn with the core font";
}

TEST(ProbeStart, WithoutADisplayTheToolkitSaysWhichOneFailed) {
  ProcessResult r = runProcess({probe(), "-display", ":77777"}, {x11LeakSuppressions()});
  EXPECT_EQ(r.status, 3);
  EXPECT_EQ(r.err, "Can't open display :77777\n");
  XvfbServer server;
  ASSERT_FALSE(server.display().empty());
  // X options are taken out; what is left is the program's own business.
  r = runProcess({probe(), "-display", server.display(), "-bogus"}, {x11LeakSuppressions()});
  EXPECT_EQ(r.status, 2);
  EXPECT_EQ(r.err, "unknown argument: -bogus\n");
}

}  // namespace
}  // namespace kgtest
