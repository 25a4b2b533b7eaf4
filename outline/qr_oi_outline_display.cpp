// The outline drawn on a multi-line text: lines, column marks, enhancements, glyphs, scrolling,
// the update bracket and the row selection shown as text selection.
#include "outline/qr_oi_outline_display.h"

#include <Xm/Xm.h>

#include <algorithm>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <sstream>

#include "outline/qr_oi_multi_text.h"
#include "outline/qr_outline_annotation.h"
#include "outline/qr_outline_object.h"
#include "outline/qr_outline_root.h"
#include "toolkit/oi_menu.h"
#include "toolkit/oi_scroll_text.h"
#include "toolkit/oi_xstring.h"

namespace {

std::map<OI_MultiText*, QR_OI_OutlineDisplay*>& displays() {
  static std::map<OI_MultiText*, QR_OI_OutlineDisplay*> d;
  return d;
}

struct OutlineResources {
  short tabStops;
  Boolean dynamicScrollbars;
  String enhanceStrings;
  Boolean fileCaching;
  Boolean autoSelect;
};

XtResource outlineResources[] = {
    {oiStr("tabStops"), oiStr("TabStops"), oiStr(XtRShort), sizeof(short), XtOffsetOf(OutlineResources, tabStops),
     oiStr(XtRImmediate), reinterpret_cast<XtPointer>(8)},
    {oiStr("dynamicScrollbars"), oiStr("DynamicScrollbars"), oiStr(XtRBoolean), sizeof(Boolean),
     XtOffsetOf(OutlineResources, dynamicScrollbars), oiStr(XtRImmediate), reinterpret_cast<XtPointer>(True)},
    {oiStr("enhanceStrings"), oiStr("EnhanceStrings"), oiStr(XtRString), sizeof(String),
     XtOffsetOf(OutlineResources, enhanceStrings), oiStr(XtRImmediate), nullptr},
    {oiStr("fileCaching"), oiStr("FileCaching"), oiStr(XtRBoolean), sizeof(Boolean),
     XtOffsetOf(OutlineResources, fileCaching), oiStr(XtRImmediate), reinterpret_cast<XtPointer>(False)},
    {oiStr("autoSelect"), oiStr("AutoSelect"), oiStr(XtRBoolean), sizeof(Boolean),
     XtOffsetOf(OutlineResources, autoSelect), oiStr(XtRImmediate), reinterpret_cast<XtPointer>(False)},
};

// A quoted string list: "one" "two words" (unquoted words stand alone too).
std::vector<std::string> parseQuotedList(const char* s) {
  std::vector<std::string> out;
  if (!s) return out;
  std::string cur;
  bool inQuote = false, any = false;
  for (const char* p = s; *p; ++p) {
    if (inQuote) {
      if (*p == '\\' && p[1]) cur += *++p;
      else if (*p == '"') inQuote = false;
      else cur += *p;
    } else if (*p == '"') {
      inQuote = true;
      any = true;
    } else if (*p == ' ' || *p == '\t' || *p == ',' || *p == '\n') {
      if (any || !cur.empty()) out.push_back(cur);
      cur.clear();
      any = false;
    } else {
      cur += *p;
    }
  }
  if (any || !cur.empty()) out.push_back(cur);
  return out;
}

// The glyph popups' cells and labels, unless the resources say otherwise.
const char* const defaultGlyphResources[] = {
    "*QR_OutlineExpand.cells:QR_OutlineExpand,QR_OutlineMakeVisible:QR_OutlineExpandAll",
    "*QR_OutlineCollapse.cells:\tQR_OutlineCollapse:QR_OutlineCollapseAll",
    "*QR_OutlineExpand,QR_OutlineMakeVisible.label:\t\tExpand",
    "*QR_OutlineExpandAll.label:\tExpand all",
    "*QR_OutlineCollapse.label:\t\tCollapse",
    "*QR_OutlineCollapseAll.label:\tCollapse all",
};

}  // namespace

QR_OI_OutlineDisplay* QR_OI_OutlineDisplay::forWidget(Widget w) {
  OI_MultiText* t = OI_MultiText::fromActionWidget(w);
  auto it = displays().find(t);
  return it == displays().end() ? nullptr : it->second;
}

QR_OI_OutlineDisplay::QR_OI_OutlineDisplay(OI_Widget* on) {
  scroll_ = dynamic_cast<OI_ScrollText*>(on);
  OI_Widget* t = scroll_ ? static_cast<OI_Widget*>(scroll_->text()) : on;
  text_ = dynamic_cast<QR_OI_MultiText*>(t);
  if (!text_) {
    fputs("** QR_OI_Init was not called, or an OI_multi_text\n", stderr);
    fputs("** object was created rather than a QR_OI_MultiText\n", stderr);
    fputs("** You must call QR_OI_Init right after OI_init\n", stderr);
    fflush(stderr);
    exit(1);
  }
  displays()[text_] = this;
  registerActions();
  text_->setExtendSelection(false);
  installDefaultResources();
  readResources(on);
  text_->overrideTranslations(translations());
  text_->describeMore = [this](std::ostream& out) {
    out << " rows=";
    uint32_t n = root_ ? root_->selection_count() : 0;
    for (uint32_t i = 0; i < n; ++i) out << (i ? "," : "") << root_->selected(i)->first_line();
    if (n == 0) out << "none";
    out << " update=" << updateDepth_ << " covered=" << (text_->covered() ? 1 : 0);
  };
}

QR_OI_OutlineDisplay::~QR_OI_OutlineDisplay() {
  actionsTimer_.cancel();
  while (busy_ > 0) {
    --busy_;
    if (OI_Application* app = OI_Application::instance()) app->endBusyPointer();
  }
  displays().erase(text_);
  text_->describeMore = nullptr;
  if (text_->widget()) {
    for (auto& [row, g] : glyphs_) text_->removeGlyph(g.glyph);
    if (text_->holdCount() > 0 && updateDepth_ > 0) text_->releaseRedisplay();
    text_->uncover();
  }
  glyphs_.clear();
}

void QR_OI_OutlineDisplay::installDefaultResources() {
  OI_Application* app = OI_Application::instance();
  if (!app) return;
  XrmDatabase defaults = nullptr;
  for (const char* line : defaultGlyphResources) XrmPutLineResource(&defaults, line);
  XrmDatabase db = XrmGetDatabase(app->display());
  // Values the user set stay: the built-in lines only fill gaps.
  XrmCombineDatabase(defaults, &db, False);
  XrmSetDatabase(app->display(), db);
}

void QR_OI_OutlineDisplay::readResources(OI_Widget* on) {
  OutlineResources r{};
  XtGetApplicationResources(text_->widget(), &r, outlineResources, XtNumber(outlineResources), nullptr, 0);
  tabWidth_ = r.tabStops > 0 ? static_cast<uint32_t>(r.tabStops) : 8;
  autoSelect_ = r.autoSelect;
  if (scroll_) scroll_->setDynamicScrollBars(r.dynamicScrollbars);
  (void)on;
  // Each string's colours are resources of its own name under the text.
  for (const std::string& s : parseQuotedList(r.enhanceStrings)) {
    if (s.empty()) continue;
    struct Colors {
      String fg;
      String bg;
    } c{};
    XtResource colorRes[] = {
        {oiStr("enhanceForeground"), oiStr("EnhanceForeground"), oiStr(XtRString), sizeof(String),
         XtOffsetOf(Colors, fg), oiStr(XtRImmediate), nullptr},
        {oiStr("enhanceBackground"), oiStr("EnhanceBackground"), oiStr(XtRString), sizeof(String),
         XtOffsetOf(Colors, bg), oiStr(XtRImmediate), nullptr},
    };
    XtGetSubresources(text_->widget(), &c, s.c_str(), "Enhancement", colorRes, XtNumber(colorRes), nullptr, 0);
    bool fgOk = false, bgOk = false;
    unsigned long fg = c.fg ? text_->namedColor(c.fg, &fgOk) : 0;
    unsigned long bg = c.bg ? text_->namedColor(c.bg, &bgOk) : 0;
    if (!fgOk && !bgOk) continue;  // a string with no colour that converts is dropped
    QR_OI_Enhancement e;
    e.text = oiDecodeUtf8(s);
    e.foreground = fg;
    e.background = bg;
    e.flags = static_cast<uint8_t>((fgOk ? OI_attrForeground : 0) | (bgOk ? OI_attrBackground : 0));
    enhancements_.push_back(std::move(e));
  }
}

void QR_OI_OutlineDisplay::set_root(QR_OutlineRoot* root) {
  QR_OutlineDisplay::set_root(root);
  if (root && autoSelect_) root->set_auto_select(true);
  update_controlled_widgets();
}

// ---------------------------------------------------------------- marks and enhancements

void QR_OI_OutlineDisplay::add_enhancement(const char* text, unsigned long foreground, unsigned long background) {
  if (!text || !*text) return;
  QR_OI_Enhancement e;
  e.text = oiDecodeUtf8(text);
  e.foreground = foreground;
  e.background = background;
  e.flags = OI_attrForeground | OI_attrBackground;
  enhancements_.push_back(std::move(e));
}

void QR_OI_OutlineDisplay::add_column_mark(uint32_t column) {
  if (marks_.size() < maxColumnMarks) marks_.push_back(column);
}

void QR_OI_OutlineDisplay::clear_column_marks() { marks_.clear(); }

// ---------------------------------------------------------------- lines

void QR_OI_OutlineDisplay::insert_lines(uint32_t first, uint32_t count) {
  if (count) text_->insertLines(first, count);
}

void QR_OI_OutlineDisplay::delete_lines(uint32_t first, uint32_t count) {
  if (!count) return;
  text_->deleteLines(first, count);
  // Glyphs whose lines went are dropped; their rows place new ones when they show again.
  for (auto it = glyphs_.begin(); it != glyphs_.end();) {
    if (it->second.glyph->line() == OI_Glyph::noLine) {
      text_->removeGlyph(it->second.glyph);
      it = glyphs_.erase(it);
    } else {
      ++it;
    }
  }
}

void QR_OI_OutlineDisplay::set_line(uint32_t depth, uint32_t line, const char* text, QR_OutlineObject* row) {
  // 1. Indentation, then the text with tabs expanded from the text's own first character.
  // The line is composed in a buffer kept between calls: Expand all sets tens of thousands of lines.
  std::u32string& composed = composed_;
  composed.assign(text_column(depth), U' ');
  const size_t start = composed.size();
  oiDecodeUtf8Append(text ? std::string_view(text) : std::string_view(), composed);
  if (composed.find(U'\t', start) != std::u32string::npos) {
    std::u32string body = composed.substr(start);
    composed.resize(start);
    for (char32_t c : body) {
      if (c == U'\t') {
        do composed.push_back(U' ');
        while ((composed.size() - start) % tabWidth_ != 0);
      } else {
        composed.push_back(c);
      }
    }
  }
  // 2. Only what differs from the line on screen is rewritten.
  if (line >= text_->lineCount()) {
    text_->insertLine(line, oiEncodeUtf8(composed));
  } else {
    const std::u32string& old = text_->model().lineChars(line);
    size_t common = 0;
    while (common < old.size() && common < composed.size() && old[common] == composed[common]) ++common;
    if (common != old.size() || common != composed.size())
      text_->replaceTail(line, static_cast<uint32_t>(common), std::u32string_view(composed).substr(common));
  }
  // 3. Attributes: plain, with the separator at every column mark.
  text_->clearAttributes(line);
  for (uint32_t m : marks_)
    if (m < composed.size()) text_->setAttributes(line, m, 1, OI_attrSeparator);
  // 4. The current row's marker.
  if (row && row->first_line() != QR_OutlineObject::kNoLine && line >= row->first_line()) {
    QR_OutlineAnnotation* here = row->annotation_at(line - row->first_line(), 0);
    const char* name = here ? here->name_text() : nullptr;
    if (name && std::strcmp(name, "QR_OutlineHere") == 0) {
      uint32_t col = depth > 0 ? text_column(depth - 1) : 0;
      text_->overwrite(line, col, "=>");
      text_->setAttributes(line, col, 2, OI_attrForeground, text_->highlightColor());
      composed = text_->model().lineChars(line);
    }
  }
  // 5. Enhancements, in the order added: the first occurrence of each.
  for (const QR_OI_Enhancement& e : enhancements_) {
    size_t at = composed.find(e.text);
    if (at == std::u32string::npos) continue;
    OI_CharAttr now = text_->attrAt(line, static_cast<uint32_t>(at));
    bool same = (now.flags & (OI_attrForeground | OI_attrBackground)) == e.flags &&
                (!(e.flags & OI_attrForeground) || text_->colorOf(now.fg) == e.foreground) &&
                (!(e.flags & OI_attrBackground) || text_->colorOf(now.bg) == e.background);
    if (!same)
      text_->setAttributes(line, static_cast<uint32_t>(at), static_cast<uint32_t>(e.text.size()),
                           static_cast<uint8_t>(e.flags | (now.flags & OI_attrSeparator)), e.foreground,
                           e.background);
  }
}

// ---------------------------------------------------------------- scrolling

bool QR_OI_OutlineDisplay::is_line_visible(uint32_t line) { return text_->isLineVisible(line); }

void QR_OI_OutlineDisplay::show_line(uint32_t line) { text_->showLine(line); }

void QR_OI_OutlineDisplay::make_visible(QR_OutlineObject* row) {
  if (!row || !root_ || root_->selection_count() != 1) return;
  uint32_t first = row->first_line();
  if (first == QR_OutlineObject::kNoLine) return;
  uint32_t lines = std::max<uint32_t>(1, row->visible_line_count());
  uint32_t last = first + lines - 1;
  uint32_t top = text_->topLine(), vis = text_->visibleLines();
  if (lines <= vis && first >= top) {
    if (last < top + vis) return;
    text_->setTopLine(last - vis + 1);
    return;
  }
  to_top(row);
}

void QR_OI_OutlineDisplay::to_top(QR_OutlineObject* row) {
  if (row && row->first_line() != QR_OutlineObject::kNoLine) text_->setTopLine(row->first_line());
}

// ---------------------------------------------------------------- update bracket

void QR_OI_OutlineDisplay::openBracket(uint32_t line) {
  if (updateDepth_++ == 0) {
    text_->holdRedisplay();
    text_->coverFrom(line);
  }
}

void QR_OI_OutlineDisplay::closeBracket() {
  if (updateDepth_ == 0) {
    text_->uncover();
    return;
  }
  if (--updateDepth_ == 0) {
    text_->releaseRedisplay();
    text_->redisplay();
    text_->uncover();
  }
}

void QR_OI_OutlineDisplay::begin_update() { openBracket(0); }

void QR_OI_OutlineDisplay::end_update() { closeBracket(); }

bool QR_OI_OutlineDisplay::changesExpansion(QR_OutlineObject* row, const std::string& name) {
  if (name == "QR_OutlineExpand") return !row->is_expanded();
  if (name == "QR_OutlineCollapse") return row->is_expanded();
  if (name == "QR_OutlineExpandCollapse") return row->is_expandable_or_collapsible();
  return name == "QR_OutlineExpandAll" || name == "QR_OutlineCollapseAll";
}

void QR_OI_OutlineDisplay::before_row_action(QR_OutlineObject* row, const char* name) {
  std::string n = name ? name : "";
  bool opens = row && changesExpansion(row, n);
  rowBrackets_.push_back(opens);
  if (!opens) return;
  uint32_t first = row->first_line();
  openBracket(first == QR_OutlineObject::kNoLine ? 0 : first);
  if (n == "QR_OutlineExpandAll" || n == "QR_OutlineCollapseAll") {
    ++busy_;
    if (OI_Application* app = OI_Application::instance()) app->beginBusyPointer();
  }
}

void QR_OI_OutlineDisplay::after_row_action(QR_OutlineObject*, const char* name) {
  std::string n = name ? name : "";
  if ((n == "QR_OutlineExpandAll" || n == "QR_OutlineCollapseAll") && busy_ > 0) {
    --busy_;
    if (OI_Application* app = OI_Application::instance()) app->endBusyPointer();
  }
  bool opened = !rowBrackets_.empty() && rowBrackets_.back();
  if (!rowBrackets_.empty()) rowBrackets_.pop_back();
  if (opened) closeBracket();
}

// ---------------------------------------------------------------- glyphs

QR_OI_Annotation* QR_OI_OutlineDisplay::annotationImage(QR_OutlineAnnotation* a) {
  auto it = images_.find(a->name());
  if (it != images_.end()) return it->second.get();
  std::string name = a->name_text();
  std::unique_ptr<QR_OI_Annotation> img;
  // 1. A pixmap file named by the resource "annotation" of that name.
  struct Res {
    String file;
  } r{};
  XtResource res[] = {{oiStr("annotation"), oiStr("Annotation"), oiStr(XtRString), sizeof(String),
                       XtOffsetOf(Res, file), oiStr(XtRImmediate), nullptr}};
  XtGetSubresources(text_->widget(), &r, name.c_str(), "Annotation", res, 1, nullptr, 0);
  if (r.file && *r.file) {
    Widget w = text_->widget();
    Pixmap p = XmGetPixmapByDepth(XtScreen(w), r.file, text_->foreground(), text_->background(),
                                  DefaultDepthOfScreen(XtScreen(w)));
    if (p != XmUNSPECIFIED_PIXMAP && p != None) {
      Window rootWin;
      int x, y;
      unsigned pw, ph, border, depth;
      XGetGeometry(XtDisplay(w), p, &rootWin, &x, &y, &pw, &ph, &border, &depth);
      // A private copy, so that the cache of the toolkit can let its own go.
      OI_Pixmap copy(XtDisplay(w), XCreatePixmap(XtDisplay(w), p, pw, ph, depth));
      {
        OI_GC gc(XtDisplay(w), copy.get());
        XCopyArea(XtDisplay(w), p, copy.get(), gc.get(), 0, 0, pw, ph, 0, 0);
      }
      XmDestroyPixmap(XtScreen(w), p);
      img = std::make_unique<QR_OI_Annotation>(a->name(), QR_OI_Annotation::fromResource,
                                               std::vector<unsigned char>{}, static_cast<int>(pw),
                                               static_cast<int>(ph));
      img->setPixmap(std::move(copy), static_cast<int>(pw), static_cast<int>(ph));
    }
  }
  // 2. The annotation's own bitmap.
  if (!img && a->bitmap_bits() && a->bitmap_width() > 0 && a->bitmap_height() > 0 && a->bitmap_width() < 256 &&
      a->bitmap_height() < 256) {
    size_t n = (a->bitmap_width() + 7) / 8 * a->bitmap_height();
    img = std::make_unique<QR_OI_Annotation>(
        a->name(), QR_OI_Annotation::fromBits, std::vector<unsigned char>(a->bitmap_bits(), a->bitmap_bits() + n),
        static_cast<int>(a->bitmap_width()), static_cast<int>(a->bitmap_height()));
  }
  // 3.-6. The built-in pictures.
  if (!img) {
    std::vector<unsigned char> bits, mask;
    int w = 0, h = 0;
    qr_glyphs::builtInFor(name, bits, mask, w, h);
    img = std::make_unique<QR_OI_Annotation>(a->name(), QR_OI_Annotation::builtIn, bits, w, h, mask);
  }
  QR_OI_Annotation* raw = img.get();
  images_[a->name()] = std::move(img);
  return raw;
}

OI_Glyph* QR_OI_OutlineDisplay::makeGlyph(QR_OutlineAnnotation* a, uint32_t line, uint32_t col) {
  QR_OI_Annotation* img = annotationImage(a);
  std::string name = a->name_text();
  OI_Glyph* g = nullptr;
  Widget w = text_->widget();
  if (img->source() == QR_OI_Annotation::fromResource) {
    Display* d = XtDisplay(w);
    OI_Pixmap copy(d, XCreatePixmap(d, img->pixmap(), static_cast<unsigned>(img->width()),
                                    static_cast<unsigned>(img->height()), DefaultDepthOfScreen(XtScreen(w))));
    {
      OI_GC gc(d, copy.get());
      XCopyArea(d, img->pixmap(), copy.get(), gc.get(), 0, 0, static_cast<unsigned>(img->width()),
                static_cast<unsigned>(img->height()), 0, 0);
    }
    g = text_->addPixmapGlyph(name, line, col, std::move(copy), OI_Pixmap(), img->width(), img->height());
  } else if (!img->mask().empty()) {
    // The arrow: its outline in the text colour over the filled shape in the highlight colour.
    Display* d = XtDisplay(w);
    Window rootWin = RootWindowOfScreen(XtScreen(w));
    unsigned iw = static_cast<unsigned>(img->width()), ih = static_cast<unsigned>(img->height());
    OI_Pixmap image(d, XCreatePixmap(d, rootWin, iw, ih, DefaultDepthOfScreen(XtScreen(w))));
    OI_Pixmap mask(
        d, XCreateBitmapFromData(d, rootWin, reinterpret_cast<const char*>(img->mask().data()), iw, ih));
    {  // the outline and the GC serve only the drawing
      OI_Pixmap outline(
          d, XCreateBitmapFromData(d, rootWin, reinterpret_cast<const char*>(img->bits().data()), iw, ih));
      OI_GC gc(d, image.get());
      XSetForeground(d, gc.get(), text_->highlightColor());
      XFillRectangle(d, image.get(), gc.get(), 0, 0, iw, ih);
      XSetForeground(d, gc.get(), text_->foreground());
      XSetClipMask(d, gc.get(), outline.get());
      XFillRectangle(d, image.get(), gc.get(), 0, 0, iw, ih);
    }
    g = text_->addPixmapGlyph(name, line, col, std::move(image), std::move(mask), img->width(),
                              img->height());
  } else {
    g = text_->addGlyph(name, line, col, img->bits().data(), img->width(), img->height());
  }
  if (g) g->onPress = [this](OI_Glyph& glyph, XEvent* ev) { glyphPressed(glyph, ev); };
  return g;
}

void QR_OI_OutlineDisplay::removeGlyphs(QR_OutlineObject* row) {
  auto range = glyphs_.equal_range(static_cast<const QR_Object*>(row));
  for (auto it = range.first; it != range.second; ++it) text_->removeGlyph(it->second.glyph);
  glyphs_.erase(range.first, range.second);
}

void QR_OI_OutlineDisplay::row_changed(QR_OutlineObject* row) {
  if (!row) return;
  removeGlyphs(row);
  uint32_t first = row->first_line();
  if (first == QR_OutlineObject::kNoLine || row->line_count() == 0 || !row->annotations()) return;
  if (!is_linked(row)) link(row);  // to hear of the row's end
  uint32_t depth = row->depth();
  for (QR_OutlineAnnotation* a : *row->annotations()) {
    if (a->line() >= row->line_count()) continue;
    if (a->line() > 0 && !row->is_expanded()) continue;
    uint32_t col = a->column() != 0 ? a->column() : glyph_column(a->line() == 0 ? depth : depth + 1);
    OI_Glyph* g = makeGlyph(a, first + a->line(), col);
    if (!g) continue;
    g->userData = row;
    glyphs_.emplace(static_cast<const QR_Object*>(row), QR_OI_GlyphAnnotation{row, a->name_text(), a->column(), g});
  }
}

void QR_OI_OutlineDisplay::annotation_removed(QR_OutlineObject* row, QR_OutlineAnnotation* annotation) {
  if (!row || !annotation) return;
  std::string name = annotation->name_text();
  auto range = glyphs_.equal_range(static_cast<const QR_Object*>(row));
  for (auto it = range.first; it != range.second;) {
    if (it->second.name == name && it->second.annotationColumn == annotation->column()) {
      text_->removeGlyph(it->second.glyph);
      it = glyphs_.erase(it);
    } else {
      ++it;
    }
  }
}

void QR_OI_OutlineDisplay::linked_object_destroyed(QR_Object* gone) {
  // The row is half destroyed: it is only compared, never used.
  if (menuRowKey_ == gone) {
    menuRow_ = nullptr;
    menuRowKey_ = nullptr;
  }
  auto range = glyphs_.equal_range(gone);
  for (auto it = range.first; it != range.second; ++it)
    if (text_->widget()) text_->removeGlyph(it->second.glyph);
  glyphs_.erase(range.first, range.second);
}

// ---------------------------------------------------------------- selection

void QR_OI_OutlineDisplay::selectTextFromRows() {
  if (!root_ || rebuilding_) return;
  uint32_t n = root_->selection_count();
  if (n == 0) {
    text_->clearSelection();
    return;
  }
  uint32_t first = QR_OutlineObject::kNoLine, last = 0;
  for (uint32_t i = 0; i < n; ++i) {
    QR_OutlineObject* r = root_->selected(i);
    uint32_t f = r->first_line();
    if (f == QR_OutlineObject::kNoLine) continue;
    first = std::min(first, f);
    last = std::max(last, n == 1 ? f : f + std::max<uint32_t>(1, r->visible_line_count()) - 1);
  }
  if (first == QR_OutlineObject::kNoLine) text_->clearSelection();
  else text_->selectLines(first, last);
}

void QR_OI_OutlineDisplay::row_selected(QR_OutlineObject*) { selectTextFromRows(); }

void QR_OI_OutlineDisplay::row_deselected(QR_OutlineObject*) { selectTextFromRows(); }

void QR_OI_OutlineDisplay::begin_action(const char*) {}

void QR_OI_OutlineDisplay::end_action(const char*) {
  while (busy_ > 0) {
    --busy_;
    if (OI_Application* app = OI_Application::instance()) app->endBusyPointer();
  }
  if (!root_) return;
  selectTextFromRows();
  if (root_->selection_count() > 1) rebuildRowsFromText();
}

void QR_OI_OutlineDisplay::rebuildRowsFromText() {
  if (!root_) return;
  begin_update();
  bool held = root_->hold_updates();
  rebuilding_ = true;
  root_->clear_selection();
  if (text_->hasSelection()) {
    OI_TextPos s = text_->selectionStart(), e = text_->selectionEnd();
    uint32_t last = e.col == 0 && e.line > s.line ? e.line - 1 : e.line;
    for (uint32_t line = s.line; line <= last && line < text_->lineCount(); ++line) {
      QR_OutlineObject* row = root_->object_at_line(line);
      if (row && row->is_selectable() && !row->is_selected()) root_->add_to_selection(row);
    }
  }
  rebuilding_ = false;
  root_->release_updates(held);
  root_->update_actions();
  end_update();
}
