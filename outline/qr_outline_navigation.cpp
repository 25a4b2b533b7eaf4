// Outline rows in display order: next and previous rows, and the selection moves built on them.
#include "outline/qr_outline_object.h"
#include "outline/qr_outline_root.h"

QR_OutlineObject* QR_OutlineObject::next_row() {
  // Into the children only from this row; from there on, siblings of this row or its ancestors.
  if (is_expanded() && child_count() > 0) return child_row(0);
  for (QR_OutlineObject* r = this; r != nullptr; r = r->parent_row()) {
    if (QR_FamilyObject* s = r->next_sibling()) return static_cast<QR_OutlineObject*>(s);
  }
  return nullptr;
}

QR_OutlineObject* QR_OutlineObject::previous_row() {
  QR_OutlineObject* p = parent_row();
  if (p == nullptr) return nullptr;
  if (QR_FamilyObject* s = previous_sibling()) return static_cast<QR_OutlineObject*>(s)->last_visible_descendant();
  return p;
}

QR_OutlineObject* QR_OutlineObject::last_visible_descendant() {
  QR_OutlineObject* r = this;
  while (r->is_expanded() && r->child_count() > 0) r = r->child_row(r->child_count() - 1);
  return r;
}

QR_OutlineObject* QR_OutlineObject::next_selectable_row() {
  QR_OutlineObject* r = next_row();
  while (r != nullptr && !r->is_selectable()) r = r->next_row();
  return r;
}

QR_OutlineObject* QR_OutlineObject::previous_selectable_row() {
  QR_OutlineObject* r = previous_row();
  while (r != nullptr && !r->is_selectable()) r = r->previous_row();
  return r;
}

void QR_OutlineObject::select_first() {
  if (QR_OutlineRoot* r = root()) r->select_next();
}

void QR_OutlineObject::select_last() {
  QR_OutlineRoot* r = root();
  if (r == nullptr) return;
  QR_OutlineObject* last = r->last_visible_descendant();
  QR_OutlineObject* s = (last != r && last->is_selectable()) ? last : last->previous_selectable_row();
  if (s != nullptr) {
    r->select_exclusively(s);
  } else {
    r->clear_selection();
  }
}

void QR_OutlineObject::select_next() {
  QR_OutlineObject* n = next_selectable_row();
  if (n == nullptr) return;
  if (QR_OutlineRoot* r = root()) r->select_exclusively(n);
}

void QR_OutlineObject::select_previous() {
  QR_OutlineObject* p = previous_selectable_row();
  if (p == nullptr) return;
  if (QR_OutlineRoot* r = root()) r->select_exclusively(p);
}

void QR_OutlineObject::select_next_same_level() {
  const std::uint32_t d = depth();
  QR_OutlineObject* n = next_selectable_row();
  while (n != nullptr && n->depth() != d) n = n->next_selectable_row();
  if (n == nullptr) return;
  if (QR_OutlineRoot* r = root()) r->select_exclusively(n);
}

void QR_OutlineObject::select_previous_same_level() {
  const std::uint32_t d = depth();
  QR_OutlineObject* p = previous_selectable_row();
  while (p != nullptr && p->depth() != d) p = p->previous_selectable_row();
  if (p == nullptr) return;
  if (QR_OutlineRoot* r = root()) r->select_exclusively(p);
}

void QR_OutlineObject::make_visible() {
  if (QR_OutlineDisplay* d = display()) d->make_visible(this);
}

void QR_OutlineObject::to_top() {
  if (QR_OutlineDisplay* d = display()) d->to_top(this);
}
