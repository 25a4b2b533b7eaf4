// Lines of text with per-character attributes and a selection; plain data, no X here.
#pragma once

#include <compare>
#include <cstdint>
#include <string>
#include <string_view>
#include <vector>

// A place in the text: a line and a character column (characters, not bytes).
struct OI_TextPos {
  uint32_t line = 0;
  uint32_t col = 0;
  auto operator<=>(const OI_TextPos&) const = default;
};

// Attribute flags of one character.
enum : uint8_t {
  OI_attrForeground = 1,  // fg is set
  OI_attrBackground = 2,  // bg is set
  OI_attrSeparator = 4,   // a thin vertical line through the cell
  OI_attrHeading = 8,     // a group title of a heading line
};

// fg and bg are indices into the colour table of the widget that draws the text.
struct OI_CharAttr {
  uint8_t flags = 0;
  uint16_t fg = 0;
  uint16_t bg = 0;
  bool operator==(const OI_CharAttr&) const = default;
};

// UTF-8 in and out; a byte that is not valid UTF-8 is read as the Latin-1 character of that value,
// so that no text is ever dropped.
std::u32string oiDecodeUtf8(const std::string& text);
// The same decoding, appended to a buffer the caller reuses.
void oiDecodeUtf8Append(std::string_view text, std::u32string& out);
std::string oiEncodeUtf8(const std::u32string& text);

// Lines that their owner makes when they are drawn or asked for, instead of the model keeping
// them: a text of a quarter of a million lines then costs what is on screen. Attribute colours
// are indices into the colour table of the text that draws them (OI_MultiText::colorIndexFor).
class OI_LineSupplier {
 public:
  virtual ~OI_LineSupplier() = default;
  virtual uint32_t lineCount() const = 0;
  virtual void supplyLine(uint32_t line, std::u32string& chars) const = 0;
  // One attribute per character, or nothing when the line is plain.
  virtual void supplyAttrs(uint32_t /*line*/, std::vector<OI_CharAttr>& attrs) const { attrs.clear(); }
  // The longest line's length in characters (at least that of every line).
  virtual uint32_t maxLineLength() const = 0;
};

class OI_TextModel {
 public:
  // Lines from the supplier from now on; the stored lines are dropped and changes to lines
  // are ignored while a supplier is set. Null goes back to stored lines (none).
  void setSupplier(const OI_LineSupplier* supplier);
  const OI_LineSupplier* supplier() const { return supplier_; }
  // The supplier's lines changed: nothing it supplied earlier is kept.
  void supplierChanged() { cachedLine_ = kNoCache; }

  uint32_t lineCount() const {
    return supplier_ ? supplier_->lineCount() : static_cast<uint32_t>(lines_.size());
  }
  std::string lineText(uint32_t line) const;  // empty past the end
  const std::u32string& lineChars(uint32_t line) const;
  uint32_t lineLength(uint32_t line) const;
  // The longest line's length in characters.
  uint32_t maxLineLength() const;

  // Lines are inserted before `before`; a place past the end appends.
  void insertLines(uint32_t before, const std::vector<std::string>& texts);
  // Deletes up to `count` lines from `first`; returns how many went.
  uint32_t deleteLines(uint32_t first, uint32_t count);
  // Replaces the whole line (attributes cleared); a line past the end is ignored.
  void setLine(uint32_t line, const std::string& text);
  // Keeps the first `col` characters with their attributes and puts `text` after them.
  void replaceTail(uint32_t line, uint32_t col, std::u32string_view text);
  // Writes `text` over the characters from `col` (the line grows when needed).
  void overwrite(uint32_t line, uint32_t col, const std::u32string& text);
  void clear();

  OI_CharAttr attrAt(uint32_t line, uint32_t col) const;
  // Sets the attributes of `count` characters from `col`, limited to the line's length.
  void setAttributes(uint32_t line, uint32_t col, uint32_t count, OI_CharAttr attr);
  void clearAttributes(uint32_t line);
  bool hasAttributes(uint32_t line) const;  // false when all characters are plain
  // One attribute per character of the line, or nothing when all are plain.
  void lineAttrs(uint32_t line, std::vector<OI_CharAttr>& out) const;

  // Selection from `start` up to, not including, `end`; empty when they are equal.
  void setSelection(OI_TextPos start, OI_TextPos end);
  void clearSelection() { selStart_ = selEnd_ = {}; }
  bool hasSelection() const { return selStart_ < selEnd_; }
  OI_TextPos selectionStart() const { return selStart_; }
  OI_TextPos selectionEnd() const { return selEnd_; }
  bool isSelected(uint32_t line, uint32_t col) const;
  // The selected characters, lines joined by newlines.
  std::string selectedText() const;

  // The range of characters between two places that make up a word (letters, digits, '_').
  void wordAround(OI_TextPos pos, OI_TextPos& start, OI_TextPos& end) const;

 private:
  // A stretch of characters that are not plain. A line keeps only these, in column order and not
  // overlapping: a large outline has tens of thousands of lines with a few marks each.
  struct AttrRun {
    uint32_t col = 0;
    uint32_t count = 0;
    OI_CharAttr attr;
  };
  struct Line {
    std::u32string text;
    std::vector<AttrRun> attrs;
  };
  static void cutAttrs(Line& l, uint32_t from, uint32_t to);  // plain again over [from, to)
  void noteLength(uint32_t len);
  void lengthMayShrink(uint32_t len);
  void adjustSelectionForInsert(uint32_t before, uint32_t count);
  void adjustSelectionForDelete(uint32_t first, uint32_t count);

  static constexpr uint32_t kNoCache = UINT32_MAX;
  const OI_LineSupplier* supplier_ = nullptr;
  mutable uint32_t cachedLine_ = kNoCache;  // the supplied line in cache_
  mutable std::u32string cache_;

  std::vector<Line> lines_;
  mutable uint32_t maxLen_ = 0;
  mutable bool maxLenStale_ = false;
  OI_TextPos selStart_, selEnd_;
};
