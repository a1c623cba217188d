// The system below the product on request: the next allocation of a size fails, or the next thread; a thread
// is made when the test says. It concerns the whole process and ends with the object.
// The test executable replaces the functions concerned (faults.cpp), so the product runs as it ships.
#pragma once

#include <stddef.h>

#include <functional>

namespace faults {

// Fails the next allocation of exactly `size` bytes, on any thread: of those that return null then
// (new (std::nothrow)), or of those that throw.
class FailedAllocation {
 public:
  enum class Form { ReturnsNull, Throws };
  explicit FailedAllocation(size_t size, Form form = Form::ReturnsNull);
  ~FailedAllocation();
  FailedAllocation(const FailedAllocation&) = delete;
  FailedAllocation& operator=(const FailedAllocation&) = delete;

  bool happened() const;

 private:
  const Form _form;
};

// Fails the n-th pthread_create() from now on, counting from 1.
class FailedThread {
 public:
  explicit FailedThread(int nth = 1);
  ~FailedThread();
  FailedThread(const FailedThread&) = delete;
  FailedThread& operator=(const FailedThread&) = delete;

  bool happened() const;
};

// Runs `before` on the creating thread, which it may block, just before each thread with that entry is made.
// One at a time.
class ThreadHook {
 public:
  using Entry = void* (*)(void*);
  ThreadHook(Entry entry, std::function<void()> before);
  ~ThreadHook();
  ThreadHook(const ThreadHook&) = delete;
  ThreadHook& operator=(const ThreadHook&) = delete;
};

}  // namespace faults
