// The layout holds: includes point down the floors, and the engine library reaches no window
// code. The check itself is tried on small trees that break each rule.
#include <gtest/gtest.h>

#include <filesystem>
#include <fstream>
#include <sstream>

#include "tests/common/test_support.h"
#include "tests/layout/layout_rules.h"

namespace {

std::vector<std::string> engineSources() {
  // Written by CMake at configure time: the engine library's sources, absolute paths.
  std::ifstream in(std::string(KG_BUILD_DIR) + "/layout/kgengine_sources.txt");
  std::vector<std::string> out;
  const std::string root = std::string(KG_SOURCE_DIR) + "/";
  std::string line;
  while (std::getline(in, line)) {
    if (line.rfind(root, 0) == 0) out.push_back(line.substr(root.size()));
  }
  return out;
}

std::string joined(const std::vector<std::string>& lines) {
  std::ostringstream text;
  for (const std::string& l : lines) text << l << "\n";
  return text.str();
}

void write(kgtest::TempDir& dir, const std::string& relative, const std::string& text) {
  std::filesystem::create_directories(dir.file(relative.substr(0, relative.rfind('/'))));
  kgtest::writeFile(dir.file(relative), text);
}

}  // namespace

TEST(Layout, TheTreeKeepsItsFloorsAndTheEngineReachesNoWindowCode) {
  const std::vector<std::string> sources = engineSources();
  // The list is real: it names the engine's own sources across its floors.
  ASSERT_GT(sources.size(), 50u);
  bool sawSupport = false, sawCoverage = false, sawStartup = false;
  for (const std::string& s : sources) {
    sawSupport = sawSupport || s.rfind("support/", 0) == 0;
    sawCoverage = sawCoverage || s.rfind("coverage/", 0) == 0;
    sawStartup = sawStartup || s.rfind("startup/", 0) == 0;
  }
  EXPECT_TRUE(sawSupport && sawCoverage && sawStartup);
  EXPECT_EQ(joined(kglayout::layoutViolations(KG_SOURCE_DIR, sources)), "");
}

TEST(Layout, AnEngineFileReachingMotifOrTheToolkitIsCaught) {
  kgtest::TempDir dir;
  write(dir, "support/errors.h", "#pragma once\n");
  write(dir, "toolkit/oi_application.h", "#include <X11/Intrinsic.h>\n");
  write(dir, "coverage/clean.cpp", "#include \"support/errors.h\"\n#include <vector>\n");
  // Directly, and through a header of a floor the engine may use.
  write(dir, "coverage/motif.cpp", "#include <Xm/Xm.h>\n#include \"toolkit/oi_application.h\"\n");
  write(dir, "settings/db.h", "#include <X11/Xresource.h>\n#include <X11/Xft/Xft.h>\n");
  write(dir, "adjust/uses_db.cpp", "#include \"settings/db.h\"\n");
  // Xrm outside settings/ and the outline's object half.
  write(dir, "adjust/xrm.cpp", "#include <X11/Xresource.h>\n");
  write(dir, "outline/qr_object.h", "#include <X11/Xresource.h>\n");
  const std::vector<std::string> v = kglayout::layoutViolations(
      dir.path(), {"coverage/clean.cpp", "coverage/motif.cpp", "adjust/uses_db.cpp", "adjust/xrm.cpp",
                   "outline/qr_object.h"});
  const std::string text = joined(v);
  EXPECT_NE(text.find("engine source coverage/motif.cpp reaches <Xm/Xm.h>"), std::string::npos) << text;
  EXPECT_NE(text.find("engine source coverage/motif.cpp reaches the window code: coverage/motif.cpp -> "
                      "toolkit/oi_application.h"),
            std::string::npos)
      << text;
  EXPECT_NE(text.find("engine source adjust/uses_db.cpp reaches <X11/Xft/Xft.h>: adjust/uses_db.cpp -> "
                      "settings/db.h"),
            std::string::npos)
      << text;
  EXPECT_NE(text.find("engine source adjust/xrm.cpp reaches <X11/Xresource.h>"), std::string::npos) << text;
  EXPECT_EQ(text.find("clean.cpp"), std::string::npos) << text;
  EXPECT_EQ(text.find("qr_object.h reaches"), std::string::npos) << text;
  EXPECT_EQ(text.find("uses_db.cpp reaches <X11/Xresource.h>"), std::string::npos) << text;
  // coverage/ including toolkit/ is also an include that points up.
  EXPECT_NE(text.find("coverage/motif.cpp (coverage/) includes toolkit/oi_application.h (toolkit/)"),
            std::string::npos)
      << text;
}

TEST(Layout, IncludesThatPointUpOrLeaveTheFloorsAreCaught) {
  kgtest::TempDir dir;
  write(dir, "support/errors.h", "#include \"coverage/kgv_data.h\"\n");
  write(dir, "coverage/kgv_data.h", "#include \"support/errors.h\"\n#include \"coverage/line_state.h\"\n");
  write(dir, "coverage/line_state.h", "#pragma once\n");
  write(dir, "summary/rows.cpp", "#include \"startup/startup.h\"\n#include \"outline/qr_oi_text.h\"\n");
  write(dir, "startup/startup.h", "#include \"summary/rows.h\"\n");
  write(dir, "outline/qr_object.h", "#include \"outline/qr_oi_text.h\"\n");
  write(dir, "outline/qr_oi_text.h", "#include \"outline/qr_object.h\"\n");
  write(dir, "adjust/local.cpp", "#include \"local.h\"\n");
  write(dir, "gadgets/thing.cpp", "#include \"support/errors.h\"\n");
  write(dir, "tests/anything_test.cpp", "#include \"startup/startup.h\"\n#include <Xm/Xm.h>\n");
  // One violation a line, each line starting with the file at fault.
  const std::string text = "\n" + joined(kglayout::layoutViolations(dir.path(), {}));
  EXPECT_NE(text.find("support/errors.h (support/) includes coverage/kgv_data.h (coverage/)"), std::string::npos)
      << text;
  EXPECT_NE(text.find("summary/rows.cpp (summary/) includes startup/startup.h (startup/)"), std::string::npos)
      << text;
  EXPECT_NE(text.find("outline/qr_object.h (outline/ object half) includes outline/qr_oi_text.h (outline/ "
                      "display half)"),
            std::string::npos)
      << text;
  EXPECT_NE(text.find("adjust/local.cpp includes \"local.h\" without its folder"), std::string::npos) << text;
  EXPECT_NE(text.find("folder gadgets/ has no floor"), std::string::npos) << text;
  // Downward and sideways includes, and the tests, are fine.
  EXPECT_EQ(text.find("\ncoverage/"), std::string::npos) << text;
  EXPECT_EQ(text.find("\nstartup/"), std::string::npos) << text;
  EXPECT_EQ(text.find("\noutline/qr_oi_text.h"), std::string::npos) << text;
  EXPECT_EQ(text.find("anything_test"), std::string::npos) << text;
}
