// A read-only multi-line text drawn with Xft into a back buffer: per-character attributes,
// selection, scrolling, glyphs placed in the text, and a hold counter for update brackets.
#pragma once

#include <X11/Intrinsic.h>
#include <X11/Xft/Xft.h>

#include <functional>
#include <memory>
#include <string>
#include <vector>

#include "toolkit/oi_application.h"
#include "toolkit/oi_text_model.h"
#include "toolkit/oi_widget.h"
#include "toolkit/oi_x_resources.h"

class OI_ScrollBar;
class OI_TextFont;
class OI_MultiText;

// A small picture placed at a text position; it scrolls with the text and takes button presses.
class OI_Glyph {
 public:
  static constexpr uint32_t noLine = 0xFFFFFFFF;
  const std::string& name() const { return name_; }
  uint32_t line() const { return line_; }
  uint32_t column() const { return col_; }
  int width() const { return width_; }
  int height() const { return height_; }
  OI_MultiText& text() const { return *text_; }
  // Called with the press event (button 1, 2, 3 ...) when the user presses on the glyph.
  std::function<void(OI_Glyph&, XEvent*)> onPress;
  void* userData = nullptr;

 private:
  friend class OI_MultiText;
  OI_MultiText* text_ = nullptr;
  std::string name_;
  uint32_t line_ = noLine;
  uint32_t col_ = 0;
  int width_ = 0;
  int height_ = 0;
  OI_Pixmap image_;   // depth 1 (drawn in the text colour) or the window's depth
  // A bitmap glyph becomes an X pixmap only when first drawn: an outline may hold thousands of
  // glyphs, and few of them are ever on screen.
  std::vector<unsigned char> bits_;
  OI_Pixmap mask_;    // optional, depth 1
  bool isBitmap_ = true;
  unsigned long color_ = 0;
  bool hasColor_ = false;
};

class OI_MultiText : public OI_Widget {
 public:
  OI_MultiText(Widget parent, const std::string& name);
  ~OI_MultiText() override;

  // ---- Content
  uint32_t lineCount() const { return model_.lineCount(); }
  std::string lineText(uint32_t line) const { return model_.lineText(line); }
  uint32_t lineLength(uint32_t line) const { return model_.lineLength(line); }
  const OI_TextModel& model() const { return model_; }
  void insertLines(uint32_t before, uint32_t count);  // empty lines
  void insertLines(uint32_t before, const std::vector<std::string>& texts);
  void insertLine(uint32_t before, const std::string& text) { insertLines(before, std::vector{text}); }
  void appendLine(const std::string& text) { insertLine(lineCount(), text); }
  void deleteLines(uint32_t first, uint32_t count);
  void setLine(uint32_t line, const std::string& text);
  void replaceTail(uint32_t line, uint32_t col, const std::string& text);
  // The same with characters already decoded, for callers that compose lines themselves.
  void replaceTail(uint32_t line, uint32_t col, std::u32string_view text);
  void overwrite(uint32_t line, uint32_t col, const std::string& text);
  void clear();
  // Lines from a supplier instead of stored ones (see OI_LineSupplier); null: none again. The
  // supplier outlives its use here and says when its lines change.
  void setLineSupplier(const OI_LineSupplier* supplier);
  // The supplier's lines first..last (inclusive) look different now.
  void linesChanged(uint32_t first, uint32_t last);
  // The supplier now has another number of lines (or lines changed everywhere).
  void allLinesChanged();

  // ---- Attributes. Colours are X pixels; flags are the OI_attr* bits.
  void setAttributes(uint32_t line, uint32_t col, uint32_t count, uint8_t flags, unsigned long fg = 0,
                     unsigned long bg = 0);
  void clearAttributes(uint32_t line);
  OI_CharAttr attrAt(uint32_t line, uint32_t col) const { return model_.attrAt(line, col); }
  unsigned long colorOf(uint16_t index) const;
  // The index of a pixel in the colour table, for attributes a line supplier makes.
  uint16_t colorIndexFor(unsigned long pixel) { return colorIndex(pixel); }
  // A colour name converted to a pixel; false in `ok` when it does not convert.
  unsigned long namedColor(const char* name, bool* ok = nullptr) const;
  unsigned long foreground() const { return fg_; }
  unsigned long background() const { return bg_; }
  unsigned long highlightColor() const { return highlight_; }

  // ---- Selection
  void setSelection(OI_TextPos start, OI_TextPos end);
  // Whole lines first..last (inclusive).
  void selectLines(uint32_t first, uint32_t last);
  void clearSelection();
  bool hasSelection() const { return model_.hasSelection(); }
  OI_TextPos selectionStart() const { return model_.selectionStart(); }
  OI_TextPos selectionEnd() const { return model_.selectionEnd(); }
  std::string selectedText() const { return model_.selectedText(); }
  // What the last copy put on the clipboard.
  const std::string& clipboardText() const { return clipboard_; }

  // ---- Scrolling and geometry
  uint32_t topLine() const { return top_; }
  void setTopLine(uint32_t line);
  uint32_t leftColumn() const { return left_; }
  void setLeftColumn(uint32_t col);
  uint32_t visibleLines() const;    // whole lines that fit
  uint32_t visibleColumns() const;  // whole columns that fit
  bool isLineVisible(uint32_t line) const { return line >= top_ && line < top_ + visibleLines(); }
  // Scrolls as little as needed to bring the line into the window.
  void showLine(uint32_t line);
  void scrollLines(int delta);
  void pageDown();
  void pageUp();
  int cellWidth() const;
  int cellHeight() const;
  int rows() const { return rows_; }        // the "rows" resource: the preferred height in lines
  int columns() const { return columns_; }  // the "columns" resource
  void setRows(int rows);
  void setColumns(int columns);
  void preferredSize(int& width, int& height) const;
  // Text place under a point of the window (clamped to the text).
  OI_TextPos posAt(int x, int y) const;
  uint32_t lineAtY(int y) const;

  // ---- Redisplay
  // Holds back drawing while the count is above 0; releasing to 0 draws what changed, once.
  void holdRedisplay();
  void releaseRedisplay();
  int holdCount() const { return hold_; }
  // Draws pending changes now (when not held).
  void redisplay();

  // ---- Glyphs (owned by the text)
  // From X bitmap bits (as written by the bitmap program), drawn in `color` or the text colour.
  OI_Glyph* addGlyph(const std::string& name, uint32_t line, uint32_t col, const unsigned char* bits, int width,
                     int height, const unsigned long* color = nullptr);
  // From a pixmap of the window's depth (taken over), with an optional depth-1 mask (taken over).
  OI_Glyph* addPixmapGlyph(const std::string& name, uint32_t line, uint32_t col, OI_Pixmap image,
                           OI_Pixmap mask, int width, int height);
  void moveGlyph(OI_Glyph* glyph, uint32_t line, uint32_t col);
  void removeGlyph(OI_Glyph* glyph);
  OI_Glyph* glyphAt(int x, int y) const;
  const std::vector<std::unique_ptr<OI_Glyph>>& glyphs() const { return glyphs_; }

  // ---- Scroll bars (kept by OI_ScrollBar)
  const std::vector<OI_ScrollBar*>& scrollBars() const { return bars_; }

  // ---- Hooks
  // Button 3 outside a glyph (the window's popup menu).
  std::function<void(XEvent*)> onPopup;
  // Button 1 outside a glyph, before any selection starts; true when the press was used up.
  std::function<bool(XEvent*)> onPress;
  // The top line or left column changed.
  std::function<void()> onScroll;
  // More state for the test hook's dump from whoever draws into the text (one line, no newline).
  std::function<void(std::ostream&)> describeMore;

  void describe(std::ostream& out) const override;

  // Window-relative pixel rectangle of a cell, for tests and glyph placement.
  void cellRect(uint32_t line, uint32_t col, int& x, int& y) const;
  static constexpr int margin = 2;

  // Text actions other code (the outline display) builds on.
  // Whether Shift+button 1 extends the selection (an outline turns it off).
  void setExtendSelection(bool on) { extendSelection_ = on; }
  bool extendSelection() const { return extendSelection_; }
  // Counts a press as the next of a multi-click when it comes within the multi-click time.
  int countClick(XEvent* ev);
  void startSelection(XEvent* ev, int clicks);
  void adjustSelection(XEvent* ev);
  void endSelection(XEvent* ev);
  bool dispatchGlyphPress(XEvent* ev);
  void copyToClipboard(Time t);
  void ownPrimary(Time t);
  static void registerActions();
  static OI_MultiText* fromActionWidget(Widget w);
  static const char* defaultTranslations();

 protected:
  void widgetDestroyed() override;
  OI_TextModel model_;

 private:
  friend class OI_ScrollBar;
  static void exposeCB(Widget, XtPointer, XtPointer);
  static void resizeCB(Widget, XtPointer, XtPointer);
  static void visibilityHandler(Widget, XtPointer, XEvent*, Boolean*);
  void readResources();
  void ensureResources();
  void ensureBuffer();
  uint16_t colorIndex(unsigned long pixel);
  void markRows(uint32_t firstLine, uint32_t lastLine);  // inclusive, clipped to the view
  void markAll();
  void scheduleFlush();
  void flush();
  void drawRow(int row);
  void drawGlyphs(int row);
  void shiftBuffer(int fromRow, int toRow, int count);
  void clampTop();
  void contentChanged();
  void updateBars();
  void shiftGlyphs(uint32_t from, int64_t delta, uint32_t deleteEnd);

  // Resources.
  std::string fontName_;
  int rows_ = 24;
  int columns_ = 80;
  unsigned long fg_ = 0, bg_ = 0, selFg_ = 0, selBg_ = 0, separator_ = 0, headingBg_ = 0, highlight_ = 0;
  bool backingStore_ = true;

  std::unique_ptr<OI_TextFont> font_;
  std::unique_ptr<OI_XftColorCache> colors_;
  std::vector<unsigned long> colorTable_{0};
  OI_Pixmap buffer_;
  int bufW_ = 0, bufH_ = 0;
  OI_XftDraw xftDraw_;  // draws into buffer_; declared after it, so it goes first
  OI_GC gc_;

  uint32_t top_ = 0;
  uint32_t left_ = 0;
  int hold_ = 0;
  std::vector<char> dirty_;  // per visible row: needs drawing into the buffer
  std::vector<OI_CharAttr> rowAttrs_;  // drawRow's working copy of a line's attributes
  bool allDirty_ = true;
  int copyFrom_ = -1, copyTo_ = -1;  // rows to copy from the buffer to the window
  OI_TimerHandle flushJob_;
  bool barsStale_ = true;

  std::vector<std::unique_ptr<OI_Glyph>> glyphs_;
  std::vector<OI_ScrollBar*> bars_;

  // Mouse selection state.
  OI_TextPos anchor_;
  int clickMode_ = 1;  // 1 characters, 2 words, 3 lines
  Time lastPress_ = 0;
  bool extendSelection_ = true;
  int clicks_ = 0;
  std::string clipboard_;
  std::string primary_;
};
