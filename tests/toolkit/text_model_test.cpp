// The text model and the toolkit's plain helpers, without a display.
#include <gtest/gtest.h>

#include "toolkit/oi_dialogs.h"
#include "toolkit/oi_menu.h"
#include "toolkit/oi_text_model.h"

namespace {

TEST(TextModel, SourceTextInAnyEncodingKeepsEveryByteVisible) {
  // UTF-8 stays as it is; a stray Latin-1 byte (an EUC or ISO-8859 file) becomes its own character.
  std::u32string u = oiDecodeUtf8("caf\xc3\xa9 \xe6\x97\xa5");
  EXPECT_EQ(u, U"caf\u00e9 \u65e5");
  std::u32string bad = oiDecodeUtf8("a\xe9z\xc0\xaf\xed\xa0\x80");
  ASSERT_EQ(bad.size(), 8u);  // a, é, z, then the overlong pair and the surrogate byte by byte
  EXPECT_EQ(bad[1], U'\u00e9');
  EXPECT_EQ(bad[3], U'\u00c0');
  EXPECT_EQ(oiEncodeUtf8(oiDecodeUtf8("caf\xc3\xa9")), "caf\xc3\xa9");
  // A sequence cut off at the end of the text.
  EXPECT_EQ(oiDecodeUtf8("ok\xe6\x97").size(), 4u);
}

TEST(TextModel, RowsChangeOnlyAfterTheirCommonBeginning) {
  OI_TextModel m;
  m.insertLines(0, {"Total Coverage   12   50%", "dir/  3"});
  m.setAttributes(0, 0, 5, OI_CharAttr{OI_attrHeading, 0, 0});
  m.replaceTail(0, 17, U"13   52%");
  EXPECT_EQ(m.lineText(0), "Total Coverage   13   52%");
  // The untouched beginning keeps its attributes; the new tail has plain ones.
  EXPECT_EQ(m.attrAt(0, 2).flags, OI_attrHeading);
  EXPECT_EQ(m.attrAt(0, 20).flags, 0);
  // A shorter new line drops what remains of the old one.
  m.replaceTail(1, 4, U"");
  EXPECT_EQ(m.lineText(1), "dir/");
  m.overwrite(1, 6, U"=>");
  EXPECT_EQ(m.lineText(1), "dir/  =>");
  // Places past the end are ignored rather than growing the text.
  m.setLine(7, "nowhere");
  m.replaceTail(9, 0, U"x");
  EXPECT_EQ(m.lineCount(), 2u);
}

TEST(TextModel, HighlightsLaidOverEachOtherShowWhatWasSetLast) {
  // A row with column separators, a coloured name laid across two of them, then part of it cleared.
  OI_TextModel m;
  m.insertLines(0, {"name      12  50%  7"});
  const OI_CharAttr sep{OI_attrSeparator, 0, 0}, red{OI_attrForeground, 3, 0};
  for (uint32_t c : {4u, 9u, 13u, 18u}) m.setAttributes(0, c, 1, sep);
  m.setAttributes(0, 2, 10, red);  // covers the separators at 4 and 9
  EXPECT_EQ(m.attrAt(0, 1), OI_CharAttr{});
  EXPECT_EQ(m.attrAt(0, 4), red);
  EXPECT_EQ(m.attrAt(0, 11), red);
  EXPECT_EQ(m.attrAt(0, 12), OI_CharAttr{});
  EXPECT_EQ(m.attrAt(0, 13), sep);
  m.setAttributes(0, 5, 2, OI_CharAttr{});  // a plain hole in the middle of the red stretch
  EXPECT_EQ(m.attrAt(0, 4), red);
  EXPECT_EQ(m.attrAt(0, 5), OI_CharAttr{});
  EXPECT_EQ(m.attrAt(0, 6), OI_CharAttr{});
  EXPECT_EQ(m.attrAt(0, 7), red);
  std::vector<OI_CharAttr> each;
  m.lineAttrs(0, each);
  ASSERT_EQ(each.size(), m.lineLength(0));
  EXPECT_EQ(each[3], red);
  EXPECT_EQ(each[6], OI_CharAttr{});
  EXPECT_EQ(each[18], sep);
  // A new tail is plain; the beginning keeps its highlights.
  m.replaceTail(0, 10, U"1");
  EXPECT_EQ(m.attrAt(0, 9), red);
  EXPECT_EQ(m.attrAt(0, 10), OI_CharAttr{});
  m.replaceTail(0, 11, U"2  50%  7");
  EXPECT_EQ(m.attrAt(0, 13), OI_CharAttr{});
  EXPECT_TRUE(m.hasAttributes(0));
  m.setAttributes(0, 0, 99, OI_CharAttr{});
  EXPECT_FALSE(m.hasAttributes(0));
  m.lineAttrs(0, each);
  EXPECT_TRUE(each.empty());
}

TEST(TextModel, LongestLineFollowsInsertionsAndDeletions) {
  OI_TextModel m;
  m.insertLines(0, {"short", "a much longer line", "mid length"});
  EXPECT_EQ(m.maxLineLength(), 18u);
  m.deleteLines(1, 1);
  EXPECT_EQ(m.maxLineLength(), 10u);
  m.setLine(0, "x");
  EXPECT_EQ(m.maxLineLength(), 10u);
  m.deleteLines(0, 99);
  EXPECT_EQ(m.maxLineLength(), 0u);
  EXPECT_EQ(m.lineCount(), 0u);
}

TEST(TextModel, SelectionStaysOnItsTextWhileLinesComeAndGo) {
  OI_TextModel m;
  m.insertLines(0, {"zero", "one", "two", "three", "four"});
  m.setSelection({3, 0}, {1, 1});  // given backwards
  EXPECT_EQ(m.selectionStart(), (OI_TextPos{1, 1}));
  EXPECT_EQ(m.selectedText(), "ne\ntwo\n");
  m.insertLines(0, {"new"});
  EXPECT_EQ(m.selectedText(), "ne\ntwo\n");
  m.deleteLines(0, 2);  // "new" and "zero"; the selection's first line survives
  EXPECT_EQ(m.selectionStart(), (OI_TextPos{0, 1}));
  EXPECT_TRUE(m.isSelected(1, 0));
  EXPECT_FALSE(m.isSelected(2, 0));
  m.clearSelection();
  EXPECT_EQ(m.selectedText(), "");
}

TEST(TextModel, DoubleClickWordsStopAtPunctuation) {
  OI_TextModel m;
  m.insertLines(0, {"call foo_bar(x);"});
  OI_TextPos s, e;
  m.wordAround({0, 7}, s, e);
  EXPECT_EQ(s.col, 5u);
  EXPECT_EQ(e.col, 12u);
  m.wordAround({0, 12}, s, e);  // "(" alone
  EXPECT_EQ(e.col - s.col, 1u);
}

// A quarter of a million numbered lines, made only when asked for; every seventh is marked.
class NumberedLines : public OI_LineSupplier {
 public:
  mutable int made = 0;
  uint32_t lineCount() const override { return 250000; }
  void supplyLine(uint32_t line, std::u32string& chars) const override {
    ++made;
    for (char c : "line " + std::to_string(line)) chars.push_back(static_cast<unsigned char>(c));
  }
  void supplyAttrs(uint32_t line, std::vector<OI_CharAttr>& attrs) const override {
    attrs.clear();
    if (line % 7 == 0) attrs.assign(4, OI_CharAttr{OI_attrBackground, 0, 3});
  }
  uint32_t maxLineLength() const override { return 11; }
};

TEST(TextModel, SuppliedLinesAreMadeWhenAskedForAndNeverStored) {
  NumberedLines lines;
  OI_TextModel m;
  m.insertLines(0, {"stored"});
  m.setSupplier(&lines);
  EXPECT_EQ(m.lineCount(), 250000u);
  EXPECT_EQ(lines.made, 0);
  EXPECT_EQ(m.lineText(123456), "line 123456");
  EXPECT_EQ(m.lineLength(123456), 11u);  // the same line again comes from the cache
  EXPECT_EQ(lines.made, 1);
  EXPECT_EQ(m.lineText(250000), "");      // past the end
  EXPECT_EQ(m.attrAt(14, 2).bg, 3u);
  EXPECT_FALSE(m.hasAttributes(15));
  EXPECT_EQ(m.maxLineLength(), 11u);
  // Selections and words work on supplied text; stored-line changes are ignored, not applied.
  m.setSelection({9, 5}, {10, 4});
  EXPECT_EQ(m.selectedText(), "9\nline");
  OI_TextPos a, b;
  m.wordAround({20, 1}, a, b);
  EXPECT_EQ(b.col - a.col, 4u);
  m.insertLines(5, {"x"});
  EXPECT_EQ(m.deleteLines(0, 10), 0u);
  m.setLine(3, "y");
  EXPECT_EQ(m.lineCount(), 250000u);
  EXPECT_EQ(m.lineText(3), "line 3");
  // A change the supplier reports is seen at the next look.
  m.lineText(123456);
  const int before = lines.made;
  m.lineText(123456);
  EXPECT_EQ(lines.made, before);
  m.supplierChanged();
  m.lineText(123456);
  EXPECT_EQ(lines.made, before + 1);
  m.setSupplier(nullptr);
  EXPECT_EQ(m.lineCount(), 0u);
}

TEST(ToolkitText, AcceleratorResourcesBecomeKeysAndLabels) {
  std::string accel, text;
  ASSERT_TRUE(oiParseAccelerator("Ctrl<Key>O: fire()", accel, text));
  EXPECT_EQ(accel, "Ctrl<Key>O");
  EXPECT_EQ(text, "Ctrl+O");
  ASSERT_TRUE(oiParseAccelerator("  Mod1<Key>t:fire()", accel, text));
  EXPECT_EQ(text, "Alt+t");
  EXPECT_FALSE(oiParseAccelerator("fire()", accel, text));
  EXPECT_FALSE(oiParseAccelerator("Ctrl<Key>: fire()", accel, text));
}

TEST(ToolkitText, ErrorTextsWrapAtSixtyColumns) {
  std::string msg =
      "The coverage data file could not be read because its header names a version this viewer does not know";
  std::string wrapped = oiWrapText(msg, 60);
  size_t start = 0;
  while (start < wrapped.size()) {
    size_t nl = wrapped.find('\n', start);
    size_t len = (nl == std::string::npos ? wrapped.size() : nl) - start;
    EXPECT_LE(len, 60u);
    if (nl == std::string::npos) break;
    start = nl + 1;
  }
  std::string rejoined = wrapped;
  for (char& c : rejoined)
    if (c == '\n') c = ' ';
  EXPECT_EQ(rejoined, msg);
  // Existing line breaks stay; a word longer than the width stands on its own line.
  EXPECT_EQ(oiWrapText("a\nb", 60), "a\nb");
  EXPECT_EQ(oiWrapText("x " + std::string(70, 'y') + " z", 60), "x\n" + std::string(70, 'y') + "\nz");
}

}  // namespace
