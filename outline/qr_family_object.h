// Objects in a parent/children tree, with hooks around adding and removing children.
#pragma once

#include <cstdint>

#include "outline/qr_action_object.h"
#include "outline/qr_pointer_array.h"

class QR_FamilyObject : public QR_ActionObject {
 public:
  QR_FamilyObject();
  // Removes and destroys the children, then leaves the parent.
  ~QR_FamilyObject() override;

  // Called on the child just before it leaves the parent's list.
  virtual void detaching_from_parent(QR_FamilyObject* parent);
  virtual void child_added(QR_FamilyObject* child);
  virtual void child_removed(QR_FamilyObject* child);

  // A child that already has a parent leaves it first. A null child, the object itself or one
  // of its ancestors is refused (false), since that would make the tree a loop.
  bool add_child(QR_FamilyObject* child);
  bool insert_child(QR_FamilyObject* child, std::uint32_t index);
  // False when the object is not a child of this one.
  bool remove_child(QR_FamilyObject* child);
  QR_FamilyObject* find_root();

  QR_FamilyObject* parent() const { return parent_; }
  std::uint32_t child_count() const { return children_.count(); }
  QR_FamilyObject* child(std::uint32_t index) const { return children_.at(index); }
  const QR_PointerArray<QR_FamilyObject>& children() const { return children_; }
  // Position in the parent's list; after a removal, the position the object had.
  std::uint32_t index_in_parent() const { return index_in_parent_; }
  QR_FamilyObject* next_sibling() const;
  QR_FamilyObject* previous_sibling() const;
  bool is_ancestor_of(const QR_FamilyObject* other) const;
  bool is_outline_row() const { return is_outline_row_; }

 protected:
  // Set by outline rows for as long as they are whole, so that rows recognise each other in
  // their tree walks without a run-time type check per step.
  bool is_outline_row_ = false;

  // Destroys every child; used by destructors of derived classes that must
  // see their children go while they are still whole.
  void destroy_children();

 private:
  void renumber_children_from(std::uint32_t index);

  QR_FamilyObject* parent_ = nullptr;
  QR_PointerArray<QR_FamilyObject> children_;
  // Kept in step with the list so that sibling steps cost nothing however many children there are.
  std::uint32_t index_in_parent_ = 0;
};
