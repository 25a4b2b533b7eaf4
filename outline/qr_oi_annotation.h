// The pictures of the outline's glyphs: one per annotation name, made on first use, from a
// pixmap resource, the annotation's own bitmap, or the built-in triangles, question mark and arrow.
#pragma once

#include <X11/Xlib.h>
#include <X11/Xresource.h>

#include <cstdint>
#include <string>
#include <vector>

#include "outline/qr_object.h"
#include "toolkit/oi_x_resources.h"

class QR_OI_Annotation : public QR_Object {
 public:
  enum Source { fromResource, fromBits, builtIn };
  QR_OI_Annotation(XrmQuark name, Source source, std::vector<unsigned char> bits, int width, int height,
                   std::vector<unsigned char> mask = {});

  XrmQuark name() const { return name_; }
  Source source() const { return source_; }
  // X bitmap bits (rows padded to bytes, least significant bit first), and an optional mask.
  const std::vector<unsigned char>& bits() const { return bits_; }
  const std::vector<unsigned char>& mask() const { return mask_; }
  int width() const { return width_; }
  int height() const { return height_; }
  // A pixmap of the window's depth taken from a resource file (the annotation keeps it).
  Pixmap pixmap() const { return pixmap_.get(); }
  void setPixmap(OI_Pixmap p, int width, int height);

 private:
  XrmQuark name_;
  Source source_;
  std::vector<unsigned char> bits_;
  std::vector<unsigned char> mask_;
  int width_, height_;
  OI_Pixmap pixmap_;
};

// The built-in pictures, as X bitmap bits.
namespace qr_glyphs {
// 11 x 11 solid triangle pointing right ("QR_OutlineExpand...").
std::vector<unsigned char> expandTriangle();
// 11 x 11 solid triangle pointing down ("QR_OutlineCollapse...").
std::vector<unsigned char> collapseTriangle();
// 11 x 11 question mark (any other name).
std::vector<unsigned char> questionMark();
// 13 x 13 arrow pointing right ("QR_OutlineHere"), and the filled arrow it is drawn through.
std::vector<unsigned char> hereArrow();
std::vector<unsigned char> hereArrowMask();
// The picture for a name when neither a resource nor the annotation gives one.
void builtInFor(const std::string& name, std::vector<unsigned char>& bits, std::vector<unsigned char>& mask,
                int& width, int& height);
}  // namespace qr_glyphs
