// The system below the product on request: the next allocation of a size fails, or a thread. It concerns
// the whole process and ends with the object; one object of a kind at a time. The test executable replaces
// the functions concerned (faults.cpp), so the product runs as it ships.
#pragma once

#include <stddef.h>

namespace faults {

// The functions that can be made to fail once.
enum class Failing { New, NothrowNew, Thread };

// Fails the product's next allocation of exactly `number` bytes on any thread, or the `number`-th
// pthread_create() from now on, counting from 1; 0: none.
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
