// The monospace font of the text panes.
#include "toolkit/oi_text_font.h"

#include <algorithm>
#include <vector>

OI_TextFont::OI_TextFont(Display* d, int screen, const std::string& name) : d_(d) {
  if (!name.empty()) xft_ = XftFontOpenName(d, screen, name.c_str());
  if (xft_) {
    XGlyphInfo info;
    const FcChar8 m[] = "M";
    XftTextExtents8(d, xft_, m, 1, &info);
    cellWidth_ = std::max<int>(1, info.xOff > 0 ? info.xOff : xft_->max_advance_width);
    ascent_ = xft_->ascent;
    cellHeight_ = std::max(1, xft_->ascent + xft_->descent);
    return;
  }
  core_ = XLoadQueryFont(d, "fixed");
  if (core_) {
    cellWidth_ = std::max<int>(1, core_->max_bounds.width);
    ascent_ = core_->ascent;
    cellHeight_ = std::max(1, core_->ascent + core_->descent);
  }
}

OI_TextFont::~OI_TextFont() {
  if (xft_) XftFontClose(d_, xft_);
  if (core_) XFreeFont(d_, core_);
}

void OI_TextFont::drawCells(XftDraw* draw, const XftColor& color, Drawable d, GC gc, int x, int y,
                            const char32_t* s, size_t n) const {
  if (n == 0) return;
  if (xft_ && draw) {
    // Each character is placed on its own cell so that the grid holds whatever the glyph widths.
    std::vector<XftCharSpec> glyphs;
    glyphs.reserve(n);
    for (size_t i = 0; i < n; ++i) {
      if (s[i] == U' ') continue;
      glyphs.push_back(XftCharSpec{static_cast<FcChar32>(s[i]), static_cast<short>(x + int(i) * cellWidth_),
                                 static_cast<short>(y)});
    }
    if (!glyphs.empty()) XftDrawCharSpec(draw, &color, xft_, glyphs.data(), static_cast<int>(glyphs.size()));
    return;
  }
  if (core_) {
    std::string bytes(n, '?');
    for (size_t i = 0; i < n; ++i)
      if (s[i] < 256 && s[i] >= 32) bytes[i] = static_cast<char>(s[i]);
    XSetFont(d_, gc, core_->fid);
    XDrawString(d_, d, gc, x, y, bytes.data(), static_cast<int>(n));
  }
}
