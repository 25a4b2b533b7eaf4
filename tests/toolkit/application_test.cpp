// The toolkit inside one process on a private X server: timers and idle work, the busy pointer,
// resources, and the multi-line text's content, scrolling, glyphs and shared scroll bars as a
// program drives them.
#include <gtest/gtest.h>

#include <memory>
#include <string>
#include <vector>

#include "outline/qr_oi_multi_text.h"
#include "outline/qr_oi_scroll_text.h"
#include "tests/common/test_support.h"
#include "toolkit/oi_application.h"
#include "toolkit/oi_controls.h"
#include "toolkit/oi_grid_box.h"
#include "toolkit/oi_multi_text.h"
#include "toolkit/oi_scroll_bar.h"
#include "toolkit/oi_window.h"

#include <X11/Intrinsic.h>

// The sanitizer build's leak check ignores the X libraries' lifetime caches in this process (the
// same list as tests/lsan_x11.supp, which the programs the GUI tests start are given).
extern "C" const char* __lsan_default_suppressions() {
  return "leak:libXm.so\nleak:libXt.so\nleak:libX11.so\nleak:libXft.so\nleak:libfontconfig.so\n"
         "leak:libfreetype.so\n";
}

namespace {

class Toolkit : public ::testing::Test {
 protected:
  static void SetUpTestSuite() {
    server = new kgtest::XvfbServer;
    // The server resets when its last client leaves; one connection held open keeps it ready
    // for the next test's.
    if (!server->display().empty()) keeper = XOpenDisplay(server->display().c_str());
  }
  static void TearDownTestSuite() {
    if (keeper) XCloseDisplay(keeper);
    keeper = nullptr;
    delete server;
    server = nullptr;
  }
  void SetUp() override {
    ASSERT_FALSE(server->display().empty());
    args = {"kestrel", "-display", server->display(), "-xrm", "*probeLabel.labelString: From -xrm", "-title",
            "Probe", "file.kgv"};
    for (auto& a : args) argv.push_back(a.data());
    argc = static_cast<int>(argv.size());
    argv.push_back(nullptr);
    std::string error;
    ASSERT_TRUE(OI_Application::open(argc, argv.data(), error)) << error;
    app = OI_Application::instance();
  }
  void TearDown() override {
    window.reset();
    OI_Application::close();
  }
  // Runs the event loop until `done` or about two seconds have passed.
  bool runUntil(const std::function<bool()>& done) {
    long long end = oiNowMs() + 2000;
    while (!done() && oiNowMs() < end) {
      app->addTimeOut(5, [] {});  // so that the wait below ends even when nothing else comes
      app->processOne();
    }
    return done();
  }
  // A shown window holding a box for the test's widgets.
  OI_GridBox* shownBox() {
    window = std::make_unique<OI_TopLevel>("probe", "Probe");
    box = window->own(std::make_unique<OI_GridBox>(window->mainWindow(), "probeBox"));
    window->setWorkArea(box->widget());
    return box;
  }
  void show() {
    box->fitToContents();
    window->show();
    runUntil([&] { return window->isViewable(); });
    app->processPending();
  }

  static kgtest::XvfbServer* server;
  static Display* keeper;
  std::vector<std::string> args;
  std::vector<char*> argv;
  int argc = 0;
  OI_Application* app = nullptr;
  std::unique_ptr<OI_TopLevel> window;
  OI_GridBox* box = nullptr;
};

kgtest::XvfbServer* Toolkit::server = nullptr;
Display* Toolkit::keeper = nullptr;

TEST_F(Toolkit, XOptionsAreTakenFromTheCommandLineAndKeptAsResourceLines) {
  ASSERT_EQ(argc, 2);
  EXPECT_STREQ(argv[1], "file.kgv");
  EXPECT_EQ(app->commandLineResources(),
            (std::vector<std::string>{"*probeLabel.labelString: From -xrm", ".title: Probe"}));
  shownBox();
  OI_Label label(box->widget(), "probeLabel", "Built in");
  OI_Label other(box->widget(), "otherLabel", "Built in");
  EXPECT_EQ(label.label(), "From -xrm");
  EXPECT_EQ(other.label(), "Built in");
  EXPECT_EQ(label.resourceString("labelString"), "From -xrm");
  EXPECT_EQ(other.resourceString("noSuchResource"), "");
}

TEST_F(Toolkit, TimeOutsFireInOrderAndCancelledOnesNever) {
  std::vector<int> fired;
  app->addTimeOut(40, [&] { fired.push_back(40); });
  app->addTimeOut(10, [&] { fired.push_back(10); });
  OI_TimerHandle cancelled = app->addTimeOut(20, [&] { fired.push_back(20); });
  EXPECT_TRUE(cancelled.pending());
  cancelled.cancel();
  EXPECT_FALSE(cancelled.pending());
  ASSERT_TRUE(runUntil([&] { return fired.size() == 2; }));
  EXPECT_EQ(fired, (std::vector<int>{10, 40}));
  // Idle work runs until it says it is done.
  int rounds = 0;
  app->addWorkProc([&] { return ++rounds == 3; });
  ASSERT_TRUE(runUntil([&] { return rounds == 3; }));
  // A time-out that throws is reported and does not take the loop down.
  bool after = false;
  app->addTimeOut(1, [] { throw std::runtime_error("broken"); });
  app->addTimeOut(5, [&] { after = true; });
  EXPECT_TRUE(runUntil([&] { return after; }));
}

TEST_F(Toolkit, AnIdleTimeOutWaitsForTheUserToStopWorking) {
  bool fired = false;
  long long start = oiNowMs();
  app->addIdleTimeOut(150, [&] { fired = true; });
  // The user keeps working for a while: the time-out waits until 150 ms after the last activity.
  while (oiNowMs() - start < 200) {
    app->noteUserActivity();
    app->addTimeOut(20, [] {});
    app->processOne();
    ASSERT_FALSE(fired);
  }
  ASSERT_TRUE(runUntil([&] { return fired; }));
  EXPECT_GE(oiNowMs() - start, 340);
}

TEST_F(Toolkit, TheBusyPointerIsCountedAndQuitEndsTheLoop) {
  shownBox();
  OI_Label l(box->widget(), "l", "x");
  show();
  app->beginBusyPointer();
  app->beginBusyPointer();
  app->endBusyPointer();
  EXPECT_EQ(app->busyCount(), 1);
  app->endBusyPointer();
  app->endBusyPointer();  // one too many is ignored
  EXPECT_EQ(app->busyCount(), 0);
  app->addTimeOut(10, [&] { app->quit(); });
  app->run();  // returns only because the time-out woke the wait
  EXPECT_TRUE(app->quitting());
}

TEST_F(Toolkit, TextKeepsGlyphsAndSelectionOnTheirLinesAsLinesComeAndGo) {
  shownBox();
  OI_MultiText text(box->widget(), "probeText");
  box->place(text.widget(), 0, 0, true, true);
  show();
  std::vector<std::string> lines;
  for (int i = 0; i < 50; ++i) lines.push_back("line " + std::to_string(i));
  text.insertLines(0, lines);
  static const unsigned char bits[] = {0xff, 0xff};
  OI_Glyph* g = text.addGlyph("mark", 10, 0, bits, 8, 2);
  ASSERT_NE(g, nullptr);
  text.selectLines(12, 13);
  text.insertLines(5, 3);
  EXPECT_EQ(g->line(), 13u);
  EXPECT_EQ(text.selectionStart(), (OI_TextPos{15, 0}));
  EXPECT_EQ(text.lineText(15), "line 12");
  text.deleteLines(0, 4);
  EXPECT_EQ(g->line(), 9u);
  EXPECT_EQ(text.lineText(9), "line 10");
  // A glyph whose line goes is taken off the text until it is placed again.
  text.deleteLines(9, 1);
  EXPECT_EQ(g->line(), OI_Glyph::noLine);
  text.moveGlyph(g, 2, 4);
  EXPECT_EQ(g->line(), 2u);
  text.removeGlyph(g);
  EXPECT_TRUE(text.glyphs().empty());

  // Scrolling stops at the last page, and showLine moves as little as it can.
  uint32_t vis = text.visibleLines();
  ASSERT_GT(vis, 3u);
  text.setTopLine(1000);
  EXPECT_EQ(text.topLine(), text.lineCount() - vis);
  text.showLine(2);
  EXPECT_EQ(text.topLine(), 2u);
  text.showLine(2 + vis);
  EXPECT_EQ(text.topLine(), 3u);
  EXPECT_TRUE(text.isLineVisible(2 + vis));
  EXPECT_FALSE(text.isLineVisible(2));

  // While redisplay is held nothing is drawn; the release draws once.
  text.holdRedisplay();
  text.holdRedisplay();
  text.setLine(3, "changed");
  text.releaseRedisplay();
  EXPECT_EQ(text.holdCount(), 1);
  text.releaseRedisplay();
  text.releaseRedisplay();  // a release too many is ignored
  EXPECT_EQ(text.holdCount(), 0);
  text.redisplay();
  EXPECT_EQ(text.lineText(3), "changed");
}

TEST_F(Toolkit, TextsSharingABarScrollTogetherAndBarsHideWhenEverythingFits) {
  QR_OI_Init();
  shownBox();
  QR_OI_ScrollTextGang gang(box->widget(), "gang");
  box->place(gang.widget(), 0, 0, true, true);
  QR_OI_ScrollText* left = gang.addText("left", 0, 0, false, true);
  QR_OI_ScrollText* right = gang.addText("right", 1, 0, true, true);
  OI_ScrollBar* bar = gang.addSharedBar(OI_Side::right, 1, 0);
  left->text()->setRows(10);
  right->text()->setRows(10);
  show();
  // The texts are the outline's kind once QR_OI_Init ran.
  EXPECT_NE(dynamic_cast<QR_OI_MultiText*>(left->text()), nullptr);
  // Layout names answer with the shared bar on its side and the text's own bar elsewhere.
  EXPECT_EQ(right->scrollBar("@right_scroll_bar"), bar);
  EXPECT_EQ(left->scrollBar("@right_scroll_bar"), bar);
  EXPECT_NE(right->scrollBar("@bottom_scroll_bar"), bar);
  EXPECT_EQ(right->scrollBar("@middle"), nullptr);
  // Few lines: no bar is needed.
  left->text()->insertLines(0, std::vector<std::string>(3, "x"));
  right->text()->insertLines(0, std::vector<std::string>(3, "y"));
  left->text()->redisplay();
  right->text()->redisplay();
  EXPECT_FALSE(bar->isManaged());
  // Many lines: the bar shows, and scrolling either text moves the other.
  left->text()->insertLines(0, std::vector<std::string>(97, "x"));
  right->text()->insertLines(0, std::vector<std::string>(97, "y"));
  left->text()->redisplay();
  right->text()->redisplay();
  EXPECT_TRUE(bar->isManaged());
  right->text()->scrollLines(7);
  EXPECT_EQ(left->text()->topLine(), 7u);
  EXPECT_EQ(bar->value(), 7);
  bar->setValue(30);
  EXPECT_EQ(right->text()->topLine(), 30u);
  EXPECT_EQ(left->text()->topLine(), 30u);
}

TEST_F(Toolkit, AHeadingAndItsTableScrollSidewaysTogether) {
  QR_OI_Init();
  shownBox();
  QR_OI_ScrollTextGang gang(box->widget(), "kgOutlineGang");
  box->place(gang.widget(), 0, 0, true, true);
  QR_OI_ScrollText* title = gang.addText("kgTitle", 0, 0, true, false);
  QR_OI_ScrollText* table = gang.addText("kgOutline", 0, 1, true, true);
  OI_ScrollBar* bar = gang.addSharedBar(OI_Side::bottom, 0, 1);
  title->text()->setRows(2);
  title->text()->setColumns(40);
  table->text()->setColumns(40);
  show();
  title->text()->insertLines(0, {std::string(200, 'h'), std::string(200, 'H')});
  table->text()->insertLines(0, std::vector<std::string>(5, std::string(200, 'r')));
  title->text()->redisplay();
  table->text()->redisplay();
  EXPECT_TRUE(bar->isManaged());
  EXPECT_FALSE(bar->vertical());
  table->text()->setLeftColumn(25);
  EXPECT_EQ(title->text()->leftColumn(), 25u);
  // The heading's own vertical bar stays its own.
  EXPECT_NE(title->scrollBar(OI_Side::right), table->scrollBar(OI_Side::right));
}

TEST_F(Toolkit, ListsEntryFieldsAndFramesHoldWhatTheyAreGiven) {
  shownBox();
  OI_Frame frame(box->widget(), "frame", "Files");
  box->place(frame.widget(), 0, 0);
  OI_ScrolledList list(frame.widget(), "list", 4);
  OI_EntryField entry(box->widget(), "entry", 10);
  box->place(entry.widget(), 0, 1);
  show();
  list.setItems({"a.kgv", "b.kgv", "c.kgv"});
  EXPECT_EQ(list.items(), (std::vector<std::string>{"a.kgv", "b.kgv", "c.kgv"}));
  EXPECT_EQ(list.selectedIndex(), -1);
  list.select(1);
  EXPECT_EQ(list.selectedIndex(), 1);
  entry.setText("/tmp/out.kgv");
  EXPECT_EQ(entry.text(), "/tmp/out.kgv");
  // The frame's title is a label of its own name.
  Widget title = XtNameToWidget(frame.widget(), "frameTitle");
  ASSERT_NE(title, nullptr);
}

TEST_F(Toolkit, TheCoverKeepsThePictureBelowALineUntilTheChangeIsComplete) {
  QR_OI_Init();
  shownBox();
  QR_OI_MultiText text(box->widget(), "outlineText");
  box->place(text.widget(), 0, 0, true, true);
  show();
  text.insertLines(0, std::vector<std::string>(20, "row"));
  text.coverFrom(4);
  EXPECT_TRUE(text.covered());
  text.uncover();
  EXPECT_FALSE(text.covered());
  // Below the window's end there is nothing to cover.
  text.coverFrom(10000);
  EXPECT_FALSE(text.covered());
}

}  // namespace
