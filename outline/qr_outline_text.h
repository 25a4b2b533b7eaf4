// An outline row whose lines are strings it owns.
#pragma once

#include <cstdint>
#include <string>
#include <vector>

#include "outline/qr_outline_object.h"

class QR_OutlineText : public QR_OutlineObject {
 public:
  QR_OutlineText();
  // A row with one line.
  explicit QR_OutlineText(const char* text);
  ~QR_OutlineText() override;

  // Copies the text and adds it as the row's last line; a null text is ignored.
  virtual void append_line(const char* text);
  // Replaces the line at the index and redraws it; an index past the end is ignored.
  virtual void replace_line(const char* text, std::uint32_t index);

  // The text of a line, null past the end; valid until the row's lines change.
  const char* line_text(std::uint32_t index) override;
  std::uint32_t text_count() const { return static_cast<std::uint32_t>(lines_.size()); }

 private:
  std::vector<std::string> lines_;
};
