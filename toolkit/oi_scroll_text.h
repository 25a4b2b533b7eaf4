// A multi-line text with its scroll bars; a bar of any side can be replaced by one shared with
// other texts, so that they scroll together.
#pragma once

#include <functional>
#include <memory>
#include <string>

#include "toolkit/oi_grid_box.h"

class OI_MultiText;
class OI_ScrollBar;

enum class OI_Side { top, bottom, left, right };

class OI_ScrollText : public OI_GridBox {
 public:
  // The container is named `name` + "Scroll"; the text inside it is named `name`, so that
  // resource lines such as "*kgOutline.rows: 40" reach the text.
  OI_ScrollText(Widget parent, const std::string& name);
  ~OI_ScrollText() override;

  OI_MultiText* text() const { return text_; }
  // The bar of a side: the shared one attached for that side, else the text's own bar of that
  // orientation.
  OI_ScrollBar* scrollBar(OI_Side side) const;
  // By layout name: "@top_scroll_bar", "@bottom_scroll_bar", "@left_scroll_bar", "@right_scroll_bar".
  OI_ScrollBar* scrollBar(const std::string& layoutName) const;
  // Makes a bar outside this container the one of that side; the own bar of the same direction
  // steps aside.
  void attachSharedBar(OI_Side side, OI_ScrollBar* bar);
  void setDynamicScrollBars(bool on);

  // How texts are made: QR_OI_Init puts its own maker here, so that every scrolling text holds the
  // outline's kind of text.
  using TextMaker = std::function<std::unique_ptr<OI_MultiText>(Widget parent, const std::string& name)>;
  static void setTextMaker(TextMaker maker);

 private:
  OI_MultiText* text_ = nullptr;
  OI_ScrollBar* ownV_ = nullptr;
  OI_ScrollBar* ownH_ = nullptr;
  OI_ScrollBar* shared_[4] = {nullptr, nullptr, nullptr, nullptr};
};
