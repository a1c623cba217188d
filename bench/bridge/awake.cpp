#include "bench/bridge/awake.h"

#include <pthread.h>
#include <sched.h>
#include <stdio.h>

namespace bench {

Awake::Awake() {
  for (unsigned i = 0; i < std::thread::hardware_concurrency(); ++i) {
    _threads.emplace_back([this] {
      while (!_over.load(std::memory_order_relaxed)) {
      }
    });
    const sched_param none{};
    if (pthread_setschedparam(_threads.back().native_handle(), SCHED_IDLE, &none) != 0) {
      _over = true;
      fprintf(stderr, "bridge_bench: the processors may sleep: threads of the lowest priority are refused\n");
    }
  }
}

Awake::~Awake() {
  _over = true;
  for (std::thread& thread : _threads) thread.join();
}

}  // namespace bench
