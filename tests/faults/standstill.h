// Whether anything in this process still moves. A call that has not come back at a standstill waits for
// something that nobody is going to bring, so a hang is found at once and without a limit of time. Any thread
// may ask; the one that does is not looked at.
#pragma once

#include <stddef.h>

namespace omxtest {

// True if there was a moment in this call at which every other thread slept. A wait with a limit of time
// counts as sleep: what runs has none, or one that is longer than a test may take.
bool atStandstill();

// Of a directory, for instance of those in which the system shows what a process holds.
size_t entryCount(const char* directory);

}  // namespace omxtest
