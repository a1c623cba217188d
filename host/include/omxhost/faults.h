// Faults on request, and what they may leave behind, for tests. Any thread may call these functions; they
// concern the whole process.
#pragma once

#include <stdint.h>

namespace omxhost {

// Makes the n-th block that any MemoryDealer is asked for from now on unavailable, counting from 1, and
// only that one; 0 takes a request back. Counting begins anew.
void failMemoryBlock(uint64_t n);

// Objects of the platform (RefBase) that exist, and those that are gone but still watched.
int64_t liveObjects();

// How many blocks dealers were asked for since the last failMemoryBlock() or the start.
uint64_t memoryBlocksAsked();

}  // namespace omxhost
