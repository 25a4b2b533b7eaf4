// The pictures of the outline's glyphs.
#include "outline/qr_oi_annotation.h"

#include <cstdlib>
#include <utility>

namespace {

// Bitmap bits from rows of '#' and '.'.
std::vector<unsigned char> fromRows(const std::vector<const char*>& rows, int width) {
  int stride = (width + 7) / 8;
  std::vector<unsigned char> bits(static_cast<size_t>(stride) * rows.size(), 0);
  for (size_t y = 0; y < rows.size(); ++y)
    for (int x = 0; x < width && rows[y][x]; ++x)
      if (rows[y][x] == '#') bits[y * static_cast<size_t>(stride) + static_cast<size_t>(x / 8)] |= 1u << (x % 8);
  return bits;
}

}  // namespace

namespace qr_glyphs {

std::vector<unsigned char> expandTriangle() {
  return fromRows({"..#........", "..##.......", "..###......", "..####.....", "..#####....", "..######...",
                   "..#####....", "..####.....", "..###......", "..##.......", "..#........"},
                  11);
}

std::vector<unsigned char> collapseTriangle() {
  return fromRows({"...........", "...........", "###########", ".#########.", "..#######..", "...#####...",
                   "....###....", ".....#.....", "...........", "...........", "..........."},
                  11);
}

std::vector<unsigned char> questionMark() {
  return fromRows({"...####....", "..##..##...", "..##..##...", "......##...", ".....##....", "....##.....",
                   "....##.....", "...........", "....##.....", "....##.....", "..........."},
                  11);
}

std::vector<unsigned char> hereArrow() {
  return fromRows({".............", "......#......", "......##.....", "......#.#....", "#######..#...",
                   "#.........#..", "#..........#.", "#.........#..", "#######..#...", "......#.#....",
                   "......##.....", "......#......", "............."},
                  13);
}

std::vector<unsigned char> hereArrowMask() {
  return fromRows({".............", "......#......", "......##.....", "......###....", "##########...",
                   "###########..", "############.", "###########..", "##########...", "......###....",
                   "......##.....", "......#......", "............."},
                  13);
}

void builtInFor(const std::string& name, std::vector<unsigned char>& bits, std::vector<unsigned char>& mask,
                int& width, int& height) {
  mask.clear();
  width = height = 11;
  if (name.rfind("QR_OutlineExpand", 0) == 0) {
    bits = expandTriangle();
  } else if (name.rfind("QR_OutlineCollapse", 0) == 0) {
    bits = collapseTriangle();
  } else if (name == "QR_OutlineHere") {
    bits = hereArrow();
    mask = hereArrowMask();
    width = height = 13;
  } else {
    bits = questionMark();
  }
}

}  // namespace qr_glyphs

QR_OI_Annotation::QR_OI_Annotation(XrmQuark name, Source source, std::vector<unsigned char> bits, int width,
                                   int height, std::vector<unsigned char> mask)
    : name_(name), source_(source), bits_(std::move(bits)), mask_(std::move(mask)), width_(width), height_(height) {}

void QR_OI_Annotation::setPixmap(OI_Pixmap p, int width, int height) {
  pixmap_ = std::move(p);
  width_ = width;
  height_ = height;
}
