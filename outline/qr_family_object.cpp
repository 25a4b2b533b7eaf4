// Parent/children trees of action objects.
#include "outline/qr_family_object.h"

QR_FamilyObject::QR_FamilyObject() = default;

QR_FamilyObject::~QR_FamilyObject() {
  destroy_children();
  if (parent_ != nullptr) parent_->remove_child(this);
}

void QR_FamilyObject::destroy_children() {
  // The last child goes first: the list then never shifts, so a row with a very large number
  // of children is torn down in time proportional to their number.
  while (children_.count() > 0) {
    QR_FamilyObject* c = children_.last();
    remove_child(c);
    delete c;
  }
}

void QR_FamilyObject::detaching_from_parent(QR_FamilyObject*) {}
void QR_FamilyObject::child_added(QR_FamilyObject*) {}
void QR_FamilyObject::child_removed(QR_FamilyObject*) {}

bool QR_FamilyObject::is_ancestor_of(const QR_FamilyObject* other) const {
  for (const QR_FamilyObject* p = other ? other->parent_ : nullptr; p != nullptr; p = p->parent_) {
    if (p == this) return true;
  }
  return false;
}

bool QR_FamilyObject::add_child(QR_FamilyObject* child) { return insert_child(child, children_.count()); }

bool QR_FamilyObject::insert_child(QR_FamilyObject* child, std::uint32_t index) {
  if (child == nullptr || child == this || child->is_ancestor_of(this)) return false;
  if (child->parent_ != nullptr) child->parent_->remove_child(child);
  if (index > children_.count()) index = children_.count();
  children_.insert(child, index);
  renumber_children_from(index);
  child->parent_ = this;
  child_added(child);
  return true;
}

bool QR_FamilyObject::remove_child(QR_FamilyObject* child) {
  if (child == nullptr || child->parent_ != this) return false;
  child->detaching_from_parent(this);
  // The hook may have moved the child; only a child still here is taken out.
  if (child->parent_ != this) return true;
  std::uint32_t index = child->index_in_parent_;
  if (children_.at(index) != child) index = children_.index_of(child);
  children_.remove_at(index);
  renumber_children_from(index);
  child->parent_ = nullptr;
  child->index_in_parent_ = index;
  child_removed(child);
  return true;
}

void QR_FamilyObject::renumber_children_from(std::uint32_t index) {
  for (std::uint32_t i = index; i < children_.count(); ++i) children_.at(i)->index_in_parent_ = i;
}

QR_FamilyObject* QR_FamilyObject::find_root() {
  QR_FamilyObject* r = this;
  while (r->parent_ != nullptr) r = r->parent_;
  return r;
}

QR_FamilyObject* QR_FamilyObject::next_sibling() const {
  return parent_ ? parent_->children_.at(index_in_parent_ + 1) : nullptr;
}

QR_FamilyObject* QR_FamilyObject::previous_sibling() const {
  return (parent_ && index_in_parent_ > 0) ? parent_->children_.at(index_in_parent_ - 1) : nullptr;
}
