// Vector<T>: an array that grows. Not safe for use by several threads at once.
//
// Reading goes through operator[] and itemAt(), which give const references; writing goes through
// editItemAt(). Addresses of elements stay valid while nothing is added or removed, and, within the
// capacity that setCapacity() reserved, also while elements are added at the end. A copy has elements
// of its own from the start. Elements are moved by copy construction and destruction.
// Operations that need memory and do not get it return NO_MEMORY and change nothing.
#pragma once

#include <assert.h>
#include <stddef.h>
#include <stdint.h>
#include <sys/types.h>

#include <algorithm>
#include <memory>
#include <new>
#include <utility>

#include <utils/Errors.h>

namespace android {

template <typename T>
class Vector {
 public:
  typedef T value_type;
  typedef T* iterator;
  typedef const T* const_iterator;

  Vector() = default;
  // Empty if there is no memory for the copy.
  Vector(const Vector& other) { (void)appendVector(other); }
  virtual ~Vector() { clear(); }

  // Unchanged if there is no memory for the copy.
  Vector& operator=(const Vector& other) {
    if (this == &other) return *this;
    Vector copy(other);
    if (copy._size == other._size) swap(copy);
    return *this;
  }

  size_t size() const { return _size; }
  bool isEmpty() const { return _size == 0; }
  bool empty() const { return _size == 0; }
  size_t capacity() const { return _capacity; }

  // Makes room for at least `count` elements. Returns the capacity, which never falls, or NO_MEMORY.
  ssize_t setCapacity(size_t count) {
    if (count > _capacity) {
      T* const items = allocate(count);
      if (items == nullptr) return NO_MEMORY;
      adopt(items, count, _size, 0);
    }
    return static_cast<ssize_t>(_capacity);
  }
  void reserve(size_t count) { (void)setCapacity(count); }

  const T* array() const { return _items; }
  T* editArray() { return _items; }
  iterator begin() { return _items; }
  iterator end() { return _items + _size; }
  const_iterator begin() const { return _items; }
  const_iterator end() const { return _items + _size; }

  const T& operator[](size_t index) const {
    assert(index < _size);
    return _items[index];
  }
  const T& itemAt(size_t index) const { return (*this)[index]; }
  const T& top() const { return (*this)[_size - 1]; }
  T& editItemAt(size_t index) {
    assert(index < _size);
    return _items[index];
  }
  T& editTop() { return editItemAt(_size - 1); }

  // The index of the new element, or NO_MEMORY. `item` may be an element of this vector.
  ssize_t add() { return add(T()); }
  ssize_t add(const T& item) { return insertAt(item, _size); }
  void push() { (void)add(); }
  void push(const T& item) { (void)add(item); }
  void push_back(const T& item) { (void)add(item); }
  void push_front(const T& item) { (void)insertAt(item, 0); }

  // Puts `count` copies of `item` in front of the element at `index`. Returns `index`, BAD_INDEX where
  // it lies behind the end, or NO_MEMORY. `item` may be an element of this vector.
  ssize_t insertAt(const T& item, size_t index, size_t count = 1);

  // The index at which the elements of `other` begin, or NO_MEMORY.
  ssize_t appendVector(const Vector& other);

  // Returns `index`, or BAD_VALUE where the range does not lie within the vector.
  ssize_t removeItemsAt(size_t index, size_t count = 1);
  ssize_t removeAt(size_t index) { return removeItemsAt(index); }
  void pop() { (void)removeItemsAt(_size - 1); }
  iterator erase(iterator position) {
    const auto index = static_cast<size_t>(position - _items);
    (void)removeItemsAt(index);
    return _items + index;
  }

  // Gives the memory back too.
  void clear() {
    std::destroy_n(_items, _size);
    ::operator delete (_items, std::align_val_t{alignof(T)});
    _items = nullptr;
    _size = 0;
    _capacity = 0;
  }

 private:
  static T* allocate(size_t count) {
    if (count > static_cast<size_t>(PTRDIFF_MAX) / sizeof(T)) return nullptr;
    return static_cast<T*>(::operator new (count * sizeof(T), std::align_val_t{alignof(T)}, std::nothrow));
  }

  // The capacity to grow to for `extra` more elements, 0 if no such number exists.
  size_t grownCapacity(size_t extra) const {
    const size_t limit = static_cast<size_t>(PTRDIFF_MAX) / sizeof(T);
    if (extra > limit || _size > limit - extra) return 0;
    const size_t wanted = _size + extra;
    return wanted > limit / 2 ? wanted : std::max<size_t>(4, wanted + (wanted + 1) / 2);
  }

  // Moves the elements into `items`, leaving a gap of `gap` elements in front of `index`, and lets go
  // of the old memory. The size stays that of the elements moved.
  void adopt(T* items, size_t capacity, size_t index, size_t gap) {
    std::uninitialized_copy_n(_items, index, items);
    std::uninitialized_copy(_items + index, _items + _size, items + index + gap);
    std::destroy_n(_items, _size);
    ::operator delete (_items, std::align_val_t{alignof(T)});
    _items = items;
    _capacity = capacity;
  }

  void swap(Vector& other) {
    std::swap(_items, other._items);
    std::swap(_size, other._size);
    std::swap(_capacity, other._capacity);
  }

  T* _items = nullptr;
  size_t _size = 0;
  size_t _capacity = 0;
};

template <typename T>
ssize_t Vector<T>::insertAt(const T& item, size_t index, size_t count) {
  if (index > _size) return BAD_INDEX;
  if (count == 0) return static_cast<ssize_t>(index);
  if (count > _capacity - _size) {
    const size_t capacity = grownCapacity(count);
    T* const items = capacity != 0 ? allocate(capacity) : nullptr;
    if (items == nullptr) return NO_MEMORY;
    // First, while the old elements, of which `item` may be one, still exist.
    std::uninitialized_fill_n(items + index, count, item);
    adopt(items, capacity, index, count);
  } else if (index == _size) {
    std::uninitialized_fill_n(_items + index, count, item);
  } else {
    // `item` may be one of the elements that move.
    const T copy(item);  // NOLINT(performance-unnecessary-copy-initialization)
    for (size_t from = _size; from-- > index;) {
      std::construct_at(_items + from + count, _items[from]);
      std::destroy_at(_items + from);
    }
    std::uninitialized_fill_n(_items + index, count, copy);
  }
  _size += count;
  return static_cast<ssize_t>(index);
}

template <typename T>
ssize_t Vector<T>::appendVector(const Vector& other) {
  const size_t index = _size;
  const size_t count = other._size;  // `other` may be this vector.
  if (count > _capacity - _size) {
    const size_t capacity = grownCapacity(count);
    T* const items = capacity != 0 ? allocate(capacity) : nullptr;
    if (items == nullptr) return NO_MEMORY;
    std::uninitialized_copy_n(other._items, count, items + index);
    adopt(items, capacity, index, count);
  } else {
    std::uninitialized_copy_n(other._items, count, _items + index);
  }
  _size += count;
  return static_cast<ssize_t>(index);
}

template <typename T>
ssize_t Vector<T>::removeItemsAt(size_t index, size_t count) {
  if (index > _size || count > _size - index) return BAD_VALUE;
  if (count == 0) return static_cast<ssize_t>(index);
  std::destroy_n(_items + index, count);
  for (size_t from = index + count; from < _size; ++from) {
    std::construct_at(_items + from - count, _items[from]);
    std::destroy_at(_items + from);
  }
  _size -= count;
  return static_cast<ssize_t>(index);
}

}  // namespace android
