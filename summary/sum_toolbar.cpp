// Toolbar buttons and their icons, drawn once into X bitmaps.
#include "summary/sum_toolbar.h"

#include <cstdlib>
#include <memory>

namespace {

// A 32 x 32 one-bit picture drawn with a few strokes.
struct Canvas {
  bool px[32][32] = {};
  void set(int x, int y) {
    if (x >= 0 && x < 32 && y >= 0 && y < 32) px[y][x] = true;
  }
  void hline(int x0, int x1, int y) {
    for (int x = x0; x <= x1; ++x) set(x, y);
  }
  void vline(int x, int y0, int y1) {
    for (int y = y0; y <= y1; ++y) set(x, y);
  }
  void rect(int x0, int y0, int x1, int y1) {
    hline(x0, x1, y0);
    hline(x0, x1, y1);
    vline(x0, y0, y1);
    vline(x1, y0, y1);
  }
  void fill(int x0, int y0, int x1, int y1) {
    for (int y = y0; y <= y1; ++y) hline(x0, x1, y);
  }
  // Arrow heads: a filled triangle pointing down, up, right or left from its tip.
  void headDown(int cx, int tipY, int size) {
    for (int i = 0; i < size; ++i) hline(cx - i, cx + i, tipY - i);
  }
  void headUp(int cx, int tipY, int size) {
    for (int i = 0; i < size; ++i) hline(cx - i, cx + i, tipY + i);
  }
  void headRight(int tipX, int cy, int size) {
    for (int i = 0; i < size; ++i) vline(tipX - i, cy - i, cy + i);
  }
  void headLeft(int tipX, int cy, int size) {
    for (int i = 0; i < size; ++i) vline(tipX + i, cy - i, cy + i);
  }
  // A question mark in a 7 x 11 box at (x, y).
  void question(int x, int y) {
    hline(x + 1, x + 5, y);
    set(x, y + 1), set(x + 6, y + 1);
    set(x, y + 2), set(x + 6, y + 2);
    set(x + 6, y + 3);
    set(x + 5, y + 4);
    set(x + 4, y + 5);
    vline(x + 3, y + 6, y + 7);
    vline(x + 3, y + 9, y + 10);
  }
  std::vector<unsigned char> bits() const {
    std::vector<unsigned char> out(32 * 4, 0);
    for (int y = 0; y < 32; ++y)
      for (int x = 0; x < 32; ++x)
        if (px[y][x]) out[static_cast<size_t>(y * 4 + x / 8)] |= static_cast<unsigned char>(1u << (x % 8));
    return out;
  }
};

// Lines of a list: top-level rows at the left, the rows under them indented.
void listLines(Canvas& c) {
  c.hline(3, 16, 5);
  c.hline(12, 28, 11);
  c.hline(12, 28, 16);
  c.hline(12, 28, 21);
  c.hline(3, 16, 27);
}

}  // namespace

std::vector<unsigned char> kgToolbarIcon(const std::string& name) {
  Canvas c;
  if (name == "QR_OutlineNext") {
    c.fill(14, 3, 17, 18);
    c.headDown(15, 28, 10);
    c.headDown(16, 28, 10);
  } else if (name == "QR_OutlinePrevious") {
    c.fill(14, 13, 17, 28);
    c.headUp(15, 3, 10);
    c.headUp(16, 3, 10);
  } else if (name == "QR_OutlineExpand" || name == "QR_OutlineExpand,QR_OutlineMakeVisible") {
    listLines(c);
    c.fill(2, 15, 6, 17);
    c.headRight(10, 16, 5);
  } else if (name == "QR_OutlineCollapse") {
    listLines(c);
    c.fill(5, 15, 9, 17);
    c.headLeft(1, 16, 5);
  } else if (name == "KG_ScrollToFunction") {
    c.rect(2, 1, 29, 30);
    for (int row = 0; row < 6; ++row) {
      const int y = 5 + row * 4;
      c.hline(5, 7, y);  // the line number
      c.hline(11 + (row % 3) * 3, 26 - row, y);
    }
    c.vline(9, 3, 28);
  } else if (name == "kgStartCRMS") {
    // A form with a large exclamation mark: a change request.
    c.rect(4, 2, 27, 29);
    c.hline(7, 24, 6);
    c.fill(14, 10, 17, 21);
    c.fill(14, 24, 17, 26);
  } else {
    c.question(2, 10);
    c.question(12, 10);
    c.question(22, 10);
  }
  return c.bits();
}

std::vector<std::string> kgToolbarEntries(const std::string& buttons) {
  std::vector<std::string> out;
  std::string cur;
  for (char ch : buttons + ":") {
    if (ch == ':') {
      std::size_t a = cur.find_first_not_of(" \t");
      std::size_t b = cur.find_last_not_of(" \t");
      if (a != std::string::npos) out.push_back(cur.substr(a, b - a + 1));
      cur.clear();
    } else {
      cur += ch;
    }
  }
  return out;
}

namespace {

// The tip of a button: the label of the menu entry that does the same.
std::string toolTipFor(const std::string& action) {
  static const char* const labels[][2] = {
      {"QR_OutlineNext", "Next"},
      {"QR_OutlinePrevious", "Previous"},
      {"QR_OutlineExpand,QR_OutlineMakeVisible", "Expand"},
      {"QR_OutlineExpand", "Expand"},
      {"QR_OutlineExpandAll", "Expand all"},
      {"QR_OutlineCollapse", "Collapse"},
      {"QR_OutlineCollapseAll", "Collapse all"},
      {"KG_ScrollToFunction", "Show annotated source"},
      {"kgStartCRMS", "File a Change Request"},
  };
  for (const auto& l : labels)
    if (action == l[0]) return l[1];
  return action;
}

}  // namespace

KG_Toolbar::KG_Toolbar(Widget parent, std::function<void(const std::string&)> perform)
    : OI_Box(parent, "toolbar", OI_Box::horizontal) {
  std::string buttonList = resourceString("buttons", "Buttons");
  if (buttonList.empty()) buttonList = kDefaultToolbarButtons;
  for (const std::string& name : kgToolbarEntries(buttonList)) {
    auto b = std::make_unique<OI_Button>(widget(), name, name, [perform, name] { perform(name); });
    const std::vector<unsigned char> bits = kgToolbarIcon(name);
    b->setIcon(bits.data(), 32, 32);
    const std::string bevel = b->resourceString("bevelWidth", "BevelWidth");
    if (!bevel.empty()) b->setBevelWidth(std::atoi(bevel.c_str()));
    b->setToolTip(toolTipFor(name));
    buttons_.push_back(own(std::move(b)));
  }
}

OI_Button* KG_Toolbar::button(const std::string& name) const {
  for (OI_Button* b : buttons_)
    if (b->name() == name) return b;
  return nullptr;
}
