// List<T>: a doubly linked list. Iterators stay valid while their element exists.
// Not safe for use by several threads at once.
#pragma once

#include <list>

namespace android {

template <typename T>
class List : private std::list<T> {
  using Base = std::list<T>;

 public:
  List() = default;
  List(const List&) = default;
  List& operator=(const List&) = default;
  virtual ~List() = default;

  using typename Base::const_iterator;
  using typename Base::iterator;

  using Base::begin;
  using Base::clear;
  using Base::empty;
  using Base::end;
  using Base::erase;
  using Base::insert;
  using Base::push_back;
  using Base::push_front;
  using Base::size;
};

}  // namespace android
