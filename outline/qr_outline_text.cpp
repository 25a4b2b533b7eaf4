// Outline rows made of text lines.
#include "outline/qr_outline_text.h"

QR_OutlineText::QR_OutlineText() = default;

QR_OutlineText::QR_OutlineText(const char* text) { QR_OutlineText::append_line(text); }

QR_OutlineText::~QR_OutlineText() = default;

void QR_OutlineText::append_line(const char* text) {
  if (text == nullptr) return;
  const bool hidden_with_lines = line_count() == 0 && !lines_.empty();
  lines_.emplace_back(text);
  if (hidden_with_lines) {
    // A hidden row keeps the line for when it is shown again.
    set_saved_line_count(saved_line_count() + 1);
    return;
  }
  add_own_lines(1);
}

void QR_OutlineText::replace_line(const char* text, std::uint32_t index) {
  if (text == nullptr || index >= lines_.size()) return;
  lines_[index] = text;
  if (index < line_count()) draw_line(index);
}

const char* QR_OutlineText::line_text(std::uint32_t index) {
  return index < lines_.size() ? lines_[index].c_str() : nullptr;
}
