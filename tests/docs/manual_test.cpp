// The manual as the build makes it and the installation holds it, and the man pages: the Help
// menus' topics lead to headings, links inside the manual lead somewhere, and the pages name
// every option the programs take.
#include <gtest/gtest.h>

#include <cctype>
#include <regex>
#include <set>
#include <sstream>

#include "startup/viewer_options.h"
#include "summary/help_page.h"
#include "support/runtime_options.h"
#include "tests/common/test_support.h"

namespace kgtest {
namespace {

std::string builtManual() { return readFile(kgHelpPagePath(buildDir())); }

// Every id="..." of the page.
std::set<std::string> idsOf(const std::string& html) {
  std::set<std::string> ids;
  static const std::regex id(R"re( id="([^"]+)")re");
  for (std::sregex_iterator it(html.begin(), html.end(), id), end; it != end; ++it) ids.insert((*it)[1]);
  return ids;
}

// Option names as the viewer matches them: case, "-" and "_" do not count.
std::string optionKey(std::string name) {
  std::string out;
  for (char c : name)
    if (c != '-' && c != '_') out += static_cast<char>(tolower(static_cast<unsigned char>(c)));
  return out;
}

// The options a text names: "-name" words, with roff's "\-" read as "-" and its font
// changes ("\fB", "\fP", ...) left out.
std::set<std::string> optionsNamedIn(std::string text) {
  text = std::regex_replace(text, std::regex(R"(\\f[BIRP])"), "");
  for (size_t p = text.find("\\-"); p != std::string::npos; p = text.find("\\-", p)) text.replace(p, 2, "-");
  std::set<std::string> names;
  static const std::regex option(R"((^|[^A-Za-z0-9])(--?[A-Za-z][A-Za-z_-]*))");
  for (std::sregex_iterator it(text.begin(), text.end(), option), end; it != end; ++it) {
    const std::string word = (*it)[2];
    names.insert(word);                                    // as written, "--output"
    names.insert("=" + optionKey(word.substr(word.find_first_not_of('-'))));  // as matched
  }
  return names;
}

// The viewer's own options (the runtime library's and the marker the table ends with left out).
std::vector<std::string> viewerOptionNames() {
  const std::vector<ViewerOption> table = makeViewerOptionTable();
  std::vector<std::string> names;
  for (size_t i = 0; i + kRuntimeOptionCount + 1 < table.size(); ++i) names.push_back(table[i].name);
  return names;
}

TEST(Manual, EveryHelpTopicLeadsToAHeadingOfTheBuiltPage) {
  const std::string html = builtManual();
  for (const auto* topics : {&kgMainWindowHelpTopics(), &kgSourceWindowHelpTopics()}) {
    for (const KG_HelpTopic& t : *topics) {
      if (*t.anchor == '\0') continue;
      const std::regex heading("<h([23]) id=\"" + std::string(t.anchor) + "\">");
      EXPECT_TRUE(std::regex_search(html, heading)) << t.name << " opens #" << t.anchor << ", which is no chapter";
    }
  }
  // And every place that context help opens for a part of a window.
  const std::set<std::string> ids = idsOf(html);
  for (const auto* topics : {&kgMainWindowContextTopics(), &kgSourceWindowContextTopics()})
    for (const KG_ContextTopic& t : *topics) EXPECT_EQ(ids.count(t.anchor), 1u) << t.widget << " opens #" << t.anchor;
  for (const char* fallback : {"the-main-window", "the-annotated-source-window"}) EXPECT_EQ(ids.count(fallback), 1u);
}

TEST(Manual, LinksInsideThePageAndItsImagesLeadSomewhere) {
  const std::string html = builtManual();
  const std::set<std::string> ids = idsOf(html);
  static const std::regex link(R"re(href="#([^"]*)")re");
  int links = 0;
  for (std::sregex_iterator it(html.begin(), html.end(), link), end; it != end; ++it, ++links)
    EXPECT_TRUE(ids.count((*it)[1])) << "a link to #" << (*it)[1] << " leads nowhere";
  EXPECT_GT(links, 20);
  static const std::regex image(R"re(<img src="([^"]+)")re");
  int images = 0;
  for (std::sregex_iterator it(html.begin(), html.end(), image), end; it != end; ++it, ++images)
    EXPECT_TRUE(fileExists(buildDir() + "/help/" + (*it)[1].str())) << (*it)[1] << " is not beside the page";
  EXPECT_GT(images, 0);
}

TEST(Manual, NamesEveryOptionOfTheViewerAndOfTheImporter) {
  const std::set<std::string> inManual = optionsNamedIn(readFile(sourceDir() + "/docs/manual.md"));
  const std::set<std::string> inPage = optionsNamedIn(readFile(sourceDir() + "/docs/man/kestrel.1"));
  std::vector<std::string> names = viewerOptionNames();
  ASSERT_FALSE(names.empty());
  names.push_back("language");  // read from the runtime options' table, but the user's choice
  for (const std::string& name : names) {
    // The kestrel command passes these itself; nobody types them.
    if (name == "kestrel" || name == "kestrelhome") continue;
    EXPECT_TRUE(inManual.count("=" + optionKey(name))) << "the manual does not name -" << name;
    EXPECT_TRUE(inPage.count("=" + optionKey(name))) << "kestrel.1 does not name -" << name;
  }

  // The importer's options as its usage text lists them.
  const ProcessResult usage = runProcess({buildDir() + "/bin/kestrel-import", "--help"});
  ASSERT_EQ(usage.status, 0) << usage.err;
  const std::set<std::string> importPage = optionsNamedIn(readFile(sourceDir() + "/docs/man/kestrel-import.1"));
  static const std::regex listed(R"(^\s+(-\w)?,?\s*(--[a-z-]+))");
  int options = 0;
  std::string line;
  std::istringstream in(usage.out);
  while (std::getline(in, line)) {
    std::smatch m;
    if (!std::regex_search(line, m, listed)) continue;
    for (int g : {1, 2}) {
      if (!m[g].matched) continue;
      ++options;
      EXPECT_TRUE(importPage.count(m[g])) << "kestrel-import.1 does not name " << m[g];
      EXPECT_TRUE(inManual.count(m[g])) << "the manual does not name " << m[g];
    }
  }
  EXPECT_GE(options, 5) << usage.out;
}

TEST(Manual, TheManPagesAreCleanRoff) {
  if (!fileExists("/usr/bin/groff")) GTEST_SKIP() << "groff is not installed (the Makefile installs groff-base)";
  for (const char* page : {"kestrel.1", "kestrel-import.1"}) {
    const std::string path = sourceDir() + "/docs/man/" + page;
    const ProcessResult r = runProcess({"/usr/bin/groff", "-man", "-Tutf8", "-ww", "-z", path});
    EXPECT_EQ(r.status, 0) << page;
    EXPECT_EQ(r.err, "") << page;
  }
}

TEST(Manual, InstallingPutsThePageItsImagesAndTheManPagesInPlace) {
  TempDir prefix;
  const ProcessResult r = runProcess({KG_CMAKE, "--install", buildDir(), "--prefix", prefix.path()});
  ASSERT_EQ(r.status, 0) << r.out << r.err;
  const std::string help = prefix.path() + "/share/kestrelgauge/help/";
  EXPECT_EQ(readFile(help + "manual.html"), builtManual());
  for (const char* image : {"viewer-demo.png", "viewer-source.png"})
    EXPECT_EQ(readFile(help + image), readFile(sourceDir() + "/docs/" + image)) << image;
  for (const char* page : {"kestrel.1", "kestrel-import.1"})
    EXPECT_EQ(readFile(prefix.path() + "/share/man/man1/" + page), readFile(sourceDir() + "/docs/man/" + page)) << page;
  // The installed command finds the page where the Help menus look for it.
  const ProcessResult version =
      runProcess({prefix.path() + "/bin/kestrel", "-export", "-version"}, {"HOME=" + prefix.path()});
  EXPECT_NE(version.err.find("Installed in:         " + prefix.path() + "/share/kestrelgauge"), std::string::npos)
      << version.err;
  EXPECT_TRUE(fileExists(kgHelpPagePath(prefix.path() + "/share/kestrelgauge")));
}

}  // namespace
}  // namespace kgtest
