// A scroll bar that one or more texts follow: moving it scrolls every text attached to it.
#pragma once

#include <functional>
#include <string>
#include <vector>

#include "toolkit/oi_widget.h"

class OI_MultiText;

class OI_ScrollBar : public OI_Widget {
 public:
  OI_ScrollBar(Widget parent, const std::string& name, bool vertical);
  ~OI_ScrollBar() override;

  bool vertical() const { return vertical_; }
  void attach(OI_MultiText* text);
  // `refresh` false while things are being destroyed: no range update, no layout.
  void detach(OI_MultiText* text, bool refresh = true);
  const std::vector<OI_MultiText*>& texts() const { return texts_; }

  // Hidden while every text fits (when dynamic).
  void setDynamic(bool on);
  bool dynamic() const { return dynamic_; }
  // Recomputes the range from the texts and shows or hides the bar.
  void update();
  int value() const;
  // Moves the bar and every text with it.
  void setValue(int value);
  // One of the texts scrolled by itself (keys, wheel): the bar and the other texts follow.
  void textScrolled(OI_MultiText* text);

  // Called after the bar was shown or hidden, so that the container lays out again.
  std::function<void()> onShownChanged;

  void describe(std::ostream& out) const override;

 protected:
  void widgetDestroyed() override;

 private:
  static void movedCB(Widget, XtPointer, XtPointer);
  void scrollTexts(int value);
  bool vertical_;
  bool dynamic_ = true;
  bool updating_ = false;
  std::vector<OI_MultiText*> texts_;
};
