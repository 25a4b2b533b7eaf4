// A glyph request of an outline row: an action string placed at a line and column of the row.
#pragma once

#include <X11/Xresource.h>

#include <cstdint>

#include "outline/qr_object.h"

class QR_OutlineAnnotation : public QR_Object {
 public:
  // The bitmap bits are referenced, not copied: they are static glyph pictures of the client.
  QR_OutlineAnnotation(const char* action_string, std::uint32_t line, std::uint32_t column,
                       const unsigned char* bits = nullptr, std::uint32_t width = 0, std::uint32_t height = 0);
  ~QR_OutlineAnnotation() override;

  std::uint32_t line() const { return line_; }      // relative to the row's first line
  std::uint32_t column() const { return column_; }
  XrmQuark name() const { return name_; }
  // The action string the glyph performs when clicked.
  const char* name_text() const { return XrmQuarkToString(name_); }
  const unsigned char* bitmap_bits() const { return bits_; }
  std::uint32_t bitmap_width() const { return width_; }
  std::uint32_t bitmap_height() const { return height_; }

 private:
  std::uint32_t line_;
  std::uint32_t column_;
  XrmQuark name_;
  const unsigned char* bits_;
  std::uint32_t width_;
  std::uint32_t height_;
};
