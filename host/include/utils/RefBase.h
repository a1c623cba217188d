// RefBase: base of objects that count their owners, held through sp<T> and watched through wp<T>.
//
// Counting is safe from any thread; the object's own members are not protected. An object lives on
// the heap and belongs to its strong references: the first one calls onFirstRef(), the last one
// calls onLastStrongRef() and deletes it. Until the first one exists nobody else may make and drop
// one, so code that hands out `this` belongs into onFirstRef(), not into the constructor.
// Weak references keep nothing alive but a small block of counts.
#pragma once

#include <stdint.h>

#include <utils/StrongPointer.h>

namespace android {

class RefBase {
 public:
  RefBase(const RefBase&) = delete;
  RefBase& operator=(const RefBase&) = delete;

  // `id` names the holder, for debuggers; it is not looked at.
  void incStrong(const void* id) const;
  void decStrong(const void* id) const;

  // A snapshot: other threads may change it at once.
  int32_t getStrongCount() const;

  // The counts, which outlive the object while weak references exist.
  class weakref_type {
   public:
    void incWeak(const void* id);
    void decWeak(const void* id);

    // Adds a strong reference unless the object has lost its last one; true if it did.
    bool attemptIncStrong(const void* id);

   protected:
    ~weakref_type() = default;
  };

  // Adds a weak reference and returns the counts; undone by decWeak().
  weakref_type* createWeak(const void* id) const;
  weakref_type* getWeakRefs() const;

 protected:
  RefBase();
  virtual ~RefBase();

  virtual void onFirstRef();
  // Runs on the thread that drops the last strong reference, right before the object is deleted.
  virtual void onLastStrongRef(const void* id);

 private:
  class Counts;
  Counts* const _counts;
};

// Watches an object without keeping it alive.
template <typename T>
class wp {
 public:
  wp() = default;
  wp(T* other) : m_ptr(other), m_refs(other != nullptr ? other->createWeak(this) : nullptr) {}
  wp(const sp<T>& other) : wp(other.get()) {}
  template <typename U>
  wp(const sp<U>& other) : wp(static_cast<T*>(other.get())) {}
  wp(const wp& other) : m_ptr(other.m_ptr), m_refs(other.m_refs) {
    if (m_refs != nullptr) m_refs->incWeak(this);
  }
  wp(wp&& other) noexcept
      : m_ptr(std::exchange(other.m_ptr, nullptr)), m_refs(std::exchange(other.m_refs, nullptr)) {}
  ~wp() {
    if (m_refs != nullptr) m_refs->decWeak(this);
  }

  // Copies of raw and strong pointers arrive here through the constructors above.
  wp& operator=(wp other) noexcept {
    std::swap(m_ptr, other.m_ptr);
    std::swap(m_refs, other.m_refs);
    return *this;
  }

  void clear() { *this = wp(); }

  // Null once the object has lost its last strong reference.
  sp<T> promote() const {
    if (m_refs == nullptr || !m_refs->attemptIncStrong(this)) return sp<T>();
    return sp<T>(typename sp<T>::Adopt{}, m_ptr);
  }

  // For comparison only: the object may be gone.
  T* unsafe_get() const { return m_ptr; }

  // Two weak references are equal if they were made from the same object, not merely from the same
  // address.
  bool operator==(const wp& other) const { return m_refs == other.m_refs; }

 private:
  T* m_ptr = nullptr;
  RefBase::weakref_type* m_refs = nullptr;
};

}  // namespace android
