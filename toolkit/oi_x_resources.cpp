// Owners of X server resources, and colour look-ups.
#include "toolkit/oi_x_resources.h"

#include "toolkit/oi_xstring.h"

OI_XftColorCache::~OI_XftColorCache() {
  for (auto& [pixel, color] : colors_) XftColorFree(d_, v_, cm_, &color);
}

const XftColor& OI_XftColorCache::get(unsigned long pixel) {
  auto it = colors_.find(pixel);
  if (it != colors_.end()) return it->second;
  XColor xc;
  xc.pixel = pixel;
  XQueryColor(d_, cm_, &xc);
  XRenderColor rc{xc.red, xc.green, xc.blue, 0xFFFF};
  XftColor color{};
  if (!XftColorAllocValue(d_, v_, cm_, &rc, &color)) {
    color.pixel = pixel;
    color.color = rc;
  }
  return colors_.emplace(pixel, color).first->second;
}

unsigned long oiNamedPixel(Display* d, Colormap cm, const char* name, unsigned long fallback, bool* ok) {
  XColor screen, exact;
  bool good = name && *name && XAllocNamedColor(d, cm, name, &screen, &exact);
  if (ok) *ok = good;
  return good ? screen.pixel : fallback;
}

std::string oiXmStringText(XmString s) {
  if (!s) return {};
  char* text = static_cast<char*>(XmStringUnparse(s, nullptr, XmCHARSET_TEXT, XmCHARSET_TEXT, nullptr, 0,
                                                   XmOUTPUT_ALL));
  std::string out = text ? text : "";
  XtFree(text);
  return out;
}
