// The outline root: dispatch of action strings on the selection, the selection, and the
// lazily kept numbering of display lines with the line map.
#include "outline/qr_outline_root.h"

#include <algorithm>
#include <string_view>

#include "outline/qr_outline_actions.h"

namespace {

// Stands in when a root is made without a display, so that rows never meet a null display.
class QR_NullDisplay : public QR_OutlineDisplay {
 public:
  void insert_lines(std::uint32_t, std::uint32_t) override {}
  void delete_lines(std::uint32_t, std::uint32_t) override {}
  void set_line(std::uint32_t, std::uint32_t, const char*, QR_OutlineObject*) override {}
};

}  // namespace

QR_OutlineRoot::QR_OutlineRoot(QR_OutlineDisplay* display)
    : display_(display != nullptr ? display : new QR_NullDisplay) {
  is_outline_root_ = true;
  attach_actions(QR_outlineTables().collapse_children);
  first_line_ = 0;
  display_->set_root(this);
  line_map_.assign(kLineMapStep, nullptr);
  flags_ |= kExpanded;
}

QR_OutlineRoot::~QR_OutlineRoot() {
  tearing_down_ = true;
  selection_.clear();
  pending_ = nullptr;
  destroy_children();
  display_.reset();  // after the rows, whose ends it hears of
  is_outline_root_ = false;
}

bool QR_OutlineRoot::is_root() { return true; }
bool QR_OutlineRoot::can_expand_further() { return false; }

void QR_OutlineRoot::before_row_action(QR_OutlineObject* row, const char* name) {
  display_->before_row_action(row, name);
}

void QR_OutlineRoot::after_row_action(QR_OutlineObject* row, const char* name) {
  display_->after_row_action(row, name);
}

// ---- dispatch ------------------------------------------------------------------------------

bool QR_OutlineRoot::perform_action(const char* names, void* argument) {
  if (names == nullptr || tearing_down_) return false;
  const bool was = hold_updates();
  bool result = false;
  if (!selection_.empty()) {
    // The actions change the selection; the rows to act on are fixed first.
    const std::vector<QR_OutlineObject*> rows = selection_.items();
    const std::string_view n(names);
    const bool single = n == QR_OutlineNext || n == QR_OutlinePrevious;
    const std::size_t count = single ? 1 : rows.size();
    const bool forwards = n == QR_OutlineExpand || n == QR_OutlineExpandGlyph || n == QR_OutlineExpandAll ||
                          n == QR_OutlinePrevious || (n == QR_OutlineExpandCollapse && !rows.front()->is_expanded());
    // A client action may destroy rows; those are passed over.
    QR_ObjectWatch watch;
    for (QR_OutlineObject* row : rows) watch.watch(row);
    display_->begin_action(names);
    for (std::size_t i = 0; i < count; ++i) {
      QR_OutlineObject* row = forwards ? rows[i] : rows[rows.size() - 1 - i];
      if (watch.gone(row)) continue;
      result = row->perform_action(names, argument);
    }
    display_->end_action(names);
  }
  if (QR_ActionObject::has_action(names)) {
    display_->begin_action(names);
    display_->begin_update();
    if (QR_ActionObject::perform_action(names, argument)) result = true;
    display_->end_action(names);
    display_->end_update();
  }
  release_updates(was);
  return result;
}

bool QR_OutlineRoot::has_action(const char* names) {
  for (QR_OutlineObject* s : selection_) {
    if (s->has_action(names)) return true;
  }
  return QR_ActionObject::has_action(names);
}

bool QR_OutlineRoot::hold_updates() {
  const bool was = update_in_progress();
  root_flags_ |= kUpdateInProgress;
  return was;
}

void QR_OutlineRoot::release_updates(bool was_in_progress) {
  if (was_in_progress) return;
  root_flags_ &= ~kUpdateInProgress;
  if (tearing_down_) return;
  flush_numbering();
  update_actions();
}

void QR_OutlineRoot::set_auto_select(bool on) {
  if (on) {
    root_flags_ |= kAutoSelect;
  } else {
    root_flags_ &= ~kAutoSelect;
  }
}

void QR_OutlineRoot::update_actions() {
  if (update_in_progress() || tearing_down_) return;
  const QR_OutlineTables& t = QR_outlineTables();
  for (QR_OutlineObject* s : selection_) {
    if (s->next_selectable_row() != nullptr) {
      s->attach_actions(t.next);
    } else {
      s->detach_actions(t.next);
    }
    if (s->previous_selectable_row() != nullptr) {
      s->attach_actions(t.previous);
    } else {
      s->detach_actions(t.previous);
    }
    if (s->can_expand_further()) {
      s->attach_actions(t.expand_all);
    } else {
      s->detach_actions(t.expand_all);
    }
    if (s->is_expanded()) {
      s->attach_actions(t.collapse_all);
    } else {
      s->detach_actions(t.collapse_all);
    }
  }
  detach_actions(t.collapse_children);
  if (expanded_children_ > 0) attach_actions(t.collapse_children);
  display_->actions_changed();
}

// ---- selection -----------------------------------------------------------------------------

void QR_OutlineRoot::insert_into_selection(QR_OutlineObject* row) {
  // After the last selected row whose first line is smaller: the selection stays in line order.
  const std::uint32_t line = row->first_line();
  std::uint32_t i = selection_.count();
  while (i > 0 && selection_.at(i - 1)->first_line() >= line) --i;
  selection_.insert(row, i);
}

void QR_OutlineRoot::select_exclusively(QR_OutlineObject* row) {
  if (tearing_down_) return;
  // Only rows on the display can be selected: rows leave the selection when they leave it.
  if (row != nullptr && (row == this || row->root() != this || !row->is_displayed())) return;
  const std::vector<QR_OutlineObject*> old = selection_.items();
  selection_.clear();
  for (QR_OutlineObject* s : old) {
    s->flags_ &= ~kSelected;
    if (s != row) display_->row_deselected(s);
  }
  if (row != nullptr) {
    insert_into_selection(row);
    row->flags_ |= kSelected;
    display_->row_selected(row);
  }
  update_actions();
  if (row != nullptr && row->is_displayed()) display_->show_line(row->first_line());
}

void QR_OutlineRoot::add_to_selection(QR_OutlineObject* row) {
  if (tearing_down_ || row == nullptr || row == this || row->is_selected() || row->root() != this) return;
  if (!row->is_selectable() || !row->is_displayed()) return;
  insert_into_selection(row);
  row->flags_ |= kSelected;
  display_->row_selected(row);
  update_actions();
}

void QR_OutlineRoot::deselect(QR_OutlineObject* row) {
  if (row == nullptr || !row->is_selected()) return;
  row->flags_ &= ~kSelected;
  selection_.remove(row);
  if (tearing_down_) return;
  display_->row_deselected(row);
  update_actions();
}

// ---- line numbering ------------------------------------------------------------------------

QR_OutlineObject* QR_OutlineRoot::object_at_line(std::uint32_t line) {
  flush_numbering();
  return line < line_map_.size() ? line_map_[line] : nullptr;
}

std::uint32_t QR_OutlineRoot::total_lines() {
  flush_numbering();
  return total_lines_;
}

std::uint32_t QR_OutlineRoot::last_mapped_line() {
  flush_numbering();
  return mapped_end_ == 0 ? kNoLine : mapped_end_ - 1;
}

bool QR_OutlineRoot::precedes(QR_OutlineObject* a, QR_OutlineObject* b) {
  if (a == b) return false;
  auto levels = [](QR_FamilyObject* x) {
    std::uint32_t n = 0;
    for (; x->parent() != nullptr; x = x->parent()) ++n;
    return n;
  };
  QR_FamilyObject* x = a;
  QR_FamilyObject* y = b;
  std::uint32_t dx = levels(x);
  std::uint32_t dy = levels(y);
  for (; dx > dy; --dx) {
    x = x->parent();
    if (x == y) return false;  // b is an ancestor of a
  }
  for (; dy > dx; --dy) {
    y = y->parent();
    if (y == x) return true;  // a is an ancestor of b
  }
  while (x->parent() != y->parent()) {
    x = x->parent();
    y = y->parent();
  }
  if (x->parent() == nullptr) return false;  // not in one tree
  return x->index_in_parent() < y->index_in_parent();
}

void QR_OutlineRoot::ensure_numbered(QR_OutlineObject* row) {
  if (pending_ == nullptr || row == nullptr || row == this || tearing_down_) return;
  if (!row->is_displayed() || precedes(row, pending_)) return;
  while (pending_ != nullptr) {
    QR_OutlineObject* p = pending_;
    number_pending_row();
    if (p == row) break;
  }
}

void QR_OutlineRoot::ensure_numbered_through(QR_OutlineObject* row) {
  if (row != nullptr) ensure_numbered(row->last_visible_descendant());
}

void QR_OutlineRoot::flush_numbering() {
  while (pending_ != nullptr) number_pending_row();
}

std::uint32_t QR_OutlineRoot::line_before(QR_OutlineObject* row) {
  QR_OutlineObject* prev = row->previous_row();
  if (prev == nullptr || prev == this) return 0;
  ensure_numbered(prev);
  return prev->first_line_ + prev->line_count_;
}

void QR_OutlineRoot::renumber_from(QR_OutlineObject* row, std::uint32_t line) {
  // A pending row above this one already covers it: numbering from there reaches this row too.
  if (pending_ != nullptr && precedes(pending_, row)) return;
  pending_ = row;
  pending_line_ = line;
}

void QR_OutlineRoot::renumber_after(QR_OutlineObject* row) {
  ensure_numbered(row);
  const std::uint32_t line = (row == this) ? 0 : row->first_line_ + row->line_count_;
  QR_OutlineObject* next = row->next_row();
  if (next == nullptr) {
    pending_ = nullptr;
    clear_map_from(line);
    total_lines_ = line;
    return;
  }
  renumber_from(next, line);
}

void QR_OutlineRoot::clear_map_from(std::uint32_t line) {
  const std::uint32_t end = std::min<std::uint32_t>(mapped_end_, line_map_.size());
  for (std::uint32_t i = line; i < end; ++i) line_map_[i] = nullptr;
  if (line < mapped_end_) mapped_end_ = line;
}

void QR_OutlineRoot::number_pending_row() {
  QR_OutlineObject* row = pending_;
  const std::uint32_t line = pending_line_;
  const std::uint32_t old = row->first_line_;
  row->first_line_ = line;
  const std::uint32_t count = row->line_count_;
  if (count != 0) {
    const std::uint64_t last = std::uint64_t(line) + count - 1;
    // The map grows to 256 entries beyond the last line, so growth is rare.
    if (last >= line_map_.size()) line_map_.resize(last + kLineMapStep, nullptr);
    std::fill(line_map_.begin() + line, line_map_.begin() + line + count, row);
    mapped_end_ = std::max(mapped_end_, line + count);
  }
  const std::uint32_t next_line = line + count;
  pending_ = row->next_row();
  pending_line_ = next_line;
  if (pending_ == nullptr) {
    clear_map_from(next_line);
    total_lines_ = next_line;
  }
  if (old != line) display_->row_changed(row);
}
