// The multi-line text: content, attributes, scrolling and drawing into the back buffer.
#include "toolkit/oi_multi_text.h"

#include <X11/IntrinsicP.h>
#include <Xm/DrawingA.h>
#include <Xm/Xm.h>

#include <algorithm>
#include <cstring>

#include "toolkit/oi_scroll_bar.h"
#include "toolkit/oi_text_font.h"
#include "toolkit/oi_xstring.h"

namespace {

struct TextResources {
  String fontName;
  int rows;
  int columns;
  String foreground;
  String background;
  String selectForeground;
  String selectBackground;
  String separatorColor;
  String headingBackground;
  String highlightColor;
  Boolean backingStore;
};

XtPointer resDefault(const char* s) { return const_cast<char*>(s); }
XtPointer resDefault(long v) { return reinterpret_cast<XtPointer>(v); }

#define KG_RES(name, cls, type, field, deftype, def)                                                  \
  {oiStr(name), oiStr(cls), oiStr(type), sizeof(TextResources::field), XtOffsetOf(TextResources, field), \
   oiStr(deftype), resDefault(def)}

XtResource textResources[] = {
    KG_RES("fontName", "FontName", XtRString, fontName, XtRString, "DejaVu Sans Mono:size=10"),
    KG_RES("rows", "Rows", XtRInt, rows, XtRImmediate, 24),
    KG_RES("columns", "Columns", XtRInt, columns, XtRImmediate, 80),
    KG_RES("textForeground", "TextForeground", XtRString, foreground, XtRString, "black"),
    KG_RES("textBackground", "TextBackground", XtRString, background, XtRString, "white"),
    KG_RES("selectForeground", "SelectForeground", XtRString, selectForeground, XtRString, "white"),
    KG_RES("selectBackground", "SelectBackground", XtRString, selectBackground, XtRString, "#3465a4"),
    KG_RES("separatorColor", "SeparatorColor", XtRString, separatorColor, XtRString, "#8c8c8c"),
    KG_RES("headingBackground", "HeadingBackground", XtRString, headingBackground, XtRString, "#dfe5ee"),
    KG_RES("highlightColor", "HighlightColor", XtRString, highlightColor, XtRString, "#c00000"),
    KG_RES("backingStore", "BackingStore", XtRBoolean, backingStore, XtRImmediate, True),
};
#undef KG_RES

}  // namespace

OI_MultiText::OI_MultiText(Widget parent, const std::string& name) {
  registerActions();
  Arg args[6];
  int n = 0;
  XtSetArg(args[n], XmNresizePolicy, XmRESIZE_NONE), ++n;
  XtSetArg(args[n], XmNmarginWidth, 0), ++n;
  XtSetArg(args[n], XmNmarginHeight, 0), ++n;
  XtSetArg(args[n], XmNtraversalOn, True), ++n;
  XtSetArg(args[n], XmNnavigationType, XmTAB_GROUP), ++n;
  Widget w = XmCreateDrawingArea(parent, oiStr(name.c_str()), args, n);
  adopt(w, name);
  readResources();
  XtVaSetValues(w, XmNbackground, bg_, XmNwidth, 1, XmNheight, 1, nullptr);
  int pw, ph;
  preferredSize(pw, ph);
  XtVaSetValues(w, XmNwidth, pw, XmNheight, ph, nullptr);
  XtAddCallback(w, XmNexposeCallback, exposeCB, this);
  XtAddCallback(w, XmNresizeCallback, resizeCB, this);
  XtAddEventHandler(w, StructureNotifyMask, False, visibilityHandler, this);
  overrideTranslations(defaultTranslations());
  XtManageChild(w);
}

OI_MultiText::~OI_MultiText() {
  flushJob_.cancel();
  while (!bars_.empty()) bars_.back()->detach(this, false);
  glyphs_.clear();
  xftDraw_.reset();  // before the buffer it draws into
  buffer_.reset();
  gc_.reset();
  colors_.reset();
  font_.reset();
}

void OI_MultiText::widgetDestroyed() {
  // The server objects belong to the display, which is still open; free them now.
  flushJob_.cancel();
  xftDraw_.reset();
  buffer_.reset();
}

void OI_MultiText::readResources() {
  Widget w = widget();
  TextResources r{};
  XtGetApplicationResources(w, &r, textResources, XtNumber(textResources), nullptr, 0);
  fontName_ = r.fontName ? r.fontName : "";
  rows_ = std::clamp(r.rows, 1, 1000);
  columns_ = std::clamp(r.columns, 1, 5000);
  backingStore_ = r.backingStore;
  Display* d = XtDisplay(w);
  Colormap cm = DefaultColormapOfScreen(XtScreen(w));
  unsigned long black = BlackPixelOfScreen(XtScreen(w)), white = WhitePixelOfScreen(XtScreen(w));
  fg_ = oiNamedPixel(d, cm, r.foreground, black);
  bg_ = oiNamedPixel(d, cm, r.background, white);
  selFg_ = oiNamedPixel(d, cm, r.selectForeground, white);
  selBg_ = oiNamedPixel(d, cm, r.selectBackground, black);
  separator_ = oiNamedPixel(d, cm, r.separatorColor, black);
  headingBg_ = oiNamedPixel(d, cm, r.headingBackground, white);
  highlight_ = oiNamedPixel(d, cm, r.highlightColor, black);
  font_ = std::make_unique<OI_TextFont>(d, XScreenNumberOfScreen(XtScreen(w)), fontName_);
  colors_ = std::make_unique<OI_XftColorCache>(d, DefaultVisualOfScreen(XtScreen(w)), cm);
}

unsigned long OI_MultiText::namedColor(const char* name, bool* ok) const {
  Widget w = widget();
  if (!w) {
    if (ok) *ok = false;
    return fg_;
  }
  return oiNamedPixel(XtDisplay(w), DefaultColormapOfScreen(XtScreen(w)), name, fg_, ok);
}

int OI_MultiText::cellWidth() const { return font_ ? font_->cellWidth() : 8; }
int OI_MultiText::cellHeight() const { return font_ ? font_->cellHeight() : 16; }

void OI_MultiText::setRows(int rows) {
  rows_ = std::clamp(rows, 1, 1000);
}

void OI_MultiText::setColumns(int columns) {
  columns_ = std::clamp(columns, 1, 5000);
}

void OI_MultiText::preferredSize(int& width, int& height) const {
  width = columns_ * cellWidth() + 2 * margin;
  height = rows_ * cellHeight();
}

uint32_t OI_MultiText::visibleLines() const {
  if (!widget()) return 0;
  // Read straight from the widget record: this is asked once per changed line, and a resource
  // lookup per call dominated rebuilding a large outline.
  Dimension h = widget()->core.height;
  return std::max(1, h / cellHeight());
}

uint32_t OI_MultiText::visibleColumns() const {
  if (!widget()) return 0;
  Dimension w = 0;
  XtVaGetValues(widget(), XmNwidth, &w, nullptr);
  return std::max(1, (w - 2 * margin) / cellWidth());
}

OI_TextPos OI_MultiText::posAt(int x, int y) const {
  OI_TextPos p;
  p.line = lineAtY(y);
  int col = (x - margin + cellWidth() / 2) / cellWidth();
  p.col = static_cast<uint32_t>(std::max(0, col)) + left_;
  p.col = std::min(p.col, lineLength(p.line));
  return p;
}

uint32_t OI_MultiText::lineAtY(int y) const {
  int row = y < 0 ? -1 - (-y - 1) / cellHeight() : y / cellHeight();
  int64_t line = static_cast<int64_t>(top_) + row;
  if (line < 0) line = 0;
  uint32_t count = lineCount();
  if (count == 0) return 0;
  return static_cast<uint32_t>(std::min<int64_t>(line, count - 1));
}

void OI_MultiText::cellRect(uint32_t line, uint32_t col, int& x, int& y) const {
  x = margin + (static_cast<int>(col) - static_cast<int>(left_)) * cellWidth();
  y = (static_cast<int>(line) - static_cast<int>(top_)) * cellHeight();
}

// ---------------------------------------------------------------- content

void OI_MultiText::insertLines(uint32_t before, uint32_t count) {
  insertLines(before, std::vector<std::string>(count));
}

void OI_MultiText::insertLines(uint32_t before, const std::vector<std::string>& texts) {
  if (texts.empty()) return;
  before = std::min(before, lineCount());
  uint32_t n = static_cast<uint32_t>(texts.size());
  model_.insertLines(before, texts);
  shiftGlyphs(before, n, before);
  if (before >= top_ && before < top_ + visibleLines() + 1) {
    int row = static_cast<int>(before - top_);
    shiftBuffer(row, row + static_cast<int>(n), static_cast<int>(visibleLines()) + 1 - row - static_cast<int>(n));
    markRows(before, before + n - 1);
  } else if (before < top_) {
    markAll();
  }
  contentChanged();
}

void OI_MultiText::deleteLines(uint32_t first, uint32_t count) {
  if (first >= lineCount() || count == 0) return;
  count = model_.deleteLines(first, count);
  shiftGlyphs(first + count, -static_cast<int64_t>(count), first);
  uint32_t vis = visibleLines() + 1;
  if (first >= top_ && first < top_ + vis) {
    int row = static_cast<int>(first - top_);
    int n = static_cast<int>(std::min<uint32_t>(count, vis - row));
    shiftBuffer(row + n, row, static_cast<int>(vis) - row - n);
    markRows(top_ + vis - n, top_ + vis - 1);
  } else if (first < top_) {
    markAll();
  }
  clampTop();
  contentChanged();
}

void OI_MultiText::setLine(uint32_t line, const std::string& text) {
  if (line >= lineCount()) return;
  model_.setLine(line, text);
  markRows(line, line);
  contentChanged();
}

void OI_MultiText::replaceTail(uint32_t line, uint32_t col, const std::string& text) {
  replaceTail(line, col, std::u32string_view(oiDecodeUtf8(text)));
}

void OI_MultiText::replaceTail(uint32_t line, uint32_t col, std::u32string_view text) {
  if (line >= lineCount()) return;
  model_.replaceTail(line, col, text);
  markRows(line, line);
  contentChanged();
}

void OI_MultiText::overwrite(uint32_t line, uint32_t col, const std::string& text) {
  if (line >= lineCount()) return;
  model_.overwrite(line, col, oiDecodeUtf8(text));
  markRows(line, line);
  contentChanged();
}

void OI_MultiText::clear() {
  model_.clear();
  for (auto& g : glyphs_) g->line_ = OI_Glyph::noLine;
  top_ = left_ = 0;
  markAll();
  contentChanged();
}

void OI_MultiText::setLineSupplier(const OI_LineSupplier* supplier) {
  model_.setSupplier(supplier);
  for (auto& g : glyphs_) g->line_ = OI_Glyph::noLine;
  top_ = left_ = 0;
  markAll();
  contentChanged();
}

void OI_MultiText::linesChanged(uint32_t first, uint32_t last) {
  model_.supplierChanged();
  if (last < first) std::swap(first, last);
  markRows(first, last);
  contentChanged();
}

void OI_MultiText::allLinesChanged() {
  model_.supplierChanged();
  clampTop();
  markAll();
  contentChanged();
}

void OI_MultiText::contentChanged() {
  barsStale_ = true;
  scheduleFlush();
}

uint16_t OI_MultiText::colorIndex(unsigned long pixel) {
  for (size_t i = 1; i < colorTable_.size(); ++i)
    if (colorTable_[i] == pixel) return static_cast<uint16_t>(i);
  if (colorTable_.size() >= 0xFFFF) return 0;
  colorTable_.push_back(pixel);
  return static_cast<uint16_t>(colorTable_.size() - 1);
}

unsigned long OI_MultiText::colorOf(uint16_t index) const {
  return index < colorTable_.size() ? colorTable_[index] : 0;
}

void OI_MultiText::setAttributes(uint32_t line, uint32_t col, uint32_t count, uint8_t flags, unsigned long fg,
                                 unsigned long bg) {
  OI_CharAttr a;
  a.flags = flags;
  if (flags & OI_attrForeground) a.fg = colorIndex(fg);
  if (flags & OI_attrBackground) a.bg = colorIndex(bg);
  model_.setAttributes(line, col, count, a);
  markRows(line, line);
  scheduleFlush();
}

void OI_MultiText::clearAttributes(uint32_t line) {
  if (!model_.hasAttributes(line)) return;
  model_.clearAttributes(line);
  markRows(line, line);
  scheduleFlush();
}

// ---------------------------------------------------------------- selection

void OI_MultiText::setSelection(OI_TextPos start, OI_TextPos end) {
  if (end < start) std::swap(start, end);
  if (model_.hasSelection()) markRows(model_.selectionStart().line, model_.selectionEnd().line);
  model_.setSelection(start, end);
  if (model_.hasSelection()) markRows(start.line, end.line);
  scheduleFlush();
}

void OI_MultiText::selectLines(uint32_t first, uint32_t last) {
  if (last < first) std::swap(first, last);
  setSelection({first, 0}, {last + 1, 0});
}

void OI_MultiText::clearSelection() {
  if (!model_.hasSelection()) return;
  markRows(model_.selectionStart().line, model_.selectionEnd().line);
  model_.clearSelection();
  scheduleFlush();
}

// ---------------------------------------------------------------- scrolling

void OI_MultiText::clampTop() {
  uint32_t vis = visibleLines();
  uint32_t maxTop = lineCount() > vis ? lineCount() - vis : 0;
  if (top_ > maxTop) setTopLine(maxTop);
}

void OI_MultiText::setTopLine(uint32_t line) {
  uint32_t vis = visibleLines();
  uint32_t maxTop = lineCount() > vis ? lineCount() - vis : 0;
  line = std::min(line, maxTop);
  if (line == top_) return;
  int64_t delta = static_cast<int64_t>(line) - top_;
  int rows = static_cast<int>(vis) + 1;
  top_ = line;
  if (delta > 0 && delta < rows) {
    shiftBuffer(static_cast<int>(delta), 0, rows - static_cast<int>(delta));
    markRows(top_ + rows - static_cast<uint32_t>(delta), top_ + rows - 1);
  } else if (delta < 0 && -delta < rows) {
    shiftBuffer(0, static_cast<int>(-delta), rows + static_cast<int>(delta));
    markRows(top_, top_ + static_cast<uint32_t>(-delta) - 1);
  } else {
    markAll();
  }
  copyFrom_ = 0;
  copyTo_ = rows;
  barsStale_ = true;
  scheduleFlush();
  for (OI_ScrollBar* bar : std::vector<OI_ScrollBar*>(bars_))
    if (bar->vertical()) bar->textScrolled(this);
  if (onScroll) oiGuard("scroll", onScroll);
}

void OI_MultiText::setLeftColumn(uint32_t col) {
  uint32_t maxLeft = model_.maxLineLength() > visibleColumns() ? model_.maxLineLength() - visibleColumns() : 0;
  col = std::min(col, maxLeft);
  if (col == left_) return;
  left_ = col;
  markAll();
  barsStale_ = true;
  scheduleFlush();
  for (OI_ScrollBar* bar : std::vector<OI_ScrollBar*>(bars_))
    if (!bar->vertical()) bar->textScrolled(this);
  if (onScroll) oiGuard("scroll", onScroll);
}

void OI_MultiText::showLine(uint32_t line) {
  uint32_t vis = visibleLines();
  if (line < top_) setTopLine(line);
  else if (line >= top_ + vis) setTopLine(line - vis + 1);
}

void OI_MultiText::scrollLines(int delta) {
  int64_t t = static_cast<int64_t>(top_) + delta;
  setTopLine(static_cast<uint32_t>(std::max<int64_t>(0, t)));
}

void OI_MultiText::pageDown() { scrollLines(std::max(1, static_cast<int>(visibleLines()) - 1)); }
void OI_MultiText::pageUp() { scrollLines(-std::max(1, static_cast<int>(visibleLines()) - 1)); }

// ---------------------------------------------------------------- glyphs

OI_Glyph* OI_MultiText::addGlyph(const std::string& name, uint32_t line, uint32_t col, const unsigned char* bits,
                                 int width, int height, const unsigned long* color) {
  if (!widget() || !bits || width <= 0 || height <= 0) return nullptr;
  auto g = std::make_unique<OI_Glyph>();
  g->text_ = this;
  g->name_ = name;
  g->line_ = line;
  g->col_ = col;
  g->width_ = width;
  g->height_ = height;
  // Rows of whole bytes, as XCreateBitmapFromData reads them.
  g->bits_.assign(bits, bits + static_cast<size_t>((width + 7) / 8) * static_cast<size_t>(height));
  g->isBitmap_ = true;
  if (color) {
    g->color_ = *color;
    g->hasColor_ = true;
  }
  OI_Glyph* raw = g.get();
  glyphs_.push_back(std::move(g));
  markRows(line, line);
  scheduleFlush();
  return raw;
}

OI_Glyph* OI_MultiText::addPixmapGlyph(const std::string& name, uint32_t line, uint32_t col, OI_Pixmap image,
                                       OI_Pixmap mask, int width, int height) {
  if (!widget() || !image) return nullptr;
  auto g = std::make_unique<OI_Glyph>();
  g->text_ = this;
  g->name_ = name;
  g->line_ = line;
  g->col_ = col;
  g->width_ = width;
  g->height_ = height;
  g->image_ = std::move(image);
  g->mask_ = std::move(mask);
  g->isBitmap_ = false;
  OI_Glyph* raw = g.get();
  glyphs_.push_back(std::move(g));
  markRows(line, line);
  scheduleFlush();
  return raw;
}

void OI_MultiText::moveGlyph(OI_Glyph* glyph, uint32_t line, uint32_t col) {
  if (!glyph || (glyph->line_ == line && glyph->col_ == col)) return;
  if (glyph->line_ != OI_Glyph::noLine) markRows(glyph->line_, glyph->line_);
  glyph->line_ = line;
  glyph->col_ = col;
  if (line != OI_Glyph::noLine) markRows(line, line);
  scheduleFlush();
}

void OI_MultiText::removeGlyph(OI_Glyph* glyph) {
  auto it = std::find_if(glyphs_.begin(), glyphs_.end(), [glyph](const auto& g) { return g.get() == glyph; });
  if (it == glyphs_.end()) return;
  if (glyph->line_ != OI_Glyph::noLine) markRows(glyph->line_, glyph->line_);
  glyphs_.erase(it);
  scheduleFlush();
}

OI_Glyph* OI_MultiText::glyphAt(int x, int y) const {
  for (const auto& g : glyphs_) {
    if (g->line_ == OI_Glyph::noLine || !isLineVisible(g->line_)) continue;
    int gx, gy;
    cellRect(g->line_, g->col_, gx, gy);
    gy += (cellHeight() - g->height_) / 2;
    if (x >= gx && x < gx + g->width_ && y >= gy && y < gy + g->height_) return g.get();
  }
  return nullptr;
}

void OI_MultiText::shiftGlyphs(uint32_t from, int64_t delta, uint32_t deleteEnd) {
  for (auto& g : glyphs_) {
    if (g->line_ == OI_Glyph::noLine) continue;
    if (delta < 0 && g->line_ >= deleteEnd && g->line_ < from) g->line_ = OI_Glyph::noLine;  // its line went
    else if (g->line_ >= from) g->line_ = static_cast<uint32_t>(g->line_ + delta);
  }
}

// ---------------------------------------------------------------- drawing

void OI_MultiText::holdRedisplay() { ++hold_; }

void OI_MultiText::releaseRedisplay() {
  if (hold_ == 0) return;
  if (--hold_ == 0) scheduleFlush();
}

void OI_MultiText::redisplay() { flush(); }

void OI_MultiText::markRows(uint32_t firstLine, uint32_t lastLine) {
  if (lastLine < top_) return;
  uint32_t rows = visibleLines() + 1;
  if (firstLine >= top_ + rows) return;
  int from = firstLine > top_ ? static_cast<int>(firstLine - top_) : 0;
  int to = static_cast<int>(std::min<uint32_t>(lastLine - top_, rows - 1));
  if (dirty_.size() < rows) dirty_.resize(rows, 1);
  for (int r = from; r <= to; ++r) dirty_[static_cast<size_t>(r)] = 1;
}

void OI_MultiText::markAll() { allDirty_ = true; }

void OI_MultiText::scheduleFlush() {
  if (hold_ > 0 || flushJob_.pending()) return;
  OI_Application* app = OI_Application::instance();
  if (!app) return;
  flushJob_ = app->addWorkProc([this] {
    flush();
    return true;
  });
}

void OI_MultiText::ensureBuffer() {
  Widget w = widget();
  Dimension width = 0, height = 0;
  XtVaGetValues(w, XmNwidth, &width, XmNheight, &height, nullptr);
  int rows = static_cast<int>(visibleLines()) + 1;
  int bw = std::max<int>(1, width), bh = std::max(rows * cellHeight(), static_cast<int>(height));
  if (buffer_ && bw == bufW_ && bh == bufH_) return;
  Display* d = XtDisplay(w);
  xftDraw_.reset();
  buffer_ = OI_Pixmap(d, XCreatePixmap(d, XtWindow(w), static_cast<unsigned>(bw), static_cast<unsigned>(bh),
                                       DefaultDepthOfScreen(XtScreen(w))));
  bufW_ = bw;
  bufH_ = bh;
  if (!gc_) gc_ = OI_GC(d, buffer_.get());
  if (font_ && font_->isXft())
    xftDraw_ = OI_XftDraw(d, buffer_.get(), DefaultVisualOfScreen(XtScreen(w)),
                          DefaultColormapOfScreen(XtScreen(w)));
  allDirty_ = true;
}

void OI_MultiText::shiftBuffer(int fromRow, int toRow, int count) {
  // While held, many changes may come: one full drawing at the release is cheaper than moving
  // the picture for each of them.
  if (hold_ > 0) {
    allDirty_ = true;
    return;
  }
  if (!buffer_ || allDirty_ || count <= 0 || fromRow == toRow) {
    if (count > 0 && fromRow != toRow) allDirty_ = true;
    return;
  }
  int ch = cellHeight();
  XCopyArea(XtDisplay(widget()), buffer_.get(), buffer_.get(), gc_.get(), 0, fromRow * ch,
            static_cast<unsigned>(bufW_), static_cast<unsigned>(count * ch), 0, toRow * ch);
  // Dirty marks travel with the rows they belong to.
  size_t rows = dirty_.size();
  std::vector<char> moved(dirty_);
  for (int i = 0; i < count; ++i) {
    size_t src = static_cast<size_t>(fromRow + i), dst = static_cast<size_t>(toRow + i);
    if (src < rows && dst < rows) moved[dst] = dirty_[src];
  }
  dirty_ = std::move(moved);
  int lo = std::min(fromRow, toRow), hi = std::max(fromRow, toRow) + count;
  copyFrom_ = copyFrom_ < 0 ? lo : std::min(copyFrom_, lo);
  copyTo_ = std::max(copyTo_, hi);
}

void OI_MultiText::flush() {
  flushJob_.cancel();
  Widget w = widget();
  if (!w || hold_ > 0) return;
  if (barsStale_) updateBars();
  if (!XtIsRealized(w)) return;
  ensureBuffer();
  int rows = static_cast<int>(visibleLines()) + 1;
  if (dirty_.size() != static_cast<size_t>(rows)) dirty_.resize(static_cast<size_t>(rows), 1);
  int from = copyFrom_, to = copyTo_;
  for (int r = 0; r < rows; ++r) {
    if (!allDirty_ && !dirty_[static_cast<size_t>(r)]) continue;
    drawRow(r);
    dirty_[static_cast<size_t>(r)] = 0;
    from = from < 0 ? r : std::min(from, r);
    to = std::max(to, r + 1);
  }
  if (allDirty_) {
    // Below the last row: plain background.
    XSetForeground(XtDisplay(w), gc_.get(), bg_);
    XFillRectangle(XtDisplay(w), buffer_.get(), gc_.get(), 0, rows * cellHeight(), static_cast<unsigned>(bufW_),
                   static_cast<unsigned>(std::max(0, bufH_ - rows * cellHeight())));
    from = 0;
    to = rows;
  }
  allDirty_ = false;
  copyFrom_ = copyTo_ = -1;
  if (from >= 0 && to > from) {
    int ch = cellHeight();
    int h = (to == rows) ? bufH_ - from * ch : (to - from) * ch;
    XCopyArea(XtDisplay(w), buffer_.get(), XtWindow(w), gc_.get(), 0, from * ch, static_cast<unsigned>(bufW_),
              static_cast<unsigned>(h), 0, from * ch);
  }
}

void OI_MultiText::drawRow(int row) {
  Display* d = XtDisplay(widget());
  GC gc = gc_.get();
  int ch = cellHeight(), cw = cellWidth();
  int y = row * ch;
  uint32_t line = top_ + static_cast<uint32_t>(row);
  XSetForeground(d, gc, bg_);
  XFillRectangle(d, buffer_.get(), gc, 0, y, static_cast<unsigned>(bufW_), static_cast<unsigned>(ch));
  if (line >= lineCount()) return;
  const std::u32string& text = model_.lineChars(line);
  std::vector<OI_CharAttr>& attrs = rowAttrs_;
  model_.lineAttrs(line, attrs);
  OI_TextPos ss = model_.selectionStart(), se = model_.selectionEnd();
  bool anySel = model_.hasSelection() && ss.line <= line && line <= se.line;
  // A selection that runs past the end of this line is shown to the window's edge.
  if (anySel && se.line > line) {
    uint32_t from = ss.line == line ? ss.col : 0;
    uint32_t startCol = std::max(from, static_cast<uint32_t>(text.size()));
    int x = from == 0 ? 0 : std::max(0, margin + (static_cast<int>(startCol) - static_cast<int>(left_)) * cw);
    XSetForeground(d, gc, selBg_);
    XFillRectangle(d, buffer_.get(), gc, x, y, static_cast<unsigned>(std::max(0, bufW_ - x)),
                   static_cast<unsigned>(ch));
  }
  uint32_t visCols = static_cast<uint32_t>(bufW_ / cw) + 2;
  uint32_t end = std::min<uint32_t>(static_cast<uint32_t>(text.size()), left_ + visCols);
  for (uint32_t col = left_; col < end;) {
    OI_CharAttr a = col < attrs.size() ? attrs[col] : OI_CharAttr{};
    bool sel = anySel && model_.isSelected(line, col);
    uint32_t runEnd = col + 1;
    while (runEnd < end && (runEnd < attrs.size() ? attrs[runEnd] : OI_CharAttr{}) == a &&
           (anySel && model_.isSelected(line, runEnd)) == sel)
      ++runEnd;
    int x = margin + static_cast<int>(col - left_) * cw;
    unsigned width = static_cast<unsigned>(runEnd - col) * static_cast<unsigned>(cw);
    unsigned long fg = (a.flags & OI_attrForeground) ? colorOf(a.fg) : fg_;
    unsigned long back = bg_;
    bool fill = false;
    if (a.flags & OI_attrBackground) back = colorOf(a.bg), fill = true;
    else if (a.flags & OI_attrHeading) back = headingBg_, fill = true;
    if (sel) back = selBg_, fg = selFg_, fill = true;
    if (fill) {
      XSetForeground(d, gc, back);
      XFillRectangle(d, buffer_.get(), gc, x, y, width, static_cast<unsigned>(ch));
    }
    XSetForeground(d, gc, fg);
    font_->drawCells(xftDraw_.get(), colors_->get(fg), buffer_.get(), gc, x, y + font_->ascent(),
                     text.data() + col, runEnd - col);
    if (a.flags & OI_attrHeading) {
      XSetForeground(d, gc, fg);
      XDrawLine(d, buffer_.get(), gc, x, y + ch - 1, x + static_cast<int>(width) - 1, y + ch - 1);
    }
    if (a.flags & OI_attrSeparator) {
      XSetForeground(d, gc, sel ? selFg_ : separator_);
      for (uint32_t c = col; c < runEnd; ++c) {
        int sx = margin + static_cast<int>(c - left_) * cw + cw / 2;
        XDrawLine(d, buffer_.get(), gc, sx, y, sx, y + ch - 1);
      }
    }
    col = runEnd;
  }
  drawGlyphs(row);
}

void OI_MultiText::drawGlyphs(int row) {
  uint32_t line = top_ + static_cast<uint32_t>(row);
  Display* d = XtDisplay(widget());
  GC gc = gc_.get();
  for (const auto& g : glyphs_) {
    if (g->line_ != line) continue;
    int x, y;
    cellRect(line, g->col_, x, y);
    y += (cellHeight() - g->height_) / 2;
    if (g->isBitmap_) {
      if (!g->image_) {
        Pixmap p = XCreateBitmapFromData(d, RootWindowOfScreen(XtScreen(widget())),
                                         reinterpret_cast<const char*>(g->bits_.data()),
                                         static_cast<unsigned>(g->width_), static_cast<unsigned>(g->height_));
        if (p == None) continue;
        g->image_ = OI_Pixmap(d, p);
        std::vector<unsigned char>().swap(g->bits_);
      }
      XSetForeground(d, gc, g->hasColor_ ? g->color_ : fg_);
      XSetClipMask(d, gc, g->image_.get());
      XSetClipOrigin(d, gc, x, y);
      XFillRectangle(d, buffer_.get(), gc, x, y, static_cast<unsigned>(g->width_), static_cast<unsigned>(g->height_));
    } else {
      if (g->mask_) {
        XSetClipMask(d, gc, g->mask_.get());
        XSetClipOrigin(d, gc, x, y);
      }
      XCopyArea(d, g->image_.get(), buffer_.get(), gc, 0, 0, static_cast<unsigned>(g->width_),
                static_cast<unsigned>(g->height_), x, y);
    }
    XSetClipMask(d, gc, None);
  }
}

void OI_MultiText::exposeCB(Widget w, XtPointer client, XtPointer call) {
  auto* self = static_cast<OI_MultiText*>(client);
  auto* cb = static_cast<XmDrawingAreaCallbackStruct*>(call);
  oiGuard("expose", [&] {
    // Pending changes first, so that the copy below shows the text as it is now.
    self->flush();
    if (self->hold_ > 0 || !self->buffer_ || !cb || !cb->event || cb->event->type != Expose) return;
    XExposeEvent& e = cb->event->xexpose;
    XCopyArea(XtDisplay(w), self->buffer_.get(), XtWindow(w), self->gc_.get(), e.x, e.y,
              static_cast<unsigned>(e.width), static_cast<unsigned>(e.height), e.x, e.y);
  });
}

void OI_MultiText::resizeCB(Widget, XtPointer client, XtPointer) {
  auto* self = static_cast<OI_MultiText*>(client);
  oiGuard("resize", [self] {
    self->allDirty_ = true;
    self->barsStale_ = true;
    self->clampTop();
    self->scheduleFlush();
  });
}

void OI_MultiText::visibilityHandler(Widget w, XtPointer client, XEvent* ev, Boolean*) {
  auto* self = static_cast<OI_MultiText*>(client);
  if (ev->type != MapNotify) return;
  oiGuard("map", [self, w] {
    XSetWindowAttributes a;
    a.backing_store = self->backingStore_ ? WhenMapped : NotUseful;
    a.bit_gravity = ForgetGravity;
    XChangeWindowAttributes(XtDisplay(w), XtWindow(w), CWBackingStore | CWBitGravity, &a);
    self->scheduleFlush();
  });
}

void OI_MultiText::updateBars() {
  barsStale_ = false;
  for (OI_ScrollBar* bar : bars_) bar->update();
}
