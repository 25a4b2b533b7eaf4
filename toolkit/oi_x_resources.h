// Owners of X server resources (GCs, pixmaps, cursors, Xft drawing contexts and colours) that free them.
#pragma once

#include <X11/Xft/Xft.h>
#include <X11/Xlib.h>

#include <cstdint>
#include <map>
#include <utility>

class OI_GC {
 public:
  OI_GC() = default;
  OI_GC(Display* d, Drawable where, unsigned long mask = 0, XGCValues* values = nullptr)
      : d_(d), gc_(XCreateGC(d, where, mask, values)) {}
  ~OI_GC() { reset(); }
  OI_GC(OI_GC&& o) noexcept : d_(o.d_), gc_(std::exchange(o.gc_, nullptr)) {}
  OI_GC& operator=(OI_GC&& o) noexcept {
    if (this != &o) {
      reset();
      d_ = o.d_;
      gc_ = std::exchange(o.gc_, nullptr);
    }
    return *this;
  }
  void reset() {
    if (gc_) XFreeGC(d_, gc_);
    gc_ = nullptr;
  }
  GC get() const { return gc_; }
  explicit operator bool() const { return gc_ != nullptr; }

 private:
  Display* d_ = nullptr;
  GC gc_ = nullptr;
};

class OI_Pixmap {
 public:
  OI_Pixmap() = default;
  OI_Pixmap(Display* d, Pixmap p) : d_(d), p_(p) {}
  ~OI_Pixmap() { reset(); }
  OI_Pixmap(OI_Pixmap&& o) noexcept : d_(o.d_), p_(std::exchange(o.p_, None)) {}
  OI_Pixmap& operator=(OI_Pixmap&& o) noexcept {
    if (this != &o) {
      reset();
      d_ = o.d_;
      p_ = std::exchange(o.p_, None);
    }
    return *this;
  }
  void reset() {
    if (p_ != None) XFreePixmap(d_, p_);
    p_ = None;
  }
  Pixmap get() const { return p_; }
  explicit operator bool() const { return p_ != None; }

 private:
  Display* d_ = nullptr;
  Pixmap p_ = None;
};

// An Xft drawing context. It must be destroyed before the drawable it draws into is freed.
class OI_XftDraw {
 public:
  OI_XftDraw() = default;
  OI_XftDraw(Display* d, Drawable where, Visual* v, Colormap cm) : draw_(XftDrawCreate(d, where, v, cm)) {}
  ~OI_XftDraw() { reset(); }
  OI_XftDraw(OI_XftDraw&& o) noexcept : draw_(std::exchange(o.draw_, nullptr)) {}
  OI_XftDraw& operator=(OI_XftDraw&& o) noexcept {
    if (this != &o) {
      reset();
      draw_ = std::exchange(o.draw_, nullptr);
    }
    return *this;
  }
  void reset() {
    if (draw_) XftDrawDestroy(draw_);
    draw_ = nullptr;
  }
  XftDraw* get() const { return draw_; }
  explicit operator bool() const { return draw_ != nullptr; }

 private:
  XftDraw* draw_ = nullptr;
};

class OI_Cursor {
 public:
  OI_Cursor() = default;
  OI_Cursor(Display* d, unsigned shape) : d_(d), c_(XCreateFontCursor(d, shape)) {}
  ~OI_Cursor() {
    if (c_ != None) XFreeCursor(d_, c_);
  }
  OI_Cursor(const OI_Cursor&) = delete;
  OI_Cursor& operator=(const OI_Cursor&) = delete;
  Cursor get() const { return c_; }

 private:
  Display* d_ = nullptr;
  Cursor c_ = None;
};

// Xft colours made from X pixels, allocated once each and freed together.
class OI_XftColorCache {
 public:
  OI_XftColorCache(Display* d, Visual* v, Colormap cm) : d_(d), v_(v), cm_(cm) {}
  ~OI_XftColorCache();
  OI_XftColorCache(const OI_XftColorCache&) = delete;
  OI_XftColorCache& operator=(const OI_XftColorCache&) = delete;
  const XftColor& get(unsigned long pixel);

 private:
  Display* d_;
  Visual* v_;
  Colormap cm_;
  std::map<unsigned long, XftColor> colors_;
};

// A pixel for a colour name ("red", "#4a6fa5"); `fallback` when the name does not convert.
unsigned long oiNamedPixel(Display* d, Colormap cm, const char* name, unsigned long fallback, bool* ok = nullptr);
