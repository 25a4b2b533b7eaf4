// The main window's toolbar: one button per action string of its "buttons" resource, each with
// a built-in 32 x 32 icon.
#pragma once

#include <X11/Intrinsic.h>

#include <cstdint>
#include <functional>
#include <string>
#include <vector>

#include "toolkit/oi_controls.h"

constexpr const char* kDefaultToolbarButtons =
    "QR_OutlineNext:QR_OutlinePrevious:QR_OutlineExpand,QR_OutlineMakeVisible:QR_OutlineCollapse:"
    "KG_ScrollToFunction:kgStartCRMS";

// The built-in icon of a button name; three question marks for names without one.
std::vector<unsigned char> kgToolbarIcon(const std::string& name);
// The entries of a "buttons" value: colon-separated, empty ones skipped.
std::vector<std::string> kgToolbarEntries(const std::string& buttons);

class KG_Toolbar : public OI_Box {
 public:
  // `perform` is called with the button's action string when it is pressed.
  KG_Toolbar(Widget parent, std::function<void(const std::string&)> perform);
  const std::vector<OI_Button*>& buttons() const { return buttons_; }
  OI_Button* button(const std::string& name) const;

 private:
  std::vector<OI_Button*> buttons_;
};
