// A word that several session threads read and write without a lock held. As large as the plain
// type, so that the classes keep their layout, and copyable, so that records that hold one are.
// Sequentially consistent: "store mine, then load yours" between two threads needs no fence.
#pragma once

#include <atomic>

template <typename T>
class SharedValue {
 public:
  constexpr SharedValue(T value = T{}) : _value(value) {}
  SharedValue(const SharedValue& other) : _value(other._value.load()) {}
  SharedValue& operator=(const SharedValue& other) {
    _value.store(other._value.load());
    return *this;
  }
  T operator=(T value) {
    _value.store(value);
    return value;
  }
  operator T() const { return _value.load(); }

 private:
  std::atomic<T> _value;
  static_assert(sizeof(std::atomic<T>) == sizeof(T) && std::atomic<T>::is_always_lock_free);
};
