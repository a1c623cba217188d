// A shortage of memory for malloc(), whose calls the test executable replaces so that the product runs as it
// ships. Concerns the whole process: use a size that nobody else asks for.
#pragma once

#include <stddef.h>

namespace faults {

// Fails the next malloc() of exactly `size` bytes; taken back with the object if it did not come.
class FailedMalloc {
 public:
  explicit FailedMalloc(size_t size);
  ~FailedMalloc();
  FailedMalloc(const FailedMalloc&) = delete;
  FailedMalloc& operator=(const FailedMalloc&) = delete;

  bool happened() const;
};

}  // namespace faults
