// Outline rows: expansion and collapse, hiding, annotations, drawing and the family hooks.
#include "outline/qr_outline_object.h"

#include "outline/qr_outline_actions.h"
#include "outline/qr_outline_root.h"

QR_OutlineObject::QR_OutlineObject() {
  (void)QR_outlineTables();
  is_outline_row_ = true;
}

QR_OutlineObject::~QR_OutlineObject() {
  // Leaving the outline while still a whole row lets the lines go from the display at once.
  if (parent() != nullptr) parent()->remove_child(this);
  destroy_children();
  is_outline_row_ = false;
}

QR_OutlineObject* QR_OutlineObject::as_row(QR_FamilyObject* object) {
  return (object != nullptr && object->is_outline_row()) ? static_cast<QR_OutlineObject*>(object) : nullptr;
}

QR_OutlineRoot* QR_OutlineObject::root() {
  QR_OutlineObject* top = as_row(find_root());
  return (top != nullptr && top->is_outline_root_) ? static_cast<QR_OutlineRoot*>(top) : nullptr;
}

QR_OutlineDisplay* QR_OutlineObject::display() {
  QR_OutlineRoot* r = root();
  return (r != nullptr && !r->tearing_down_) ? r->display_.get() : nullptr;
}

QR_OutlineObject* QR_OutlineObject::parent_row() const { return as_row(parent()); }

QR_OutlineObject* QR_OutlineObject::child_row(std::uint32_t index) const {
  return static_cast<QR_OutlineObject*>(child(index));
}

void QR_OutlineObject::set_expanded(bool on) {
  if (is_expanded() == on) return;
  if (on) {
    flags_ |= kExpanded;
  } else {
    flags_ &= ~kExpanded;
  }
  if (QR_OutlineObject* p = parent_row()) {
    if (on) {
      ++p->expanded_children_;
    } else if (p->expanded_children_ > 0) {
      --p->expanded_children_;
    }
  }
}

void QR_OutlineObject::notify_row_changed() {
  if (QR_OutlineDisplay* d = display()) d->row_changed(this);
}

void QR_OutlineObject::finish_change() {
  QR_OutlineRoot* r = root();
  if (r == nullptr || r->tearing_down_ || r->update_in_progress()) return;
  r->flush_numbering();
  r->update_actions();
}

std::uint32_t QR_OutlineObject::first_line() {
  if (QR_OutlineRoot* r = root()) r->ensure_numbered(this);
  return first_line_;
}

std::uint32_t QR_OutlineObject::visible_line_count() {
  std::uint32_t n = line_count_;
  if (is_expanded()) {
    for (QR_FamilyObject* c : children()) n += static_cast<QR_OutlineObject*>(c)->visible_line_count();
  }
  return n;
}

bool QR_OutlineObject::is_displayed() {
  QR_OutlineObject* r = this;
  for (;;) {
    QR_FamilyObject* p = r->parent();
    if (p == nullptr) return r->is_root();
    QR_OutlineObject* pr = as_row(p);
    if (pr == nullptr || !pr->is_expanded()) return false;
    r = pr;
  }
}

bool QR_OutlineObject::is_selectable() {
  return line_count_ != 0 && has_action_atom(QR_outlineTables().select_atom);
}

std::uint32_t QR_OutlineObject::depth() {
  std::uint32_t n = 0;
  for (QR_OutlineObject* p = parent_row(); p != nullptr; p = p->parent_row()) {
    if (!p->is_root()) ++n;
  }
  return n;
}

bool QR_OutlineObject::is_root() { return false; }

const char* QR_OutlineObject::line_text(std::uint32_t) { return nullptr; }

QR_OutlineObject* QR_OutlineObject::object_at_line(std::uint32_t line) {
  QR_OutlineRoot* r = root();
  return r ? r->object_at_line(line) : nullptr;
}

bool QR_OutlineObject::can_expand_further() {
  if (!is_expanded()) return is_expandable_or_collapsible();
  for (QR_FamilyObject* c : children()) {
    if (static_cast<QR_OutlineObject*>(c)->can_expand_further()) return true;
  }
  return false;
}

// ---- expansion -------------------------------------------------------------------------

void QR_OutlineObject::expand() {
  if (line_count_ == 0 || is_expanded() || !is_expandable_or_collapsible()) return;
  QR_OutlineRoot* r = root();
  if (r == nullptr) return;
  const QR_OutlineTables& t = QR_outlineTables();
  const bool displayed = is_displayed();
  std::uint32_t at = 0;
  if (displayed) {
    r->ensure_numbered(this);
    at = first_line_ + line_count_;
  }
  set_expanded(true);
  if (displayed) {
    std::uint32_t n = 0;
    for (QR_FamilyObject* c : children()) n += static_cast<QR_OutlineObject*>(c)->visible_line_count();
    if (n != 0) r->display_->insert_lines(at, n);
  }
  detach_actions(t.expand);
  flags_ &= ~kExpandable;
  attach_actions(t.collapse);
  flags_ |= kCollapsible;
  attach_actions(t.collapse_all);
  put_annotation(QR_OutlineCollapse, 0, 0);
  if (displayed) {
    r->renumber_after(this);
    draw();
    finish_change();
  }
}

void QR_OutlineObject::collapse() {
  if (!is_expanded() || !is_expandable_or_collapsible()) return;
  QR_OutlineRoot* r = root();
  if (r == nullptr) return;
  const QR_OutlineTables& t = QR_outlineTables();
  const bool displayed = is_displayed();
  std::uint32_t at = 0;
  std::uint32_t n = 0;
  if (displayed) {
    r->ensure_numbered_through(this);
    at = first_line_ + line_count_;
    for (QR_FamilyObject* c : children()) n += static_cast<QR_OutlineObject*>(c)->visible_line_count();
  }
  set_expanded(false);
  if (displayed) {
    const bool was = r->hold_updates();
    for (QR_FamilyObject* c : children()) static_cast<QR_OutlineObject*>(c)->undisplay();
    if (!was) r->root_flags_ &= ~QR_OutlineRoot::kUpdateInProgress;
    if (n != 0) r->display_->delete_lines(at, n);
  }
  detach_actions(t.collapse);
  flags_ &= ~kCollapsible;
  attach_actions(t.expand);
  flags_ |= kExpandable;
  if (can_expand_further()) attach_actions(t.expand_all);
  put_annotation(QR_OutlineExpandGlyph, 0, 0);
  if (displayed) {
    r->renumber_after(this);
    finish_change();
  }
}

void QR_OutlineObject::expand_collapse() {
  if (!is_expandable_or_collapsible()) return;
  if (is_expanded()) {
    collapse();
  } else {
    expand();
  }
}

void QR_OutlineObject::expand_all() {
  QR_OutlineRoot* r = root();
  if (r == nullptr) return;
  const bool was = r->hold_updates();
  if (is_expandable_or_collapsible() && !is_expanded()) expand();
  if (is_expanded()) {
    // Children may be created by an expansion below; the count is read afresh each time.
    for (std::uint32_t i = 0; i < child_count(); ++i) child_row(i)->expand_all();
  }
  r->release_updates(was);
}

void QR_OutlineObject::collapse_all() {
  QR_OutlineRoot* r = root();
  if (r == nullptr) return;
  const bool was = r->hold_updates();
  if (is_expanded()) {
    for (std::uint32_t i = child_count(); i-- > 0;) {
      QR_OutlineObject* c = child_row(i);
      if (c != nullptr && c->is_expanded()) c->collapse_all();
    }
    collapse();
  }
  r->release_updates(was);
}

void QR_OutlineObject::collapse_children() {
  if (!is_expanded()) return;
  for (std::uint32_t i = child_count(); i-- > 0;) {
    QR_OutlineObject* c = child_row(i);
    if (c != nullptr && c->is_expanded()) c->collapse();
  }
}

// ---- hiding ------------------------------------------------------------------------------

void QR_OutlineObject::hide() {
  if (is_expanded()) perform_action(QR_OutlineCollapse, nullptr);
  if (is_expandable_or_collapsible()) remove_annotation(0, 0);
  QR_OutlineRoot* r = root();
  if (line_count_ != 0) {
    const bool displayed = r != nullptr && !r->tearing_down_ && is_displayed();
    if (displayed) {
      r->ensure_numbered(this);
      r->display_->delete_lines(first_line_, line_count_);
    }
    // Showing the row again brings back every line it had.
    saved_line_count_ = line_count_;
    line_count_ = 0;
    if (displayed) r->renumber_from(this, first_line_);
  }
  if (r != nullptr && is_selected()) r->deselect(this);
  finish_change();
}

void QR_OutlineObject::show() {
  if (line_count_ != 0 || saved_line_count_ == 0) return;
  QR_OutlineRoot* r = root();
  const bool displayed = r != nullptr && !r->tearing_down_ && is_displayed();
  line_count_ = saved_line_count_;
  if (displayed) {
    std::uint32_t at = r->line_before(this);
    r->display_->insert_lines(at, line_count_);
    r->renumber_from(this, at);
  }
  if (is_expandable_or_collapsible()) put_annotation(QR_OutlineExpand, 0, 0);
  if (displayed) {
    for (std::uint32_t i = 0; i < line_count_; ++i) {
      if (line_text(i) != nullptr) draw_line(i);
    }
  }
  finish_change();
}

void QR_OutlineObject::add_own_lines(std::uint32_t count) {
  if (count == 0) return;
  QR_OutlineRoot* r = root();
  const bool displayed = r != nullptr && !r->tearing_down_ && is_displayed();
  std::uint32_t at = 0;
  if (displayed) {
    r->ensure_numbered(this);
    at = first_line_ + line_count_;
  }
  const std::uint32_t old = line_count_;
  line_count_ += count;
  if (!displayed) return;
  r->display_->insert_lines(at, count);
  r->renumber_from(this, first_line_);
  for (std::uint32_t i = old; i < line_count_; ++i) draw_line(i);
  finish_change();
}

// ---- drawing -----------------------------------------------------------------------------

void QR_OutlineObject::draw() {
  for (std::uint32_t i = 0; i < line_count_; ++i) {
    if (line_text(i) != nullptr) draw_line(i);
  }
  if (is_expanded()) {
    for (std::uint32_t i = 0; i < child_count(); ++i) child_row(i)->draw();
  }
}

void QR_OutlineObject::draw_line(std::uint32_t index) {
  if (line_count_ == 0 || index >= line_count_) return;
  QR_OutlineDisplay* d = display();
  if (d == nullptr || !is_displayed()) return;
  const char* text = line_text(index);
  d->set_line(depth(), first_line() + index, text ? text : "", this);
}

void QR_OutlineObject::undisplay() {
  if (is_expanded()) {
    for (QR_FamilyObject* c : children()) static_cast<QR_OutlineObject*>(c)->undisplay();
  }
  if (is_selected()) {
    if (QR_OutlineRoot* r = root()) r->deselect(this);
  }
  // The display hears of the change once the row has no line, so it can take its glyphs away.
  first_line_ = kNoLine;
  notify_row_changed();
}

// ---- actions, family hooks ------------------------------------------------------------

void QR_OutlineObject::before_action(const char* name) {
  if (QR_OutlineRoot* r = root()) {
    if (!r->tearing_down_) r->before_row_action(this, name);
  }
}

void QR_OutlineObject::after_action(const char* name) {
  if (QR_OutlineRoot* r = root()) {
    if (!r->tearing_down_) r->after_row_action(this, name);
  }
}

void QR_OutlineObject::detaching_from_parent(QR_FamilyObject*) {
  QR_OutlineRoot* r = root();
  if (r == nullptr || r->tearing_down_ || !is_displayed()) return;
  r->ensure_numbered_through(this);
  const std::uint32_t n = visible_line_count();
  if (n != 0) r->display_->delete_lines(first_line_, n);
  // Rows below the removed one are renumbered once it is out of the list (child_removed).
  const bool was = r->hold_updates();
  undisplay();
  if (!was) r->root_flags_ &= ~QR_OutlineRoot::kUpdateInProgress;
}

void QR_OutlineObject::child_added(QR_FamilyObject* child) {
  QR_OutlineObject* c = as_row(child);
  if (c == nullptr) {
    // Only rows can be rows' children.
    remove_child(child);
    return;
  }
  if (c->is_expanded()) ++expanded_children_;
  // An open row can now expand further when the new child can; asking only the child keeps
  // adding many children cheap. The root answers for itself (never).
  const bool further = (is_expanded() && !is_root()) ? c->can_expand_further() : can_expand_further();
  if (further) {
    attach_actions(QR_outlineTables().expand_all);
  }
  QR_OutlineRoot* r = root();
  if (r == nullptr || r->tearing_down_ || !c->is_displayed()) return;
  QR_OutlineDisplay* d = r->display_.get();
  const std::uint32_t at = r->line_before(c);
  const std::uint32_t n = c->visible_line_count();
  if (n != 0) d->insert_lines(at, n);
  r->renumber_from(c, at);
  r->ensure_numbered(c);  // numbers the row and tells the display
  if (c->line_count_ == 0) {
    finish_change();
    return;
  }
  c->draw();
  QR_OutlineObject* last = r->selection_.last();
  if (r->auto_select() && c->is_selectable() && (last == nullptr || last->next_selectable_row() == c)) {
    r->select_exclusively(c);
  } else if (last != nullptr && d->is_line_visible(last->first_line())) {
    // The user looks at the selection; the view stays.
  } else if (c->first_line_ > 1 && !d->is_line_visible(c->first_line_ - 1)) {
    // The growing end is out of view; the view stays.
  } else {
    d->show_line(c->first_line_);
  }
  finish_change();
}

void QR_OutlineObject::child_removed(QR_FamilyObject* child) {
  QR_OutlineObject* c = as_row(child);
  if (c == nullptr) return;
  if (c->is_expanded() && expanded_children_ > 0) --expanded_children_;
  QR_OutlineRoot* r = root();
  if (r == nullptr || r->tearing_down_) return;
  // Nothing of the removed subtree may stay selected: the rows may be destroyed next.
  const bool was = r->hold_updates();
  for (std::uint32_t i = r->selection_.count(); i-- > 0;) {
    QR_OutlineObject* s = r->selection_.at(i);
    if (s == c || c->is_ancestor_of(s)) r->deselect(s);
  }
  if (!was) r->root_flags_ &= ~QR_OutlineRoot::kUpdateInProgress;
  if (is_displayed() && is_expanded()) {
    const std::uint32_t index = c->index_in_parent();
    QR_OutlineObject* anchor = index > 0 ? child_row(index - 1)->last_visible_descendant() : this;
    r->renumber_after(anchor);
  }
  finish_change();
}

// ---- client operations -------------------------------------------------------------------

void QR_OutlineObject::select() {
  if (!is_selectable()) return;
  if (QR_OutlineRoot* r = root()) r->select_exclusively(this);
}

void QR_OutlineObject::make_expandable() {
  const QR_OutlineTables& t = QR_outlineTables();
  if (is_expanded()) {
    attach_actions(t.collapse);
    flags_ |= kCollapsible;
    attach_actions(t.collapse_all);
    put_annotation(QR_OutlineCollapse, 0, 0);
  } else {
    attach_actions(t.expand);
    flags_ |= kExpandable;
    attach_actions(t.collapse_all);
    put_annotation(QR_OutlineExpandGlyph, 0, 0);
    // A collapsed row with children can expand further, and so can every open row above it:
    // "Expand all" is offered on them, also in the glyph's menu of a row never selected.
    attach_actions(t.expand_all);
    for (QR_OutlineObject* p = parent_row(); p != nullptr && !p->is_root() && p->is_expanded(); p = p->parent_row())
      p->attach_actions(t.expand_all);
  }
  attach_actions(t.select);
  saved_line_count_ = line_count_ > 1 ? line_count_ : 1;
}

void QR_OutlineObject::make_leaf() {
  const QR_OutlineTables& t = QR_outlineTables();
  detach_actions(t.expand);
  detach_actions(t.expand_all);
  detach_actions(t.collapse);
  detach_actions(t.collapse_all);
  flags_ &= ~(kExpandable | kCollapsible);
  remove_annotation(0, 0);
  saved_line_count_ = line_count_;
}

void QR_OutlineObject::make_selectable() { attach_actions(QR_outlineTables().select); }

QR_OutlineAnnotation* QR_OutlineObject::annotation_at(std::uint32_t line, std::uint32_t column) const {
  if (!annotations_) return nullptr;
  for (QR_OutlineAnnotation* a : *annotations_) {
    if (a->line() == line && a->column() == column) return a;
  }
  return nullptr;
}

void QR_OutlineObject::put_annotation(const char* action_string, std::uint32_t line, std::uint32_t column,
                                      const unsigned char* bits, std::uint32_t width, std::uint32_t height) {
  if (!annotations_) annotations_ = std::make_unique<QR_FreePointerArray<QR_OutlineAnnotation>>();
  QR_OutlineDisplay* d = display();
  auto* fresh = new QR_OutlineAnnotation(action_string, line, column, bits, width, height);
  if (QR_OutlineAnnotation* old = annotation_at(line, column)) {
    const std::uint32_t i = annotations_->index_of(old);
    annotations_->remove_at(i);
    annotations_->insert(fresh, i);
    if (d != nullptr) d->annotation_removed(this, old);
    delete old;
  } else {
    annotations_->append(fresh);
  }
  if (d != nullptr) d->row_changed(this);
}

void QR_OutlineObject::remove_annotation(std::uint32_t line, std::uint32_t column) {
  QR_OutlineAnnotation* a = annotation_at(line, column);
  if (a == nullptr) return;
  annotations_->remove(a);
  if (QR_OutlineDisplay* d = display()) d->annotation_removed(this, a);
  delete a;
}
