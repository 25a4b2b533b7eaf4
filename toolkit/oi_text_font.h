// The monospace font of the text panes: Xft first, the core font "fixed" when Xft finds nothing.
#pragma once

#include <X11/Xft/Xft.h>
#include <X11/Xlib.h>

#include <string>

class OI_TextFont {
 public:
  // `name` is a fontconfig pattern such as "DejaVu Sans Mono:size=10".
  OI_TextFont(Display* d, int screen, const std::string& name);
  ~OI_TextFont();
  OI_TextFont(const OI_TextFont&) = delete;
  OI_TextFont& operator=(const OI_TextFont&) = delete;

  bool ok() const { return xft_ || core_; }
  bool isXft() const { return xft_ != nullptr; }
  int cellWidth() const { return cellWidth_; }
  int cellHeight() const { return cellHeight_; }
  int ascent() const { return ascent_; }

  // Draws `n` characters, one per cell, from cell origin x with baseline y. The core font draws
  // with `gc`, whose foreground the caller has set; Xft draws with `color` through `draw`.
  void drawCells(XftDraw* draw, const XftColor& color, Drawable d, GC gc, int x, int y, const char32_t* s,
                 size_t n) const;

 private:
  Display* d_;
  XftFont* xft_ = nullptr;
  XFontStruct* core_ = nullptr;
  int cellWidth_ = 8;
  int cellHeight_ = 16;
  int ascent_ = 12;
};
