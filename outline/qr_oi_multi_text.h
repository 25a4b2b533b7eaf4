// The outline's text: the toolkit's multi-line text with a cover window that keeps the picture
// below a line still while rows change, and the start-up call that makes every scrolling text one.
#pragma once

#include <X11/Xlib.h>

#include <string>

#include "toolkit/oi_multi_text.h"

class QR_OI_MultiText : public OI_MultiText {
 public:
  QR_OI_MultiText(Widget parent, const std::string& name);
  ~QR_OI_MultiText() override;

  // Covers the text area from `line` down with a window that has no background, so that the
  // server leaves the old picture there; nothing is covered when that area is empty.
  void coverFrom(uint32_t line);
  // Takes the cover away; the uncovered area is then drawn in its new state.
  void uncover();
  bool covered() const { return covered_; }

 protected:
  void widgetDestroyed() override;

 private:
  Window cover_ = None;
  bool covered_ = false;
};

// Must run right after the toolkit is opened: from then on every scrolling text holds a
// QR_OI_MultiText.
void QR_OI_Init();
