// The invisible top row of an outline: dispatch of actions on the selection, the selection
// itself, and the numbering of display lines with the map from lines to rows.
#pragma once

#include <cstdint>
#include <memory>
#include <vector>

#include "outline/qr_outline_display.h"
#include "outline/qr_outline_object.h"

class QR_OutlineRoot : public QR_OutlineObject {
 public:
  enum : std::uint32_t {
    kAutoSelect = 1,
    kUpdateInProgress = 2,
  };
  static constexpr std::uint32_t kLineMapStep = 256;

  // The root owns the display and destroys it with itself.
  explicit QR_OutlineRoot(QR_OutlineDisplay* display);
  ~QR_OutlineRoot() override;

  // Performs the action string on the selected rows, then on the root's own tables.
  bool perform_action(const char* names, void* argument) override;
  bool has_action(const char* names) override;
  QR_OutlineObject* object_at_line(std::uint32_t line) override;
  bool can_expand_further() override;
  bool is_root() override;

  virtual void before_row_action(QR_OutlineObject* row, const char* name);
  virtual void after_row_action(QR_OutlineObject* row, const char* name);
  // Attaches and detaches the navigation and expansion tables of the selected rows.
  virtual void update_actions();

  QR_OutlineDisplay* outline_display() const { return display_.get(); }

  // The selection, in ascending line order.
  std::uint32_t selection_count() const { return selection_.count(); }
  QR_OutlineObject* selected(std::uint32_t index) const { return selection_.at(index); }
  // Selects the row alone; null only clears the selection. Rows of other outlines and rows
  // that are not displayed are refused.
  void select_exclusively(QR_OutlineObject* row);
  void clear_selection() { select_exclusively(nullptr); }
  // Adds a selectable, displayed row to the selection, keeping line order (a display rebuilding
  // the selection from a dragged range uses it).
  void add_to_selection(QR_OutlineObject* row);
  // Takes a selected row out of the selection.
  void deselect(QR_OutlineObject* row);

  bool auto_select() const { return (root_flags_ & kAutoSelect) != 0; }
  void set_auto_select(bool on);
  std::uint32_t root_flags() const { return root_flags_; }
  bool update_in_progress() const { return (root_flags_ & kUpdateInProgress) != 0; }
  // Holds back update_actions until the matching release; brackets nest. Returns whether an
  // update was already in progress, to be handed to release_updates.
  bool hold_updates();
  void release_updates(bool was_in_progress);

  // Number of display lines of the whole outline.
  std::uint32_t total_lines();
  std::uint32_t line_map_capacity() const { return static_cast<std::uint32_t>(line_map_.size()); }
  // kNoLine when nothing is mapped.
  std::uint32_t last_mapped_line();
  bool tearing_down() const { return tearing_down_; }

 private:
  friend class QR_OutlineObject;

  // Numbering is brought up to date lazily: rows before the pending row are numbered, the pending
  // row gets pending_line_, and the rest follow in display order. A change marks the first row it
  // moves; a later question about a row below it numbers just as far as that row. Expanding every
  // row in turn therefore numbers each line once instead of once per expansion.
  void ensure_numbered(QR_OutlineObject* row);
  void ensure_numbered_through(QR_OutlineObject* row);
  void flush_numbering();
  // The line on which the row starts, from the row before it in display order.
  std::uint32_t line_before(QR_OutlineObject* row);
  void renumber_from(QR_OutlineObject* row, std::uint32_t line);
  void renumber_after(QR_OutlineObject* row);
  void number_pending_row();
  void clear_map_from(std::uint32_t line);
  bool precedes(QR_OutlineObject* a, QR_OutlineObject* b);
  void insert_into_selection(QR_OutlineObject* row);

  std::unique_ptr<QR_OutlineDisplay> display_;
  QR_PointerArray<QR_OutlineObject> selection_;
  std::uint32_t root_flags_ = 0;
  std::vector<QR_OutlineObject*> line_map_;
  std::uint32_t mapped_end_ = 0;  // one past the highest line written into the map
  QR_OutlineObject* pending_ = nullptr;
  std::uint32_t pending_line_ = 0;
  std::uint32_t total_lines_ = 0;  // valid while nothing is pending
  bool tearing_down_ = false;
};
