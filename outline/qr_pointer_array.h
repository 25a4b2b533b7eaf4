// Growable arrays of object pointers; the freeing variant destroys its elements with itself.
#pragma once

#include <algorithm>
#include <cstdint>
#include <vector>

#include "outline/qr_object.h"

template <class T>
class QR_PointerArray : public QR_Object {
 public:
  static constexpr std::uint32_t kAbsent = 0xFFFFFFFFu;

  std::uint32_t count() const { return static_cast<std::uint32_t>(items_.size()); }
  bool empty() const { return items_.empty(); }
  // The element at an index, null past the end.
  T* at(std::uint32_t index) const { return index < items_.size() ? items_[index] : nullptr; }
  T* first() const { return at(0); }
  T* last() const { return items_.empty() ? nullptr : items_.back(); }

  void append(T* item) { items_.push_back(item); }

  // An index at or past the end appends. With keep_unique, a copy of the element
  // elsewhere in the array is removed first.
  void insert(T* item, std::uint32_t index, bool keep_unique = false) {
    if (keep_unique) remove(item);
    if (index >= items_.size()) {
      items_.push_back(item);
    } else {
      items_.insert(items_.begin() + index, item);
    }
  }

  // Removes the first occurrence; later elements move down. False when absent.
  bool remove(const T* item) {
    auto it = std::find(items_.begin(), items_.end(), item);
    if (it == items_.end()) return false;
    items_.erase(it);
    release_when_empty();
    return true;
  }

  T* remove_at(std::uint32_t index) {
    if (index >= items_.size()) return nullptr;
    T* item = items_[index];
    items_.erase(items_.begin() + index);
    release_when_empty();
    return item;
  }

  void clear() {
    items_.clear();
    release_when_empty();
  }

  // Linear search; kAbsent when the element is not held.
  std::uint32_t index_of(const T* item) const {
    auto it = std::find(items_.begin(), items_.end(), item);
    return it == items_.end() ? kAbsent : static_cast<std::uint32_t>(it - items_.begin());
  }
  bool contains(const T* item) const { return index_of(item) != kAbsent; }

  // The element after the given one: the first for null, null at the end or when absent.
  T* after(const T* item) const {
    if (item == nullptr) return first();
    std::uint32_t i = index_of(item);
    return i == kAbsent ? nullptr : at(i + 1);
  }
  // The element before the given one: the last for null, null at the start or when absent.
  T* before(const T* item) const {
    if (item == nullptr) return last();
    std::uint32_t i = index_of(item);
    return (i == kAbsent || i == 0) ? nullptr : at(i - 1);
  }

  auto begin() const { return items_.begin(); }
  auto end() const { return items_.end(); }
  const std::vector<T*>& items() const { return items_; }

 protected:
  // Storage goes back when the last element leaves, as rows come and go in large numbers.
  void release_when_empty() {
    if (items_.empty()) std::vector<T*>().swap(items_);
  }

  std::vector<T*> items_;
};

// Owns its elements: they are destroyed with the array.
template <class T>
class QR_FreePointerArray : public QR_PointerArray<T> {
 public:
  ~QR_FreePointerArray() override {
    std::vector<T*> items;
    items.swap(this->items_);
    for (T* item : items) delete item;
  }
};
