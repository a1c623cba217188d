#include "bench/bridge/awake.h"

#include <pthread.h>
#include <sched.h>

namespace bench {

Awake::Awake() {
  for (unsigned i = 0; i < std::thread::hardware_concurrency(); ++i) {
    _threads.emplace_back([this] {
      while (!_over.load(std::memory_order_relaxed)) {
      }
    });
    const sched_param none{};
    if (pthread_setschedparam(_threads.back().native_handle(), SCHED_IDLE, &none) != 0) _over = true;
  }
}

Awake::~Awake() {
  _over = true;
  for (std::thread& thread : _threads) thread.join();
}

}  // namespace bench
