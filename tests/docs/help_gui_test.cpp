// The Help menus of "kestrel -view" on a private X server: each topic runs the browser command
// of the resources with the installed manual's address at the topic; a command that cannot be
// started or fails is told in an error dialog that names the page; and the manual describes
// every entry of the windows' menus.
#include <gtest/gtest.h>
#include <sys/stat.h>
#include <sys/time.h>
#include <unistd.h>

#include <sstream>

#include "summary/help_page.h"
#include "tests/toolkit/gui_driver.h"
#include "tools/kgv_maker.h"

namespace kgtest {
namespace {

// The lines of the state that describe menus, to see why one is not shown.
std::string menuDump(const GuiState& s) {
  std::istringstream in(s.raw());
  std::string out;
  for (std::string line; std::getline(in, line);)
    if (line.find("kgTopMenu") != std::string::npos || line.find("geom") == std::string::npos) out += line.substr(0, 220) + "\n";
  return out;
}

class HelpMenu : public ::testing::Test {
 protected:
  void SetUp() override {
    ASSERT_FALSE(server.display().empty()) << "Xvfb did not start";
    source = dir.file("prog.c");
    const std::string run = writeOneFunctionProgram(source);
    std::string error;
    ASSERT_TRUE(makeKgvFile(run, dir.file("p.kgv"), error)) << error;
    // The browser stands in for the user's: each run is one line of its arguments.
    browser = dir.file("browser");
    writeFile(browser, "#!/bin/sh\nfor a in \"$@\"; do printf '%s|' \"$a\"; done >> " + dir.file("runs") +
                           "\necho >> " + dir.file("runs") + "\nexit ${BROWSER_STATUS:-0}\n");
    chmod(browser.c_str(), 0755);
  }
  void TearDown() override {
    if (app && app->running()) {
      EXPECT_EQ(app->stop(), 0) << app->errorOutput();
    }
  }
  void start(const std::string& command, const std::vector<std::string>& env = {}) {
    writeFile(dir.file(".kestrel.Xdefaults"), "Kestrelgauge*helpBrowserCommand: " + command +
                                                  "\nKestrelgauge*kgAnnotatedSource.geometry: +0+250\n");
    std::vector<std::string> environment{"HOME=" + dir.path()};
    environment.insert(environment.end(), env.begin(), env.end());
    app = std::make_unique<GuiApp>(
        server,
        std::vector<std::string>{buildDir() + "/bin/kestrel", "-view", "-adjustmentfilename=" + dir.file("adjust"),
                                 dir.file("p.kgv")},
        environment);
    ASSERT_TRUE(app->waitFor([](const GuiState& s) { return s.find("kgOutline") && !s.find("kgOutline")->lines.empty(); },
                             &last))
        << app->errorOutput();
  }
  // Clicks a widget by the end of its path once it can be seen (the first of that name, or
  // the one whose path also holds `within`).
  void click(const std::string& name, const std::string& within = "") {
    GuiState s;
    const WidgetInfo* w = nullptr;
    ASSERT_TRUE(app->waitFor(
        [&](const GuiState& st) {
          for (const WidgetInfo* c : st.findAll(name))
            if (c->flag("viewable") && c->path.find(within) != std::string::npos) return true;
          return false;
        },
        &s))
        << name << " in " << within << "\n" << menuDump(s);
    for (const WidgetInfo* c : s.findAll(name))
      if (c->flag("viewable") && c->path.find(within) != std::string::npos) w = c;
    usleep(150 * 1000);  // a menu just mapped takes a moment to accept the pointer
    app->click(w->x + w->width / 2, w->y + w->height / 2);
  }
  // The browser's runs so far, one line of arguments each.
  std::vector<std::string> runs() {
    std::vector<std::string> out;
    if (!fileExists(dir.file("runs"))) return out;
    std::istringstream in(readFile(dir.file("runs")));
    for (std::string l; std::getline(in, l);) out.push_back(l);
    return out;
  }
  bool waitRuns(size_t n) {
    return waitUntil(10, [&] { return runs().size() >= n; });
  }
  // The text of the error dialog once it shows.
  std::string errorDialogText() {
    std::string text;
    app->waitFor(
        [&](const GuiState& s) {
          for (const WidgetInfo* w : s.findAll("Message"))
            if (w->path.find("kgErrorDialog") != std::string::npos && w->flag("viewable")) text = w->field("label");
          return !text.empty();
        },
        &last, 10000);
    return text;
  }
  void openSourceWindow() {
    const WidgetInfo& t = *last.find("kgOutline");
    app->click(t.x + 2 + 10 * 8 + 4, t.y + (1 - t.number("top")) * 17 + 8);
    app->key("Right");
    ASSERT_TRUE(app->waitFor([](const GuiState& s) { return s.find("kgOutline")->lines.size() >= 3; }, &last));
    app->key("Down");
    app->key("Right");
    ASSERT_TRUE(app->waitFor([](const GuiState& s) { return s.find("kgOutline")->lines.size() >= 4; }, &last));
    app->key("Down");
    app->key("Return");
    ASSERT_TRUE(app->waitViewable("kgCounts", &last)) << app->errorOutput();
  }
  std::string page() const { return kgHelpPagePath(buildDir()); }

  XvfbServer server;
  TempDir dir;
  std::string source, browser;
  std::unique_ptr<GuiApp> app;
  GuiState last;
};

TEST_F(HelpMenu, EachTopicOpensTheInstalledManualAtItsChapterInTheBrowserCommand) {
  ASSERT_TRUE(fileExists(page()));
  // The command may carry its own options: the address comes last, as one argument.
  start(browser + " --new-window");
  size_t n = 0;
  for (const KG_HelpTopic& topic : kgMainWindowHelpTopics()) {
    click("kgHelpPulldown");
    click(std::string("kgHelp.") + topic.name);
    ASSERT_TRUE(waitRuns(++n)) << topic.name << "\n" << app->errorOutput();
    EXPECT_EQ(runs().back(), "--new-window|" + kgFileUrl(page(), topic.anchor) + "|") << topic.name;
  }
  EXPECT_EQ(runs().front(), "--new-window|file://" + page() + "|");
  EXPECT_EQ(runs()[6], "--new-window|file://" + page() + "#keys|");
  EXPECT_FALSE(last.viewable("kgErrorDialog"));

  // The source window's own topics.
  openSourceWindow();
  for (const KG_HelpTopic& topic : kgSourceWindowHelpTopics()) {
    click("kgHelpPulldown", "kgAnnotatedSource");
    click(std::string("kgHelp.") + topic.name, "kgAnnotatedSource");
    ASSERT_TRUE(waitRuns(++n)) << topic.name << "\n" << app->errorOutput();
    EXPECT_EQ(runs().back(), "--new-window|" + kgFileUrl(page(), topic.anchor) + "|") << topic.name;
  }
  EXPECT_EQ(runs().back(), "--new-window|file://" + page() + "#keys-of-the-annotated-source-window|");
  last = app->state();
  EXPECT_FALSE(last.viewable("kgErrorDialog"));
  // "Product information" is still there.
  click("kgHelpPulldown");
  click("kgHelp.kgProductInfo");
  EXPECT_TRUE(app->waitViewable("kgInformationDialog", &last));
}

TEST_F(HelpMenu, OnWindowOpensThePlaceOfThePartClickedAndAKeyLeavesTheMode) {
  start(browser);
  // Enters the mode and clicks the middle of the part, as a user would after the pointer changed.
  auto helpOn = [&](const std::string& part, const std::string& window) {
    last = app->state();
    const WidgetInfo* w = nullptr;
    for (const WidgetInfo* c : last.findAll(part))
      if (c->flag("viewable") && c->path.find(window) != std::string::npos) w = c;
    ASSERT_NE(w, nullptr) << part;
    click("kgHelpPulldown", window);
    click("kgHelp.kgHelpOnWindow", window);
    usleep(500 * 1000);
    app->click(w->x + w->width / 2, w->y + w->height / 2);
  };
  size_t n = 0;
  const std::vector<std::pair<std::string, std::string>> mainParts = {
      {"toolbar", "the-toolbar"}, {"kgOutline", "keys-of-the-main-window"}, {"kgRowName", "the-main-window"}};
  for (const auto& [part, anchor] : mainParts) {
    helpOn(part, "kestrel");
    ASSERT_TRUE(waitRuns(++n)) << part << "\n" << app->errorOutput();
    EXPECT_EQ(runs().back(), kgFileUrl(page(), anchor) + "|") << part;
  }
  // The parts take input again: keys move the outline's selection and the menus work.
  last = app->state();
  EXPECT_TRUE(last.find("kgOutline")->flag("sensitive"));
  EXPECT_TRUE(last.find("toolbar")->flag("sensitive"));

  // A key leaves the mode without opening anything.
  click("kgHelpPulldown");
  click("kgHelp.kgHelpOnWindow");
  usleep(500 * 1000);
  // The key goes to the window under the pointer.
  const WidgetInfo* outline = last.find("kgOutline");
  app->moveTo(outline->x + 40, outline->y + 40);
  app->key("Escape");
  usleep(500 * 1000);
  EXPECT_EQ(runs().size(), n);
  ASSERT_TRUE(app->waitFor([](const GuiState& s) { return s.find("kgOutline") != nullptr; }, &last)) << app->errorOutput();
  click("kgHelpPulldown");
  click("kgHelp.kgHelpManual");
  ASSERT_TRUE(waitRuns(++n));
  EXPECT_EQ(runs().back(), "file://" + page() + "|");

  // The source window's parts have their own places; its search bar stays selectable.
  openSourceWindow();
  helpOn("kgAdjustPane", "kgAnnotatedSource");
  ASSERT_TRUE(waitRuns(++n)) << app->errorOutput();
  EXPECT_EQ(runs().back(), kgFileUrl(page(), "marking-lines-in-the-window") + "|");
  helpOn("kgSource", "kgAnnotatedSource");
  ASSERT_TRUE(waitRuns(++n)) << app->errorOutput();
  EXPECT_EQ(runs().back(), kgFileUrl(page(), "the-annotated-source-window") + "|");
  last = app->state();
  EXPECT_TRUE(last.find("kgSource")->flag("sensitive"));
}

TEST_F(HelpMenu, ACommandThatCannotBeStartedIsReportedWithThePage) {
  start(dir.file("no-such-browser"));
  click("kgHelpPulldown");
  click("kgHelp.kgHelpKeys");
  const std::string text = errorDialogText();
  EXPECT_NE(text.find("could not be started"), std::string::npos) << text;
  EXPECT_NE(text.find(dir.file("no-such-browser")), std::string::npos) << text;
  EXPECT_NE(text.find(page()), std::string::npos) << text;
  EXPECT_TRUE(runs().empty());
}

TEST_F(HelpMenu, ACommandThatFailsIsReportedWithItsStatusAndThePage) {
  start(browser, {"BROWSER_STATUS=3"});
  click("kgHelpPulldown");
  click("kgHelp.kgHelpManual");
  const std::string text = errorDialogText();
  EXPECT_NE(text.find("failed with exit status 3"), std::string::npos) << text;
  EXPECT_NE(text.find(page()), std::string::npos) << text;
  // It did run, with the page.
  ASSERT_EQ(runs().size(), 1u);
  EXPECT_EQ(runs()[0], "file://" + page() + "|");
}

// Every label of the menus, by the window's name in the widget paths.
std::vector<std::string> menuLabels(const GuiState& s, const std::string& window) {
  std::vector<std::string> labels;
  std::istringstream in(s.raw());
  for (std::string line; std::getline(in, line);) {
    const std::string path = line.substr(0, line.find(' '));
    if (path.find("." + window + ".") == std::string::npos || path.find(".kgTopMenu.") == std::string::npos) continue;
    if (line.find(" class=XmPushButton ") == std::string::npos && line.find(" class=XmToggleButton ") == std::string::npos &&
        line.find(" class=XmCascadeButton ") == std::string::npos)
      continue;
    GuiState one;
    one.parse(line + "\n");
    const WidgetInfo* w = one.find(path);
    if (w && !w->field("label").empty()) labels.push_back(w->field("label"));
  }
  return labels;
}

TEST_F(HelpMenu, TheManualDescribesEveryEntryOfTheMenus) {
  const std::string manual = readFile(sourceDir() + "/docs/manual.md");
  start(browser);
  openSourceWindow();
  last = app->state();
  const std::vector<std::string> main = menuLabels(last, "kestrel"), detail = menuLabels(last, "kgAnnotatedSource");
  EXPECT_GT(main.size(), 50u);
  EXPECT_GT(detail.size(), 15u);
  for (const auto* labels : {&main, &detail})
    for (const std::string& label : *labels) EXPECT_NE(manual.find(label), std::string::npos) << "\"" << label << "\"";
}

}  // namespace
}  // namespace kgtest
