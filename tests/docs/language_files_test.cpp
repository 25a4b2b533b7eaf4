// The Japanese message and label files as the build installs them: read without a warning,
// a Japanese text for every text of the resource table and of the error table with the same
// places for what the program fills in, and a font that is installed and draws every
// character they hold.
#include <fontconfig/fontconfig.h>
#include <gtest/gtest.h>

#include <X11/Xresource.h>

#include <cstring>
#include <fstream>
#include <map>
#include <regex>
#include <set>
#include <typeinfo>

#include "settings/kg_resource.h"
#include "settings/resource_database.h"
#include "settings/resource_table.h"
#include "settings/settings_startup.h"
#include "summary/help_page.h"
#include "support/errors.h"
#include "tests/common/test_support.h"

namespace kgtest {
namespace {

const char* const kFiles[] = {"Kestrelgauge.msg", "Kestrelgauge.msg2", "Kestrelgauge.label"};

std::string installedFile(const std::string& name) { return appDefaultsDir(buildDir()) + "/" + name; }

bool hasNonAscii(const std::string& s) {
  for (unsigned char c : s)
    if (c >= 0x80) return true;
  return false;
}

// "%s", "%u", ... in order: what the program fills in.
std::string placeholders(const std::string& s) {
  std::string out;
  for (size_t i = 0; i + 1 < s.size(); ++i)
    if (s[i] == '%') out += s.substr(i, 2), ++i;
  return out;
}

// The texts of the table's plain string resources, by name, as the language gives them.
std::map<std::string, std::string> tableTexts(int language, std::vector<std::string>& warnings) {
  ResourceSettingsInput in;
  in.installDir = buildDir();
  in.language = language;
  in.userDefaultsFile = "/nonexistent/kestrel.Xdefaults";
  warnings = loadResourceSettings(in);
  std::map<std::string, std::string> texts;
  for (KG_Resource* r : registeredResources())
    if (typeid(*r) == typeid(KG_StrResource)) texts[r->name()] = static_cast<KG_StrResource*>(r)->value;
  return texts;
}

// Texts that are no words: commands the user names, the mark keys, and the words of the
// summary's cells (measured in bytes there, so a Japanese word would break the columns).
const std::set<std::string> kSameInEveryLanguage = {
    "crmsCommandString", "crmsQueryCommandString", "xdefaultsUpdateCommandString", "helpBrowserCommand",
    "adjustmentEditPaneTitle", "deadcodeFunctionText", "unusedFunctionText", "usedFunctionText"};

class LanguageFiles : public ::testing::Test {
 protected:
  void TearDown() override {
    std::vector<std::string> ignored;
    tableTexts(0, ignored);
  }
};

TEST_F(LanguageFiles, AreInstalledAndReadWithoutAWarning) {
  for (const char* f : kFiles) EXPECT_TRUE(fileExists(installedFile(f))) << f;
  std::vector<std::string> warnings;
  tableTexts(1, warnings);
  EXPECT_TRUE(warnings.empty()) << warnings.front();
}

TEST_F(LanguageFiles, GiveEveryTextOfTheResourceTableInJapaneseWithItsPlaceholders) {
  std::vector<std::string> warnings;
  const std::map<std::string, std::string> english = tableTexts(0, warnings);
  const std::map<std::string, std::string> japanese = tableTexts(1, warnings);
  ASSERT_EQ(english.size(), japanese.size());
  int texts = 0;
  for (const auto& [name, text] : english) {
    const std::string& ja = japanese.at(name);
    EXPECT_EQ(placeholders(ja), placeholders(text)) << name << ": " << ja;
    if (kSameInEveryLanguage.count(name)) {
      EXPECT_EQ(ja, text) << name;
      continue;
    }
    ++texts;
    EXPECT_NE(ja, text) << name << " is not translated";
    EXPECT_TRUE(hasNonAscii(ja)) << name << ": " << ja;
  }
  EXPECT_GT(texts, 30);
  // Blanks at either end are kept as the English text has them.
  EXPECT_EQ(japanese.at("coverageActualPrompt").back(), ' ');
  EXPECT_EQ(japanese.at("lineNumberPaneTitle").front(), ' ');
}

TEST_F(LanguageFiles, GiveEveryMessageOfTheErrorTableInJapanese) {
  std::vector<std::string> warnings;
  tableTexts(1, warnings);
  std::set<std::string> identifiers;
  for (ErrorCode code = 0; code < 256; ++code) {
    const char* id = errorIdentifier(code);
    if (!id) continue;
    identifiers.insert(id);
    std::string text;
    ASSERT_TRUE(lookupNamedText(id, text)) << id << " has no Japanese text";
    EXPECT_TRUE(hasNonAscii(text)) << id;
    clearPendingSystemError();
    EXPECT_EQ(errorMessageWithName(code), text) << id;
  }
  EXPECT_GT(identifiers.size(), 40u);
  // Nothing in the file that the table does not know (a misspelt identifier does nothing).
  std::ifstream in(installedFile("Kestrelgauge.msg2"));
  static const std::regex entry(R"(^\*(\w+):)");
  std::string line;
  std::smatch m;
  while (std::getline(in, line)) {
    if (std::regex_search(line, m, entry)) {
      EXPECT_TRUE(identifiers.count(m[1])) << m[1] << " is no error identifier";
    }
  }
}

TEST_F(LanguageFiles, TellHelpFailuresInJapaneseNamingTheCommandAndThePage) {
  std::vector<std::string> warnings;
  tableTexts(1, warnings);
  for (int status : {127 << 8, 3 << 8, 9, -1}) {
    const std::string text = kgHelpFailureText("my-browser --new", "/inst/help/manual.html", status, ENOENT);
    EXPECT_TRUE(hasNonAscii(text)) << text;
    EXPECT_NE(text.find("my-browser --new"), std::string::npos) << text;
    EXPECT_NE(text.find("/inst/help/manual.html"), std::string::npos) << text;
    EXPECT_EQ(text.find("%s"), std::string::npos) << text;
  }
  EXPECT_NE(kgHelpFailureText("b", "p", 3 << 8).find(" 3 "), std::string::npos);
  EXPECT_NE(kgHelpFailureText("b", "p", -1, ENOENT).find(strerror(ENOENT)), std::string::npos);
  const std::string missing = kgHelpPageMissingText("/inst/help/manual.html");
  EXPECT_TRUE(hasNonAscii(missing));
  EXPECT_NE(missing.find("/inst/help/manual.html"), std::string::npos);
}

// Every character above ASCII in the values of the three files.
std::set<FcChar32> japaneseCharacters() {
  std::set<FcChar32> chars;
  for (const char* f : kFiles) {
    const std::string text = readFile(installedFile(f));
    size_t i = 0;
    while (i < text.size()) {
      FcChar32 c = 0;
      const int n = FcUtf8ToUcs4(reinterpret_cast<const FcChar8*>(text.data() + i), &c, static_cast<int>(text.size() - i));
      EXPECT_GT(n, 0) << f << " is not UTF-8 at byte " << i;
      if (n <= 0) break;
      if (c >= 0x80) chars.insert(c);
      i += static_cast<size_t>(n);
    }
  }
  return chars;
}

TEST_F(LanguageFiles, NameAnInstalledFontThatDrawsEveryCharacterTheyHold) {
  XrmInitialize();
  XrmDatabase db = XrmGetFileDatabase(installedFile("Kestrelgauge.label").c_str());
  ASSERT_NE(db, nullptr);
  char* type = nullptr;
  XrmValue v{};
  // The rendition the toolkit's render table names, and its font.
  ASSERT_TRUE(XrmGetResource(db, "kestrel.kgFilePulldown.renderTable", "Kestrelgauge.XmCascadeButton.RenderTable",
                             &type, &v));
  const std::string rendition = v.addr;
  ASSERT_TRUE(XrmGetResource(db, ("kestrel.kgFilePulldown." + rendition + ".fontType").c_str(),
                             "Kestrelgauge.XmCascadeButton.Rendition.FontType", &type, &v));
  EXPECT_STREQ(v.addr, "FONT_IS_XFT");
  ASSERT_TRUE(XrmGetResource(db, ("kestrel.kgFilePulldown." + rendition + ".fontName").c_str(),
                             "Kestrelgauge.XmCascadeButton.Rendition.FontName", &type, &v));
  const std::string family = v.addr;
  XrmDestroyDatabase(db);

  ASSERT_TRUE(FcInit());
  FcPattern* pattern = FcPatternCreate();
  FcPatternAddString(pattern, FC_FAMILY, reinterpret_cast<const FcChar8*>(family.c_str()));
  FcConfigSubstitute(nullptr, pattern, FcMatchPattern);
  FcDefaultSubstitute(pattern);
  FcResult result = FcResultNoMatch;
  FcPattern* match = FcFontMatch(nullptr, pattern, &result);
  FcPatternDestroy(pattern);
  ASSERT_NE(match, nullptr);
  FcChar8* found = nullptr;
  FcCharSet* charset = nullptr;
  ASSERT_EQ(FcPatternGetString(match, FC_FAMILY, 0, &found), FcResultMatch);
  // The toolkit asks for the family alone: a missing one falls back to a font without Japanese.
  EXPECT_EQ(std::string(reinterpret_cast<char*>(found)), family) << "the font " << family << " is not installed";
  ASSERT_EQ(FcPatternGetCharSet(match, FC_CHARSET, 0, &charset), FcResultMatch);
  const std::set<FcChar32> chars = japaneseCharacters();
  EXPECT_GT(chars.size(), 100u);
  for (FcChar32 c : chars) EXPECT_TRUE(FcCharSetHasChar(charset, c)) << family << " has no glyph for U+" << std::hex << c;
  FcPatternDestroy(match);
  FcFini();  // fontconfig's tables, so that a leak check sees only ours
}

}  // namespace
}  // namespace kgtest
