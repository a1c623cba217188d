// The process-wide count of input buffers that came back. A mutex stands around the semaphore's life,
// so that a delivery thread's post finds it whole or finds none; it is held for no longer than a post.
#include <semaphore.h>

#include <mutex>
#include <type_traits>

#include "capi/handle.h"
#include "omxbridge/omxbridge.h"

namespace {

class InputSemaphore {
 public:
  // From nothing or anew: the count is 0 afterwards.
  void setUp() {
    const std::lock_guard<std::mutex> held(_lock);
    if (_exists) sem_destroy(&_semaphore);
    _exists = sem_init(&_semaphore, 0, 0) == 0;
  }
  void post() {
    const std::lock_guard<std::mutex> held(_lock);
    if (_exists) sem_post(&_semaphore);
  }
  void tearDown() {
    const std::lock_guard<std::mutex> held(_lock);
    if (!_exists) return;
    sem_post(&_semaphore);
    sem_destroy(&_semaphore);
    _exists = false;
  }

 private:
  std::mutex _lock;
  sem_t _semaphore{};
  bool _exists = false;
};

// Sessions may post it until the process is gone.
constinit InputSemaphore inputSemaphore;
static_assert(std::is_trivially_destructible_v<InputSemaphore>);

}  // namespace

int omx_setup_input_semaphore(void* handle) {
  inputSemaphore.setUp();
  return handle != nullptr ? omx_interface_register_input_callback(handle, semaphoreEmptyBufferPost, nullptr)
                           : OMXI_OK;
}

int omx_teardown_input_semaphore(void) {
  inputSemaphore.tearDown();
  return OMXI_OK;
}

int semaphoreEmptyBufferPost(void* /*session*/, void* /*context*/) {
  inputSemaphore.post();
  return OMXI_OK;
}
