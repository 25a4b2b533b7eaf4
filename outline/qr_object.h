// The outline library's root class: mutual links between objects and the notice of a linked object's end.
#pragma once

#include <memory>
#include <vector>

template <class T>
class QR_PointerArray;

class QR_Object {
 public:
  QR_Object();
  QR_Object(const QR_Object&) = delete;
  QR_Object& operator=(const QR_Object&) = delete;
  virtual ~QR_Object();

  // Called on each linked object when this one is destroyed; the pointer is only for comparison.
  virtual void linked_object_destroyed(QR_Object* gone);

  // Links are mutual: linking A to B also links B to A; unlinking removes both sides.
  void link(QR_Object* other);
  void unlink(QR_Object* other);
  bool is_linked(const QR_Object* other) const;
  // The linked objects, or null before the first link.
  const QR_PointerArray<QR_Object>* linked_objects() const { return links_.get(); }

 private:
  void add_link(QR_Object* other);
  void drop_link(QR_Object* other);

  std::unique_ptr<QR_PointerArray<QR_Object>> links_;  // created on first use
};

// Notes which of the objects it watches are destroyed while it watches them, so that code which
// runs client actions on several objects never touches one an earlier action destroyed.
class QR_ObjectWatch : public QR_Object {
 public:
  QR_ObjectWatch();
  // Survivors are let go quietly: they hear nothing of the watch's end.
  ~QR_ObjectWatch() override;

  void watch(QR_Object* object) { link(object); }
  bool gone(const QR_Object* object) const;
  void linked_object_destroyed(QR_Object* gone) override;

 private:
  std::vector<const QR_Object*> gone_;
};
