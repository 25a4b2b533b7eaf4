// The multi-line text's actions: mouse selection, glyph presses, scrolling keys, clipboard.
#include <X11/Xatom.h>
#include <Xm/Xm.h>

#include <cstdlib>
#include <cstring>

#include "toolkit/oi_multi_text.h"
#include "toolkit/oi_xstring.h"

namespace {

OI_MultiText* textOf(Widget w) { return OI_MultiText::fromActionWidget(w); }

int intParam(String* params, Cardinal* n, int fallback) {
  if (!params || !n || *n < 1) return fallback;
  int v = atoi(params[0]);
  return v > 0 ? v : fallback;
}

void selectStartAction(Widget w, XEvent* ev, String*, Cardinal*) {
  OI_MultiText* t = textOf(w);
  if (!t) return;
  oiGuard("select_start", [&] {
    t->takeFocus();
    if (t->dispatchGlyphPress(ev)) return;
    if (t->onPress && t->onPress(ev)) return;
    t->startSelection(ev, t->countClick(ev));
  });
}

void selectAdjustAction(Widget w, XEvent* ev, String*, Cardinal*) {
  if (OI_MultiText* t = textOf(w)) oiGuard("select_adjust", [&] { t->adjustSelection(ev); });
}

void selectEndAction(Widget w, XEvent* ev, String*, Cardinal*) {
  if (OI_MultiText* t = textOf(w)) oiGuard("select_end", [&] { t->endSelection(ev); });
}

void extendStartAction(Widget w, XEvent* ev, String*, Cardinal*) {
  OI_MultiText* t = textOf(w);
  if (t && t->extendSelection()) oiGuard("extend_start", [&] { t->adjustSelection(ev); });
}

void popupAction(Widget w, XEvent* ev, String*, Cardinal*) {
  OI_MultiText* t = textOf(w);
  if (!t) return;
  oiGuard("popup_menu", [&] {
    if (t->dispatchGlyphPress(ev)) return;
    if (t->onPopup) t->onPopup(ev);
  });
}

void pageDownAction(Widget w, XEvent*, String*, Cardinal*) {
  if (OI_MultiText* t = textOf(w)) oiGuard("page_down", [&] { t->pageDown(); });
}

void pageUpAction(Widget w, XEvent*, String*, Cardinal*) {
  if (OI_MultiText* t = textOf(w)) oiGuard("page_up", [&] { t->pageUp(); });
}

void lineDownAction(Widget w, XEvent*, String* p, Cardinal* n) {
  if (OI_MultiText* t = textOf(w)) oiGuard("line_down", [&] { t->scrollLines(intParam(p, n, 1)); });
}

void lineUpAction(Widget w, XEvent*, String* p, Cardinal* n) {
  if (OI_MultiText* t = textOf(w)) oiGuard("line_up", [&] { t->scrollLines(-intParam(p, n, 1)); });
}

void scrollLeftAction(Widget w, XEvent*, String* p, Cardinal* n) {
  OI_MultiText* t = textOf(w);
  if (!t) return;
  int by = intParam(p, n, 4);
  t->setLeftColumn(t->leftColumn() > static_cast<uint32_t>(by) ? t->leftColumn() - static_cast<uint32_t>(by) : 0);
}

void scrollRightAction(Widget w, XEvent*, String* p, Cardinal* n) {
  if (OI_MultiText* t = textOf(w)) t->setLeftColumn(t->leftColumn() + static_cast<uint32_t>(intParam(p, n, 4)));
}

void textTopAction(Widget w, XEvent*, String*, Cardinal*) {
  if (OI_MultiText* t = textOf(w)) t->setTopLine(0);
}

void textBottomAction(Widget w, XEvent*, String*, Cardinal*) {
  if (OI_MultiText* t = textOf(w)) t->setTopLine(t->lineCount());
}

void copyClipboardAction(Widget w, XEvent* ev, String*, Cardinal*) {
  OI_MultiText* t = textOf(w);
  if (!t) return;
  Time time = ev && (ev->type == KeyPress || ev->type == KeyRelease) ? ev->xkey.time
              : ev && (ev->type == ButtonPress || ev->type == ButtonRelease) ? ev->xbutton.time
                                                                              : CurrentTime;
  oiGuard("copy_clipboard", [&] { t->copyToClipboard(time); });
}

void dragCopyStartAction(Widget w, XEvent* ev, String*, Cardinal*) {
  // A middle press offers the selected text to other programs as the primary selection.
  OI_MultiText* t = textOf(w);
  if (t && ev && ev->type == ButtonPress) oiGuard("drag_copy_start", [&] { t->ownPrimary(ev->xbutton.time); });
}

void noopAction(Widget, XEvent*, String*, Cardinal*) {}

Boolean convertSelection(Widget w, Atom* selection, Atom* target, Atom* type, XtPointer* value,
                         unsigned long* length, int* format) {
  OI_MultiText* t = textOf(w);
  if (!t) return False;
  Display* d = XtDisplay(w);
  Atom targets = XInternAtom(d, "TARGETS", False);
  Atom utf8 = XInternAtom(d, "UTF8_STRING", False);
  Atom text = XInternAtom(d, "TEXT", False);
  if (*target == targets) {
    auto* list = reinterpret_cast<Atom*>(XtMalloc(4 * sizeof(Atom)));
    list[0] = targets;
    list[1] = utf8;
    list[2] = XA_STRING;
    list[3] = text;
    *type = XA_ATOM;
    *value = reinterpret_cast<XtPointer>(list);
    *length = 4;
    *format = 32;
    return True;
  }
  if (*target != utf8 && *target != XA_STRING && *target != text) return False;
  bool clipboard = *selection == XInternAtom(d, "CLIPBOARD", False);
  std::string s = clipboard ? t->clipboardText() : t->selectedText();
  char* copy = XtMalloc(static_cast<Cardinal>(s.size() + 1));
  memcpy(copy, s.c_str(), s.size() + 1);
  *type = *target == XA_STRING ? XA_STRING : utf8;
  *value = copy;
  *length = s.size();
  *format = 8;
  return True;
}

Boolean convertClipboard(Widget w, Atom* selection, Atom* target, Atom* type, XtPointer* value,
                         unsigned long* length, int* format) {
  return convertSelection(w, selection, target, type, value, length, format);
}

}  // namespace

OI_MultiText* OI_MultiText::fromActionWidget(Widget w) { return dynamic_cast<OI_MultiText*>(OI_Widget::enclosing(w)); }

const char* OI_MultiText::defaultTranslations() {
  return "#override\n"
         "~Shift<Btn1Down>: select_start()\n"
         "Shift<Btn1Down>: extend_start()\n"
         "<Btn1Motion>: select_adjust()\n"
         "<Btn1Up>: select_end()\n"
         "<Btn2Down>: drag_copy_start()\n"
         "<Btn3Down>: popup_menu()\n"
         "<Btn4Down>: line_up(3)\n"
         "<Btn5Down>: line_down(3)\n"
         "<Key>osfPageDown: page_down()\n"
         "<Key>osfPageUp: page_up()\n"
         "<Key>osfDown: line_down()\n"
         "<Key>osfUp: line_up()\n"
         "<Key>osfLeft: scroll_left()\n"
         "<Key>osfRight: scroll_right()\n"
         "Ctrl<Key>osfBeginLine: text_top()\n"
         "Ctrl<Key>osfEndLine: text_bottom()\n"
         "<Key>osfBeginLine: text_top()\n"
         "<Key>osfEndLine: text_bottom()\n"
         "<Key>osfCopy: copy_clipboard()\n"
         "Ctrl<Key>c: copy_clipboard()\n"
         "Ctrl<Key>Insert: copy_clipboard()\n";
}

void OI_MultiText::registerActions() {
  OI_Application* app = OI_Application::instance();
  if (!app || !app->firstTime("OI_MultiText actions")) return;
  app->addAction("select_start", selectStartAction);
  app->addAction("select_adjust", selectAdjustAction);
  app->addAction("select_end", selectEndAction);
  app->addAction("extend_start", extendStartAction);
  app->addAction("popup_menu", popupAction);
  app->addAction("page_down", pageDownAction);
  app->addAction("page_up", pageUpAction);
  app->addAction("line_down", lineDownAction);
  app->addAction("line_up", lineUpAction);
  app->addAction("scroll_left", scrollLeftAction);
  app->addAction("scroll_right", scrollRightAction);
  app->addAction("text_top", textTopAction);
  app->addAction("text_bottom", textBottomAction);
  app->addAction("copy_clipboard", copyClipboardAction);
  app->addAction("cut_clipboard", copyClipboardAction);  // the text is read-only: cutting copies
  app->addAction("drag_copy_start", dragCopyStartAction);
  app->addAction("noop", noopAction);
}

int OI_MultiText::countClick(XEvent* ev) {
  if (!ev || ev->type != ButtonPress) return 1;
  Time t = ev->xbutton.time;
  unsigned long multi = static_cast<unsigned long>(XtGetMultiClickTime(XtDisplay(widget())));
  clicks_ = (clicks_ > 0 && t >= lastPress_ && t - lastPress_ <= multi) ? clicks_ + 1 : 1;
  lastPress_ = t;
  return clicks_;
}

bool OI_MultiText::dispatchGlyphPress(XEvent* ev) {
  if (!ev || ev->type != ButtonPress) return false;
  OI_Glyph* g = glyphAt(ev->xbutton.x, ev->xbutton.y);
  if (!g) return false;
  if (g->onPress) g->onPress(*g, ev);
  return true;
}

void OI_MultiText::startSelection(XEvent* ev, int clicks) {
  if (!ev || ev->type != ButtonPress) return;
  clickMode_ = clicks >= 3 ? 3 : clicks;
  OI_TextPos p = posAt(ev->xbutton.x, ev->xbutton.y);
  anchor_ = p;
  if (lineCount() == 0) {
    clearSelection();
    return;
  }
  if (clickMode_ == 1) {
    clearSelection();
  } else if (clickMode_ == 2) {
    OI_TextPos s, e;
    model_.wordAround(p, s, e);
    setSelection(s, e);
  } else {
    selectLines(p.line, p.line);
  }
}

void OI_MultiText::adjustSelection(XEvent* ev) {
  if (!ev || (ev->type != MotionNotify && ev->type != ButtonPress && ev->type != ButtonRelease)) return;
  int x = ev->type == MotionNotify ? ev->xmotion.x : ev->xbutton.x;
  int y = ev->type == MotionNotify ? ev->xmotion.y : ev->xbutton.y;
  // Dragging past the top or bottom edge scrolls the text along.
  Dimension h = 0;
  XtVaGetValues(widget(), XmNheight, &h, nullptr);
  if (y < 0) scrollLines(-1);
  else if (y >= static_cast<int>(h)) scrollLines(1);
  OI_TextPos p = posAt(x, y);
  if (lineCount() == 0) return;
  if (clickMode_ == 3) {
    selectLines(std::min(anchor_.line, p.line), std::max(anchor_.line, p.line));
  } else if (clickMode_ == 2) {
    OI_TextPos as, ae, ps, pe;
    model_.wordAround(anchor_, as, ae);
    model_.wordAround(p, ps, pe);
    setSelection(std::min(as, ps), std::max(ae, pe));
  } else {
    setSelection(anchor_, p);
  }
}

void OI_MultiText::endSelection(XEvent* ev) {
  if (ev && ev->type == ButtonRelease && hasSelection()) ownPrimary(ev->xbutton.time);
}

void OI_MultiText::ownPrimary(Time t) {
  if (!widget() || !hasSelection()) return;
  XtOwnSelection(widget(), XA_PRIMARY, t, convertSelection, nullptr, nullptr);
}

void OI_MultiText::copyToClipboard(Time t) {
  if (!widget() || !hasSelection()) return;
  clipboard_ = selectedText();
  XtOwnSelection(widget(), XInternAtom(XtDisplay(widget()), "CLIPBOARD", False), t, convertClipboard, nullptr,
                 nullptr);
}

void OI_MultiText::describe(std::ostream& out) const {
  out << " lines=" << lineCount() << " top=" << top_ << " left=" << left_ << " visible=" << visibleLines()
      << " cell=" << cellWidth() << "x" << cellHeight();
  if (hasSelection())
    out << " selection=" << selectionStart().line << ":" << selectionStart().col << "-" << selectionEnd().line << ":"
        << selectionEnd().col;
  out << " glyphs=" << glyphs_.size() << " hold=" << hold_;
  if (describeMore) describeMore(out);
  out << "\n";
  for (uint32_t i = 0; i < lineCount() && i < 10000; ++i) out << "  line " << i << ": " << lineText(i) << "\n";
  for (const auto& g : glyphs_)
    if (g->line() != OI_Glyph::noLine) out << "  glyph " << g->name() << " at " << g->line() << ":" << g->column() << "\n";
}
