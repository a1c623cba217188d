// Counts the heap allocations of each library of the process.
#pragma once

#include <stdint.h>

#include <map>
#include <string>

namespace bench {

// From here on allocations are counted, until the next takeAllocations().
void countAllocations();

// By the name of the program or library whose code asked for the memory, the C and C++ libraries looked
// through. Counting ends.
std::map<std::string, uint64_t> takeAllocations();

}  // namespace bench
