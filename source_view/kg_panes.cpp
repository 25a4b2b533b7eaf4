// The panes of the annotated source window, drawing their lines from the window's model.
#include "source_view/kg_panes.h"

#include <algorithm>
#include <cstdio>

#include "settings/resource_table.h"
#include "toolkit/oi_controls.h"
#include "toolkit/oi_multi_text.h"

namespace {

void appendAscii(const std::string& text, std::u32string& out) {
  for (char c : text) out.push_back(static_cast<unsigned char>(c));
}

}  // namespace

KG_OI_ScrollText::KG_OI_ScrollText(Widget parent, const std::string& name) : QR_OI_ScrollText(parent, name) {}

KG_OI_ScrollText::~KG_OI_ScrollText() = default;

// ---- KG_AnnotationPane

KG_AnnotationPane::KG_AnnotationPane(Widget gang, const std::string& name, const KG_DetailModel& model,
                                     OI_Label* title)
    : KG_OI_ScrollText(gang, name), model_(model), title_(title) {}

KG_AnnotationPane::~KG_AnnotationPane() {
  // The text must not ask a supplier that is going away.
  if (text()) text()->setLineSupplier(nullptr);
}

void KG_AnnotationPane::initColors() {
  normal_.fg = text()->foreground();
  normal_.bg = text()->background();
  normal_.attr.flags = OI_attrForeground | OI_attrBackground;
  normal_.attr.fg = text()->colorIndexFor(normal_.fg);
  normal_.attr.bg = text()->colorIndexFor(normal_.bg);
}

uint32_t KG_AnnotationPane::lineCount() const { return model_.lineCount(); }

uint32_t KG_AnnotationPane::visibleLineCount() const { return text()->visibleLines(); }

uint32_t KG_AnnotationPane::firstVisibleLine() const { return text()->topLine() + 1; }

void KG_AnnotationPane::setShown(bool on) {
  if (on) {
    if (title_) title_->manage();
    manage();
  } else {
    if (title_) title_->unmanage();
    unmanage();
  }
}

bool KG_AnnotationPane::shown() const { return isManaged(); }

KG_ColorPair KG_AnnotationPane::resolve(const std::string& foreground, const std::string& background) {
  auto one = [&](const std::string& value, bool isForeground) {
    if (value == "reverse") return isForeground ? normal_.bg : normal_.fg;
    if (value == "default" || value.empty()) return isForeground ? normal_.fg : normal_.bg;
    bool ok = false;
    unsigned long pixel = text()->namedColor(value.c_str(), &ok);
    return ok ? pixel : (isForeground ? normal_.fg : normal_.bg);
  };
  KG_ColorPair p;
  p.fg = one(foreground, true);
  p.bg = one(background, false);
  p.attr.flags = OI_attrForeground | OI_attrBackground;
  p.attr.fg = text()->colorIndexFor(p.fg);
  p.attr.bg = text()->colorIndexFor(p.bg);
  return p;
}

void KG_AnnotationPane::paint(std::vector<OI_CharAttr>& attrs, uint32_t length, const KG_ColorPair& colors) {
  attrs.assign(length, colors.attr);
}

// ---- KG_SrcPane

KG_SrcPane::KG_SrcPane(Widget gang, const std::string& name, const KG_DetailModel& model, OI_Label* title,
                       Shows shows)
    : KG_AnnotationPane(gang, name, model, title), shows_(shows) {
  width_ = shows == Shows::counts ? 4 : 1;
}

void KG_SrcPane::initColors() {
  KG_AnnotationPane::initColors();
  const KG_Settings& s = kgSettings();
  colors_[0] = resolve(s.usedLineForeground.value, s.usedLineBackground.value);
  colors_[1] = resolve(s.unusedLineForeground.value, s.unusedLineBackground.value);
  colors_[2] = resolve(s.deadcodeLineForeground.value, s.deadcodeLineBackground.value);
  colors_[3] = resolve(s.testedLineForeground.value, s.testedLineBackground.value);
  colors_[4] = resolve(s.inspectedLineForeground.value, s.inspectedLineBackground.value);
}

KG_ColorPair KG_SrcPane::colorsOf(KG_LineHighlight h) const {
  switch (h) {
    case KG_LineHighlight::used: return colors_[0];
    case KG_LineHighlight::unused: return colors_[1];
    case KG_LineHighlight::deadcode: return colors_[2];
    case KG_LineHighlight::tested: return colors_[3];
    case KG_LineHighlight::inspected: return colors_[4];
    case KG_LineHighlight::none: break;
  }
  return normal_;
}

void KG_SrcPane::measure() {
  width_ = shows_ == Shows::counts ? 4 : static_cast<uint32_t>(model_.longestDisplayLine());
  lastLine_ = UINT32_MAX;
}

void KG_SrcPane::supplyLine(uint32_t line, std::u32string& chars) const {
  if (shows_ == Shows::counts) {
    appendAscii(model_.countCell(line), chars);
  } else {
    oiDecodeUtf8Append(model_.displayLine(line), chars);
  }
  lastLine_ = line;
  lastLength_ = static_cast<uint32_t>(chars.size());
}

void KG_SrcPane::supplyAttrs(uint32_t line, std::vector<OI_CharAttr>& attrs) const {
  attrs.clear();
  const KG_LineHighlight h = model_.highlight(line);
  if (h == KG_LineHighlight::none) return;
  if (lastLine_ != line) {
    std::u32string chars;
    supplyLine(line, chars);
  }
  paint(attrs, std::min<uint32_t>(lastLength_, static_cast<uint32_t>(kDisplayLineLimit)), colorsOf(h));
}

// ---- KG_LineNumbers

KG_LineNumbers::KG_LineNumbers(Widget gang, const std::string& name, const KG_DetailModel& model,
                               OI_Label* title, const KG_SrcPane& source)
    : KG_AnnotationPane(gang, name, model, title), source_(source) {
  width_ = 5;
}

uint32_t KG_LineNumbers::visibleLineCount() const { return source_.visibleLineCount(); }

uint32_t KG_LineNumbers::firstVisibleLine() const { return source_.firstVisibleLine(); }

void KG_LineNumbers::supplyLine(uint32_t line, std::u32string& chars) const {
  char buf[16];
  snprintf(buf, sizeof buf, "%5u", line + 1);
  appendAscii(buf, chars);
}

void KG_LineNumbers::supplyAttrs(uint32_t line, std::vector<OI_CharAttr>& attrs) const {
  attrs.clear();
  if (current_ == 0 || line + 1 != current_) return;
  KG_ColorPair reversed = normal_;
  std::swap(reversed.attr.fg, reversed.attr.bg);
  char buf[16];
  paint(attrs, static_cast<uint32_t>(snprintf(buf, sizeof buf, "%5u", line + 1)), reversed);
}

void KG_LineNumbers::setCurrentLine(uint32_t line) {
  const uint32_t previous = current_;
  current_ = line;
  if (previous != 0) text()->linesChanged(previous - 1, previous - 1);
  if (line != 0) text()->linesChanged(line - 1, line - 1);
}

// ---- KG_AdjustmentsPane

KG_AdjustmentsPane::KG_AdjustmentsPane(Widget gang, const std::string& name, const KG_DetailModel& model,
                                       OI_Label* title)
    : KG_AnnotationPane(gang, name, model, title) {
  width_ = 5;
}

void KG_AdjustmentsPane::initColors() {
  KG_AnnotationPane::initColors();
  const KG_Settings& s = kgSettings();
  dubious_ = resolve(s.dubiousAdjustmentForeground.value, s.dubiousAdjustmentBackground.value);
}

std::string KG_AdjustmentsPane::markerText(std::uint32_t flags) const { return kgMarkerText(flags); }

bool KG_AdjustmentsPane::markLine(uint32_t index) const {
  return kgSettings().highlightDubiousAdjustments.value && model_.dubious(index);
}

void KG_AdjustmentsPane::supplyLine(uint32_t line, std::u32string& chars) const {
  if (const LineState* s = model_.lineState(line)) appendAscii(markerText(s->flags), chars);
}

void KG_AdjustmentsPane::supplyAttrs(uint32_t line, std::vector<OI_CharAttr>& attrs) const {
  attrs.clear();
  if (markLine(line)) paint(attrs, 5, dubious_);
}
