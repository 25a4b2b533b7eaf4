// One row of an outline: expansion state, lines, annotations, navigation and drawing.
#pragma once

#include <cstdint>
#include <memory>

#include "outline/qr_family_object.h"
#include "outline/qr_outline_annotation.h"
#include "outline/qr_pointer_array.h"

class QR_OutlineRoot;
class QR_OutlineDisplay;

// Rows hold only rows as children: an outline row's children are outline rows.
class QR_OutlineObject : public QR_FamilyObject {
 public:
  enum : std::uint32_t {
    kSelected = 1,
    kExpanded = 2,
    kExpandable = 4,   // collapsed, with the expand actions attached
    kCollapsible = 8,  // expanded, with the collapse actions attached
  };
  static constexpr std::uint32_t kNoLine = 0xFFFFFFFFu;

  QR_OutlineObject();
  // A row still in an outline leaves it first (its lines go from the display), then its
  // children are destroyed.
  ~QR_OutlineObject() override;

  virtual void collapse();
  virtual void collapse_all();
  virtual void collapse_children();
  virtual void expand();
  virtual void expand_all();
  virtual void expand_collapse();
  virtual void select_first();
  virtual void hide();
  virtual void select_last();
  virtual void make_visible();
  virtual void select_next();
  virtual void select_next_same_level();
  virtual void select_previous();
  virtual void select_previous_same_level();
  virtual void to_top();
  virtual void show();
  virtual const char* line_text(std::uint32_t index);
  virtual QR_OutlineObject* object_at_line(std::uint32_t line);
  virtual std::uint32_t depth();
  virtual void draw();
  virtual void draw_line(std::uint32_t index);
  virtual void undisplay();
  virtual bool can_expand_further();
  virtual bool is_root();

  // Hooks of the family and action layers.
  void before_action(const char* name) override;
  void after_action(const char* name) override;
  void detaching_from_parent(QR_FamilyObject* parent) override;
  void child_added(QR_FamilyObject* child) override;
  void child_removed(QR_FamilyObject* child) override;

  // "QR_OutlineSelect": selects the row alone when it is selectable.
  void select();
  // Collapsed with the expand actions, the select actions and the expand glyph.
  void make_expandable();
  // No expansion actions and no expansion glyph.
  void make_leaf();
  void make_selectable();
  // At most one annotation per (line, column): a new one replaces the old.
  void put_annotation(const char* action_string, std::uint32_t line, std::uint32_t column,
                      const unsigned char* bits = nullptr, std::uint32_t width = 0, std::uint32_t height = 0);
  void remove_annotation(std::uint32_t line, std::uint32_t column);
  QR_OutlineAnnotation* annotation_at(std::uint32_t line, std::uint32_t column) const;
  const QR_PointerArray<QR_OutlineAnnotation>* annotations() const { return annotations_.get(); }

  std::uint32_t flags() const { return flags_; }
  bool is_selected() const { return (flags_ & kSelected) != 0; }
  bool is_expanded() const { return (flags_ & kExpanded) != 0; }
  bool is_expandable_or_collapsible() const { return (flags_ & (kExpandable | kCollapsible)) != 0; }
  std::uint32_t line_count() const { return line_count_; }
  std::uint32_t saved_line_count() const { return saved_line_count_; }
  // The display line of the row's first line, kNoLine while the row is not displayed.
  std::uint32_t first_line();
  // Own lines plus, when expanded, the visible lines of every child.
  std::uint32_t visible_line_count();
  bool is_displayed();
  bool is_selectable();
  QR_OutlineRoot* root();
  QR_OutlineDisplay* display();

  QR_OutlineObject* parent_row() const;
  QR_OutlineObject* child_row(std::uint32_t index) const;
  // Display order: the next row (into the children only from this row), the previous row.
  QR_OutlineObject* next_row();
  QR_OutlineObject* previous_row();
  QR_OutlineObject* next_selectable_row();
  QR_OutlineObject* previous_selectable_row();
  // The last row of this row's visible subtree (the row itself when collapsed).
  QR_OutlineObject* last_visible_descendant();

 protected:
  // A row whose own lines grew by count at its end: the display opens and draws them.
  void add_own_lines(std::uint32_t count);
  void set_saved_line_count(std::uint32_t count) { saved_line_count_ = count; }
  // The root's update bracket ended or a change outside one is complete: numbering is
  // brought up to date and the available actions are recomputed.
  void finish_change();

 private:
  friend class QR_OutlineRoot;

  // The object as a row, null when it is not one.
  static QR_OutlineObject* as_row(QR_FamilyObject* object);

  void set_expanded(bool on);
  void notify_row_changed();

  std::uint32_t flags_ = 0;
  std::uint32_t line_count_ = 0;
  std::uint32_t saved_line_count_ = 0;
  std::uint32_t first_line_ = kNoLine;
  std::unique_ptr<QR_FreePointerArray<QR_OutlineAnnotation>> annotations_;  // created on first use
  // How many children are expanded, so that the root answers "is any top-level row
  // expanded" without looking at every row.
  std::uint32_t expanded_children_ = 0;
  // Set while the object is a whole QR_OutlineRoot: rows find their root without a type check.
  bool is_outline_root_ = false;
};
