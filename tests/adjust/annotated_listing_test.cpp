// The annotated-source listing a user writes from the source window: count column, bar,
// tab, text; display forms turned back; a cancelled file dialog writes nothing.
#include <gtest/gtest.h>

#include <deque>

#include "adjust/annotated_listing.h"
#include "tests/common/test_support.h"

namespace {

class AnswerPrompter : public SourcePrompter {
 public:
  std::deque<std::string> names;  // "" cancels
  bool askFileName(const std::string&, std::string& name) override {
    if (names.empty() || names.front().empty()) return false;
    name = names.front();
    names.pop_front();
    return true;
  }
  bool askContinue(const std::string&) override { return true; }
  void showError(const std::string&, ErrorCode) override {}
};

}  // namespace

TEST(AnnotatedListing, EachLineCarriesItsCountRightAlignedBeforeTheText) {
  EXPECT_EQ(annotatedListingLine("", "int x;"), "     |\tint x;");
  EXPECT_EQ(annotatedListingLine("10K+", "f();"), "10K+ |\tf();");
  EXPECT_EQ(annotatedListingLine("7", "100% of %s"), "   7 |\t100% of %s");
}

TEST(AnnotatedListing, AListingOfAReadSourceIsWrittenWhereTheUserSays) {
  kgtest::TempDir dir;
  std::string source = dir.file("a.c");
  kgtest::writeFile(source, "int main() {\n\n  return 0;\n}\n");
  AnswerPrompter prompter;
  SrcFile src;
  ASSERT_EQ(src.openForReading(source, "New name:", 0, prompter), allOK);
  std::vector<AnnotatedLine> lines;
  std::string text;
  const char* counts[] = {"1", "", "DEAD", ""};
  for (int i = 0; src.readLine(text); ++i) lines.push_back({counts[i], text});
  src.closeReading();
  ASSERT_EQ(lines.size(), 4u);

  prompter.names = {""};  // the user cancels the dialog
  EXPECT_EQ(writeAnnotatedListing(src, lines, "Write annotated source to file:", "", prompter),
            noFileName);
  EXPECT_FALSE(kgtest::fileExists(dir.file("a.c.ann")));

  prompter.names = {dir.file("a.c.ann")};
  ASSERT_EQ(writeAnnotatedListing(src, lines, "Write annotated source to file:", "", prompter),
            allOK);
  EXPECT_EQ(kgtest::readFile(dir.file("a.c.ann")),
            "   1 |\tint main() {\n     |\t \nDEAD |\t  return 0;\n     |\t}\n");
  EXPECT_EQ(kgtest::readFile(source), "int main() {\n\n  return 0;\n}\n");  // untouched
}
