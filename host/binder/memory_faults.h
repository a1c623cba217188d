// Asked by dealers before each block, from any thread.
#pragma once

namespace omxhost {

// Counts one block; true where a test wants this one to be unavailable.
bool memoryBlockFails();

}  // namespace omxhost
