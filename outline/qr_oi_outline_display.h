// The outline drawn on a multi-line text: rows become indented lines with glyphs, keys and the
// mouse become outline actions, drags select whole subtrees, an update bracket keeps the screen
// still while rows change, and menu cells and buttons follow the actions the selection offers.
#pragma once

#include <X11/Intrinsic.h>

#include <cstdint>
#include <functional>
#include <map>
#include <memory>
#include <string>
#include <vector>

#include "outline/qr_oi_annotation.h"
#include "outline/qr_outline_display.h"
#include "toolkit/oi_application.h"

class OI_Glyph;
class OI_Menu;
class OI_ScrollText;
class OI_Widget;
class QR_OI_MultiText;
class QR_OutlineObject;

// A string highlighted wherever it appears in a line.
struct QR_OI_Enhancement {
  std::u32string text;
  unsigned long foreground = 0;
  unsigned long background = 0;
  uint8_t flags = 0;  // which of the two colours are set
};

// One glyph placed in the text for one annotation of a row.
struct QR_OI_GlyphAnnotation {
  QR_OutlineObject* row = nullptr;
  std::string name;
  uint32_t annotationColumn = 0;
  OI_Glyph* glyph = nullptr;
};

class QR_OI_OutlineDisplay : public QR_OutlineDisplay {
 public:
  static constexpr uint32_t maxColumnMarks = 100;

  // Draws into the text of `on` (the text inside a scrolling text, or the text itself). A text
  // that is not a QR_OI_MultiText ends the process with status 1 after saying why.
  explicit QR_OI_OutlineDisplay(OI_Widget* on);
  ~QR_OI_OutlineDisplay() override;

  QR_OI_MultiText* text() const { return text_; }

  // ---- The display interface
  void add_enhancement(const char* text, unsigned long foreground, unsigned long background) override;
  void add_column_mark(uint32_t column) override;
  void clear_column_marks() override;
  uint32_t column_mark_count() override { return static_cast<uint32_t>(marks_.size()); }
  uint32_t column_mark(uint32_t index) override { return index < marks_.size() ? marks_[index] : 0; }
  bool is_line_visible(uint32_t line) override;
  void insert_lines(uint32_t first, uint32_t count) override;
  void delete_lines(uint32_t first, uint32_t count) override;
  void begin_update() override;
  uint32_t glyph_column(uint32_t depth) override { return 3 * depth; }
  void show_line(uint32_t line) override;
  void make_visible(QR_OutlineObject* row) override;
  void to_top(QR_OutlineObject* row) override;
  void before_row_action(QR_OutlineObject* row, const char* name) override;
  void after_row_action(QR_OutlineObject* row, const char* name) override;
  void annotation_removed(QR_OutlineObject* row, QR_OutlineAnnotation* annotation) override;
  void row_selected(QR_OutlineObject* row) override;
  void row_deselected(QR_OutlineObject* row) override;
  void row_changed(QR_OutlineObject* row) override;
  void begin_action(const char* name) override;
  void end_action(const char* name) override;
  void set_line(uint32_t depth, uint32_t line, const char* text, QR_OutlineObject* row) override;
  void set_tab_stops(uint32_t width) override { tabWidth_ = width == 0 ? 8 : width; }
  uint32_t text_column(uint32_t depth) override { return 3 * depth + 3; }
  void end_update() override;
  void actions_changed() override;
  void set_root(QR_OutlineRoot* root) override;
  void linked_object_destroyed(QR_Object* gone) override;

  uint32_t tab_width() const { return tabWidth_; }

  // A double click on a row (for example: open what the row stands for).
  std::function<void(QR_OutlineObject*)> onActivate;
  int update_depth() const { return updateDepth_; }

  // ---- Controlled widgets: menus, popup menus and toolbars whose cells and buttons are named
  // by action strings; each is enabled exactly when the root offers its action.
  void add_controlled_widget(Widget w);
  void remove_controlled_widget(Widget w);
  // The availability pass, at once (the 10 ms time-out runs it too).
  void update_controlled_widgets();

  // ---- What the toolkit actions do (public for the action procedures).
  void mousePress(XEvent* ev);
  void selectMotion(XEvent* ev);
  void selectRelease(XEvent* ev);
  void performActions(const std::vector<std::string>& actionStrings);
  static QR_OI_OutlineDisplay* forWidget(Widget w);
  // The action procedures of outline texts, registered once per application.
  static void registerActions();
  static const char* translations();

 private:
  void readResources(OI_Widget* on);
  void installDefaultResources();
  void openBracket(uint32_t line);
  void closeBracket();
  void removeGlyphs(QR_OutlineObject* row);
  OI_Glyph* makeGlyph(QR_OutlineAnnotation* a, uint32_t line, uint32_t col);
  QR_OI_Annotation* annotationImage(QR_OutlineAnnotation* a);
  void glyphPressed(OI_Glyph& glyph, XEvent* ev);
  void popupGlyphMenu(QR_OutlineObject* row, const std::string& glyphName, XEvent* ev);
  void selectTextFromRows();
  void rebuildRowsFromText();
  static bool changesExpansion(QR_OutlineObject* row, const std::string& name);

  QR_OI_MultiText* text_ = nullptr;
  OI_ScrollText* scroll_ = nullptr;
  uint32_t tabWidth_ = 8;
  std::vector<uint32_t> marks_;
  std::u32string composed_;  // set_line's working buffer
  std::vector<QR_OI_Enhancement> enhancements_;
  std::map<XrmQuark, std::unique_ptr<QR_OI_Annotation>> images_;
  // Keyed by the row as a QR_Object, so that a row's end (heard as a QR_Object) finds its glyphs.
  std::multimap<const QR_Object*, QR_OI_GlyphAnnotation> glyphs_;
  bool autoSelect_ = false;

  int updateDepth_ = 0;
  std::vector<bool> rowBrackets_;  // per before_row_action: whether it opened a bracket
  int busy_ = 0;

  std::vector<Widget> controlled_;
  OI_TimerHandle actionsTimer_;

  // Mouse state.
  uint32_t pressLine_ = 0;
  uint32_t pressDepth_ = 0;
  int clicks_ = 0;
  Time pressTime_ = 0;
  bool pressed_ = false;
  bool dragged_ = false;
  bool rebuilding_ = false;

  std::map<std::string, OI_Menu*> glyphMenus_;
  std::vector<std::unique_ptr<OI_Menu>> ownedMenus_;
  QR_OutlineObject* menuRow_ = nullptr;
  const QR_Object* menuRowKey_ = nullptr;  // the same row, for comparing once it is going
};
