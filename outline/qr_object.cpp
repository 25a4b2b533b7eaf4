// Mutual links between outline-library objects.
#include "outline/qr_object.h"

#include "outline/qr_pointer_array.h"

QR_Object::QR_Object() = default;

QR_Object::~QR_Object() {
  if (!links_) return;
  // Each partner forgets this object first, then hears that it is gone.
  std::unique_ptr<QR_PointerArray<QR_Object>> links = std::move(links_);
  std::vector<QR_Object*> partners = links->items();
  for (QR_Object* other : partners) {
    other->drop_link(this);
    other->linked_object_destroyed(this);
  }
}

void QR_Object::linked_object_destroyed(QR_Object*) {}

void QR_Object::link(QR_Object* other) {
  if (other == nullptr || other == this || is_linked(other)) return;
  add_link(other);
  other->add_link(this);
}

void QR_Object::unlink(QR_Object* other) {
  if (other == nullptr) return;
  drop_link(other);
  other->drop_link(this);
}

// Links are mutual, so the shorter of the two lists answers: a display linked to thousands of
// rows is asked about each row, and each row holds only a few links.
bool QR_Object::is_linked(const QR_Object* other) const {
  if (!links_ || other == nullptr || !other->links_) return false;
  if (other->links_->count() < links_->count()) return other->links_->contains(this);
  return links_->contains(other);
}

void QR_Object::add_link(QR_Object* other) {
  // The caller has checked that the two are not linked yet.
  if (!links_) links_ = std::make_unique<QR_PointerArray<QR_Object>>();
  links_->append(other);
}

void QR_Object::drop_link(QR_Object* other) {
  if (links_) links_->remove(other);
}

QR_ObjectWatch::QR_ObjectWatch() = default;

QR_ObjectWatch::~QR_ObjectWatch() {
  while (const QR_PointerArray<QR_Object>* links = linked_objects()) {
    if (links->empty()) break;
    unlink(links->last());
  }
}

bool QR_ObjectWatch::gone(const QR_Object* object) const {
  for (const QR_Object* g : gone_) {
    if (g == object) return true;
  }
  return false;
}

void QR_ObjectWatch::linked_object_destroyed(QR_Object* gone) { gone_.push_back(gone); }
