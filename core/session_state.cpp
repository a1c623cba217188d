#include "core/session_state.h"

#include <errno.h>

void SessionState::sleepOn(sem_t& wakeUp) {
  while (sem_wait(&wakeUp) != 0 && errno == EINTR) {
  }
}

int SessionState::startThread(Thread& thread, pthread_t& handle, void* (*entry)(void*), void* argument) {
  {
    const Lock held(lock);
    if (thread.running) return 0;  // an `init` that failed left it running
  }
  joinThread(thread, handle);  // one that ended by itself
  {
    const Lock held(lock);
    thread.running = true;  // before it runs: it may end at once
    thread.joinable = true;
  }
  const int error = pthread_create(&handle, nullptr, entry, argument);
  if (error != 0) {
    const Lock held(lock);
    thread = Thread();
  }
  return error;
}

void SessionState::leaveThread(Thread& thread, const Lock& /*held*/) {
  thread.running = false;
  left.notify_all();
}

void SessionState::joinThread(Thread& thread, pthread_t handle) {
  {
    const Lock held(lock);
    if (!thread.joinable) return;
    thread.joinable = false;
  }
  pthread_join(handle, nullptr);
}

PortUse::PortUse(SessionState& state, int port) : _state(state), _port(state.ports[port]) {}

void PortUse::begin(const SessionState::Lock& /*held*/) {
  ++_port.uses;
  _begun = true;
}

PortUse::~PortUse() {
  if (!_begun) return;
  const SessionState::Lock held(_state.lock);
  if (--_port.uses == 0) _state.left.notify_all();
}

SessionCall::SessionCall(SessionState& state) : _state(state) {
  const SessionState::Lock held(_state.lock);
  ++_state.calls;
}

SessionCall::~SessionCall() {
  const SessionState::Lock held(_state.lock);
  if (--_state.calls == 0) _state.left.notify_all();
}
