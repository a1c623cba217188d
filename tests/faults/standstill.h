// Whether anything in this process still moves. A call that has not come back at a standstill waits for
// something that nobody is going to bring, so a hang is found at once and without a limit of time. Any thread
// may ask; the one that does is not looked at.
#pragma once

#include <stddef.h>

namespace omxtest {

// True if there was a moment in this call at which every other thread slept. A wait with a limit of time
// counts as sleep: what runs has none, or one that is longer than a test may take.
bool atStandstill();

// What the process holds of the system, for comparison.
size_t threadCount();
size_t openFileCount();

}  // namespace omxtest
