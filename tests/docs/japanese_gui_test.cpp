// "kestrel -view -language=ja" on a private X server: the menus come up with the label file's
// Japanese texts and nothing is written on standard error.
#include <gtest/gtest.h>

#include <X11/Xresource.h>

#include <unistd.h>

#include <regex>
#include <sstream>

#include "settings/resource_database.h"
#include "tests/toolkit/gui_driver.h"
#include "tools/kgv_maker.h"

namespace kgtest {
namespace {

bool hasNonAscii(const std::string& s) {
  for (unsigned char c : s)
    if (c >= 0x80) return true;
  return false;
}

// The label file's text for a widget name.
std::string labelFileText(const std::string& widget) {
  XrmInitialize();
  XrmDatabase db = XrmGetFileDatabase((appDefaultsDir(buildDir()) + "/Kestrelgauge.label").c_str());
  if (!db) return {};
  char* type = nullptr;
  XrmValue v{};
  std::string text;
  if (XrmGetResource(db, ("kestrel." + widget + ".labelString").c_str(), "Kestrelgauge.Widget.LabelString", &type, &v))
    text = v.addr;
  XrmDestroyDatabase(db);
  return text;
}

// How many widgets of a dialog are shown.
size_t dialogLabelsIn(const GuiState& s, const std::string& dialog) {
  size_t n = 0;
  std::istringstream in(s.raw());
  for (std::string line; std::getline(in, line);)
    if (line.find("." + dialog + "_popup.") != std::string::npos && line.find(" viewable=1") != std::string::npos) ++n;
  return n;
}

class JapaneseViewer : public ::testing::Test {
 protected:
  void SetUp() override {
    ASSERT_FALSE(server.display().empty()) << "Xvfb did not start";
    std::string error;
    ASSERT_TRUE(makeKgvFile("generate records=3 first=0 functions=2 blocks=3 seed=4\n", dir.file("app.kgv"), error))
        << error;
  }
  void TearDown() override {
    if (app && app->running()) {
      EXPECT_EQ(app->stop(), 0) << app->errorOutput();
    }
  }
  void start(const std::vector<std::string>& options, const std::vector<std::string>& env) {
    std::vector<std::string> argv{buildDir() + "/bin/kestrel", "-view"};
    argv.insert(argv.end(), options.begin(), options.end());
    argv.push_back(dir.file("app.kgv"));
    std::vector<std::string> environment{"HOME=" + dir.path(), "QUOR_LANG", "LC_ALL", "LC_MESSAGES", "LC_CTYPE"};
    environment.insert(environment.end(), env.begin(), env.end());
    app = std::make_unique<GuiApp>(server, argv, environment);
    ASSERT_TRUE(app->waitFor([](const GuiState& s) { return s.find("kgOutline") && !s.find("kgOutline")->lines.empty(); },
                             &last))
        << app->errorOutput();
  }
  // The labels of the main window's menu bar, its pulldowns and the popup menu.
  std::vector<const WidgetInfo*> menuEntries() {
    std::vector<const WidgetInfo*> out;
    std::istringstream in(last.raw());
    for (std::string line; std::getline(in, line);) {
      const std::string path = line.substr(0, line.find(' '));
      if (path.rfind("kestrel.kestrel.", 0) != 0) continue;
      if (path.find(".kgTopMenu.") == std::string::npos && path.find("kgOutlinePopup") == std::string::npos) continue;
      if (line.find(" label=\"") == std::string::npos || line.find("class=XmSeparator") != std::string::npos) continue;
      if (const WidgetInfo* w = last.find(path)) out.push_back(w);
    }
    return out;
  }

  void click(const std::string& name) {
    GuiState s;
    ASSERT_TRUE(app->waitViewable(name, &s)) << name;
    const WidgetInfo* w = s.find(name);
    usleep(150 * 1000);  // a menu just mapped takes a moment to accept the pointer
    app->click(w->x + w->width / 2, w->y + w->height / 2);
  }
  // The labels shown in a dialog, by the dialog's name.
  std::vector<const WidgetInfo*> dialogLabels(const std::string& dialog) {
    std::vector<const WidgetInfo*> out;
    std::istringstream in(last.raw());
    for (std::string line; std::getline(in, line);) {
      const std::string path = line.substr(0, line.find(' '));
      if (path.find("." + dialog + "_popup.") == std::string::npos || line.find(" label=\"") == std::string::npos) continue;
      if (const WidgetInfo* w = last.find(path); w && w->flag("viewable")) out.push_back(w);
    }
    return out;
  }

  XvfbServer server;
  TempDir dir;
  std::unique_ptr<GuiApp> app;
  GuiState last;
};

TEST_F(JapaneseViewer, StartsWithJapaneseMenusAndWritesNothingOnStandardError) {
  start({"-language=ja"}, {"LANG=C"});
  EXPECT_EQ(app->errorOutput(), "");
  const WidgetInfo* file = last.find("kgTopMenu.kgFilePulldown");
  ASSERT_NE(file, nullptr);
  EXPECT_EQ(file->field("label"), labelFileText("kgFilePulldown"));
  EXPECT_TRUE(hasNonAscii(file->field("label")));
  // Every entry of the menus is Japanese, but the names of the collection interface's calls.
  const std::vector<const WidgetInfo*> entries = menuEntries();
  EXPECT_GT(entries.size(), 50u);
  static const std::regex sameInEveryLanguage(R"(API|kestrel_\w+\(\)(\.\.\.)?|OK)");
  for (const WidgetInfo* w : entries) {
    const std::string label = w->field("label");
    if (std::regex_match(label, sameInEveryLanguage)) continue;
    EXPECT_TRUE(hasNonAscii(label)) << w->path << " shows \"" << label << "\"";
  }
  // Texts set from the message file reach the window too.
  const WidgetInfo* toolbar = last.find("kgView.kgToolbarToggle");
  ASSERT_NE(toolbar, nullptr);
  EXPECT_TRUE(hasNonAscii(toolbar->field("label"))) << toolbar->field("label");

  EXPECT_EQ(app->stop(), 0);
  EXPECT_EQ(app->errorOutput(), "");
}

TEST_F(JapaneseViewer, TheViewMenusDialogsAreJapanese) {
  start({"-language=ja"}, {});
  for (const char* entry : {"kgColumns", "kgNames"}) {
    const std::string dialog = std::string(entry) == "kgColumns" ? "kgColumnsDialog" : "kgNames";
    click("kgViewPulldown");
    click(std::string("kgView.") + entry);
    ASSERT_TRUE(app->waitFor([&](const GuiState& s) {
      for (const WidgetInfo* w : s.findAll("kgOK"))
        if (w->path.find(dialog + "_popup") != std::string::npos && w->flag("viewable")) return true;
      return false;
    }, &last)) << dialog;
    const std::vector<const WidgetInfo*> labels = dialogLabels(dialog);
    EXPECT_GT(labels.size(), 10u) << dialog;
    for (const WidgetInfo* w : labels) {
      // "Symbol" is the message box's icon, a picture without text.
      if (w->field("label") == "OK" || w->path.ends_with(".Symbol")) continue;
      EXPECT_TRUE(hasNonAscii(w->field("label"))) << w->path << " shows \"" << w->field("label") << "\"";
    }
    for (const WidgetInfo* w : last.findAll("kgOK"))
      if (w->path.find(dialog + "_popup") != std::string::npos) app->click(w->x + w->width / 2, w->y + w->height / 2);
    ASSERT_TRUE(app->waitFor([&](const GuiState& s) { return dialogLabelsIn(s, dialog) == 0; }, &last)) << dialog;
  }
  EXPECT_EQ(app->errorOutput(), "");
}

TEST_F(JapaneseViewer, TheEnvironmentChoosesJapaneseToo) {
  start({}, {"LANG=ja_JP.UTF-8"});
  EXPECT_EQ(app->errorOutput(), "");
  EXPECT_EQ(last.find("kgTopMenu.kgHelpPulldown")->field("label"), labelFileText("kgHelpPulldown"));
}

TEST_F(JapaneseViewer, EnglishReadsNoLanguageFile) {
  start({"-language=en"}, {"LANG=ja_JP.UTF-8"});
  EXPECT_EQ(last.find("kgTopMenu.kgFilePulldown")->field("label"), "File");
  EXPECT_EQ(app->errorOutput(), "");
}

}  // namespace
}  // namespace kgtest
