// The four panes of the annotated source window: line numbers, adjustment letters, counts and
// source. Each draws its lines from the window's model when they come into view, with a
// one-line title above it that is placed and hidden with it.
#pragma once

#include <cstdint>
#include <string>
#include <vector>

#include "outline/qr_oi_scroll_text.h"
#include "source_view/kg_detail_model.h"
#include "toolkit/oi_text_model.h"

class OI_Label;

// The library's scrolling text; nothing more than its own destructor.
class KG_OI_ScrollText : public QR_OI_ScrollText {
 public:
  KG_OI_ScrollText(Widget parent, const std::string& name);
  ~KG_OI_ScrollText() override;
};

// A foreground and background pixel, and the attribute that draws them in the pane's text.
struct KG_ColorPair {
  unsigned long fg = 0;
  unsigned long bg = 0;
  OI_CharAttr attr;
};

class KG_AnnotationPane : public KG_OI_ScrollText, public OI_LineSupplier {
 public:
  // The title label is made by the window beside the pane, in the gang.
  KG_AnnotationPane(Widget gang, const std::string& name, const KG_DetailModel& model, OI_Label* title);
  ~KG_AnnotationPane() override;

  // The text's normal colours (and in the panes below, the colours of their highlights).
  virtual void initColors();
  // OI_LineSupplier: the pane shows one line per text line of the model.
  uint32_t lineCount() const override;
  virtual uint32_t visibleLineCount() const;
  // 1-based.
  virtual uint32_t firstVisibleLine() const;
  uint32_t maxLineLength() const override { return width_; }

  // Shown and hidden together with the title.
  void setShown(bool on);
  bool shown() const;
  OI_Label* titleLabel() const { return title_; }

  // A colour resource's value: "reverse" swaps the normal colours, "default" keeps them, anything
  // else is a colour name (an unknown name keeps the normal colour).
  KG_ColorPair resolve(const std::string& foreground, const std::string& background);

 protected:
  // Attributes of `length` characters in the colours, for supplyAttrs.
  static void paint(std::vector<OI_CharAttr>& attrs, uint32_t length, const KG_ColorPair& colors);

  const KG_DetailModel& model_;
  OI_Label* title_ = nullptr;
  KG_ColorPair normal_;
  uint32_t width_ = 1;  // the longest line, in characters
};

// The source pane and the counts pane: the lines coloured by their highlight.
class KG_SrcPane : public KG_AnnotationPane {
 public:
  enum class Shows { source, counts };
  KG_SrcPane(Widget gang, const std::string& name, const KG_DetailModel& model, OI_Label* title, Shows shows);
  void initColors() override;
  void supplyLine(uint32_t line, std::u32string& chars) const override;
  void supplyAttrs(uint32_t line, std::vector<OI_CharAttr>& attrs) const override;
  // The model's text changed length (load, edit).
  void measure();
  KG_ColorPair colorsOf(KG_LineHighlight h) const;

 private:
  Shows shows_;
  // used, unused, deadcode, tested, inspected
  KG_ColorPair colors_[5];
  mutable uint32_t lastLine_ = UINT32_MAX;
  mutable uint32_t lastLength_ = 0;
};

class KG_LineNumbers : public KG_AnnotationPane {
 public:
  KG_LineNumbers(Widget gang, const std::string& name, const KG_DetailModel& model, OI_Label* title,
                 const KG_SrcPane& source);
  uint32_t visibleLineCount() const override;
  uint32_t firstVisibleLine() const override;
  void supplyLine(uint32_t line, std::u32string& chars) const override;
  void supplyAttrs(uint32_t line, std::vector<OI_CharAttr>& attrs) const override;
  // 1-based; 0 for none. The line is painted in reverse.
  uint32_t currentLine() const { return current_; }
  void setCurrentLine(uint32_t line);

 private:
  const KG_SrcPane& source_;
  uint32_t current_ = 0;
};

class KG_AdjustmentsPane : public KG_AnnotationPane {
 public:
  KG_AdjustmentsPane(Widget gang, const std::string& name, const KG_DetailModel& model, OI_Label* title);
  void initColors() override;
  void supplyLine(uint32_t line, std::u32string& chars) const override;
  void supplyAttrs(uint32_t line, std::vector<OI_CharAttr>& attrs) const override;
  virtual std::string markerText(std::uint32_t flags) const;
  // Whether the line is painted as a dubious adjustment.
  virtual bool markLine(uint32_t index) const;

 private:
  KG_ColorPair dubious_;
};
