// Scrolling texts that take their bars from the surrounding box, and the box that lays such texts
// out on a grid of 3 x 3 blocks so that texts sharing a bar scroll together.
#pragma once

#include <string>
#include <vector>

#include "toolkit/oi_scroll_text.h"

class OI_ScrollBar;

class QR_OI_ScrollText : public OI_ScrollText {
 public:
  QR_OI_ScrollText(Widget parent, const std::string& name);
  // Attaches the parent's children named "QR_top_sb", "QR_bottom_sb", "QR_left_sb" and
  // "QR_right_sb" as this text's bars of those sides, then lays out.
  void layout() override;
};

class QR_OI_ScrollTextGang : public OI_GridBox {
 public:
  QR_OI_ScrollTextGang(Widget parent, const std::string& name);
  ~QR_OI_ScrollTextGang() override;

  // A text in column `col` and row `row` of the gang: it sits at (3col+1, 3row+1).
  QR_OI_ScrollText* addText(const std::string& name, int col, int row, bool stretchX = true, bool stretchY = true);
  // The same with a text of a derived kind, made by the caller with this gang's widget as parent.
  QR_OI_ScrollText* addText(std::unique_ptr<QR_OI_ScrollText> text, int col, int row, bool stretchX = true,
                            bool stretchY = true);
  // A bar shared by every text of the gang on that side, placed beside the text at (col, row);
  // it is named "QR_top_sb", "QR_bottom_sb", "QR_left_sb" or "QR_right_sb".
  OI_ScrollBar* addSharedBar(OI_Side side, int col, int row);
  const std::vector<QR_OI_ScrollText*>& texts() const { return texts_; }
  void layout() override;

  static const char* barName(OI_Side side);

 private:
  std::vector<QR_OI_ScrollText*> texts_;
};
