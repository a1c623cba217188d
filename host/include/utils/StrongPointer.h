// sp<T>: an owning pointer to an object that counts its references (see RefBase.h).
// It may be null. It has no conversion to bool: compare with nullptr or NULL.
// One sp must not be written by one thread while another uses it; the object's count is atomic.
#pragma once

#include <compare>
#include <utility>

namespace android {

template <typename T>
class wp;

template <typename T>
class sp {
 public:
  sp() = default;

  sp(T* other) : m_ptr(other) { acquire(); }
  sp(const sp& other) : m_ptr(other.m_ptr) { acquire(); }
  sp(sp&& other) noexcept : m_ptr(std::exchange(other.m_ptr, nullptr)) {}
  template <typename U>
  sp(U* other) : m_ptr(other) {
    acquire();
  }
  template <typename U>
  sp(const sp<U>& other) : m_ptr(other.get()) {
    acquire();
  }

  ~sp() { release(m_ptr); }

  // The new reference is taken before the old one is dropped. By then this pointer already shows the
  // new object, since dropping may run a destructor that looks at it.
  sp& operator=(T* other) {
    assign(other);
    return *this;
  }
  sp& operator=(const sp& other) {  // NOLINT(bugprone-unhandled-self-assignment): see above
    assign(other.m_ptr);
    return *this;
  }
  sp& operator=(sp&& other) noexcept {
    if (this != &other) release(std::exchange(m_ptr, std::exchange(other.m_ptr, nullptr)));
    return *this;
  }
  template <typename U>
  sp& operator=(U* other) {
    assign(other);
    return *this;
  }
  template <typename U>
  sp& operator=(const sp<U>& other) {
    assign(other.get());
    return *this;
  }

  void clear() { release(std::exchange(m_ptr, nullptr)); }

  T* get() const { return m_ptr; }
  T& operator*() const { return *m_ptr; }
  T* operator->() const { return m_ptr; }

  bool operator==(const T* other) const { return m_ptr == other; }
  template <typename U>
  bool operator==(const U* other) const {
    return m_ptr == other;
  }
  template <typename U>
  bool operator==(const sp<U>& other) const {
    return m_ptr == other.get();
  }
  template <typename U>
  auto operator<=>(const sp<U>& other) const {
    return std::compare_three_way{}(m_ptr, other.get());
  }

 private:
  template <typename U>
  friend class wp;

  // Takes over a reference that has already been counted for `owner`.
  struct Adopt {};
  sp(Adopt, T* owner) : m_ptr(owner) {}

  void acquire() {
    if (m_ptr != nullptr) m_ptr->incStrong(this);
  }
  void release(T* pointer) {
    if (pointer != nullptr) pointer->decStrong(this);
  }
  void assign(T* pointer) {
    if (pointer != nullptr) pointer->incStrong(this);
    release(std::exchange(m_ptr, pointer));
  }

  T* m_ptr = nullptr;
};

}  // namespace android
