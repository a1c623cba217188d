// Watches the process's semaphores: the executable's own sem_init(), sem_post() and sem_destroy() check
// that a semaphore exists when it is used, which neither the library nor a sanitizer notices, and pass
// the call on.
#pragma once

namespace omxtest {

// How often a semaphore was used that did not exist, or was made anew without having been destroyed.
int semaphoreMisuses();

}  // namespace omxtest
