// The system below the product on request: an allocation of a size fails, or a thread. It concerns the whole
// process and ends with the object; one object of a kind at a time. The test executable replaces the
// functions concerned (faults.cpp), so the product runs as it ships.
#pragma once

#include <stddef.h>

namespace faults {

// What can be made to fail once: memory that is asked for without an exception, and threads.
enum class Failing { Memory, Thread };

// Fails the next allocation of exactly `number` bytes on any thread, or the `number`-th pthread_create() from
// now on, counting from 1; 0: none.
class Fault {
 public:
  Fault(Failing function, size_t number);
  ~Fault();
  Fault(const Fault&) = delete;
  Fault& operator=(const Fault&) = delete;

 private:
  const Failing _function;
};

}  // namespace faults
