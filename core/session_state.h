// What a session keeps beside its described members: the lock over everything that its threads
// share, and the counts that tell when threads and calls in progress have left.
//
// The model. One lock, never held while IOMX, the application or a log is called, so no thread that
// calls into the session can be made to wait for one that calls out of it. Semaphores only wake: a
// waiter tests its condition under the lock, sleeps, and tests again, and whoever changes what the
// condition reads posts. Threads hand buffer ids to each other, never record pointers. Every wait
// also ends with the session.
//
//   Member                          Written by                    Read by                  Safe by
//   _portBuffers[] and records      owner, event, delivery,       the same                 lock
//                                   output, feeders
//   _portFrameSize[]                owner, event                  owner                    lock
//   _queueOutputData: its items     delivery, output, owner and   output                   lock, then the
//                                   event (flush)                                          queue's own
//   _queueThreadMessages            delivery, event, destructor   delivery, event          as above
//   _memoryDealer[]                 owner, event                  owner, event             deInit lets the
//                                                                                          event finish
//   _mpMemHeap                      delivery                      any                      lock
//   _inputCallback, _output-        any                           delivery, output, who    lock, read as a
//   Callback with their contexts                                  records a failure        pair
//   _threadError                    any                           any                      SharedValue; what
//   _omxState                       delivery                      any                      a wait reads is
//   _endOfOutputReached             output, event                 any                      changed under the
//   _portReconfiguring              event                         any                      lock
//   _endOfInputPending              feeders                       delivery, output
//   _inputClosed, _deinitDone       feeders; owner                any                      SharedValue
//   _eventThreadWaiting             event                         destructor               SharedValue
//   _platformWrapper                owner                         any                      lock, wrapperUses
//   _omx, _node, _isEncoder,        owner, before init()          any                      constant from
//   _componentName,                                                                        then on
//   _portBufferMode[], _observer
//   _outputThread, _eventThread     owner                         destructor               lock (Thread)
//   _outputConvertBuffer[Size]      output                        destructor               output thread gone
#pragma once

#include <pthread.h>
#include <semaphore.h>
#include <stdint.h>

#include <atomic>
#include <condition_variable>
#include <mutex>

#include <OMX_Core.h>
#include <utils/RefBase.h>

#include "core/omx_codec_observer.h"

struct SessionState {
  using Lock = std::unique_lock<std::mutex>;

  std::mutex lock;

  // Signalled, with the lock held, when a call, a thread, a port use or a wrapper use leaves.
  std::condition_variable left;

  // --- The end of the session ---------------------------------------------------------------------
  bool ending = false;  // destruction has begun: every wait returns, nothing new starts
  int calls = 0;        // operations of the session in progress (SessionCall)
  // What the node calls back through. `_observer` is the same, unless somebody has replaced it.
  android::sp<OmxCodecObserver> nodeObserver;

  // --- Threads of the session -----------------------------------------------------------------------
  struct Thread {
    bool joinable = false;  // a handle to reap
    bool running = false;
  };
  Thread outputThread;
  Thread eventThread;
  bool delivering = false;  // the output thread is inside the output callback

  // --- Ports --------------------------------------------------------------------------------------------
  struct Port {
    uint32_t capacity = 0;  // bytes of each buffer (a record's own length is overwritten by sends)
    int uses = 0;           // IOMX calls, copies and callbacks that use a record outside the lock
    bool freeing = false;   // its records are about to go: no new use begins
  };
  Port ports[2];

  // --- State changes ------------------------------------------------------------------------------------
  // The state that the owner waits for and whether its completion came since. Kept apart from
  // _omxState, which a late or doubled completion of another state may overwrite before the owner looks.
  int32_t awaitedState = OMX_StateInvalid;
  bool awaitedStateReached = false;
  // The component got to Idle and no further. The owner's own, but deInit() may come while an init() hangs.
  std::atomic<bool> idle{false};

  // --- Taking the session down -------------------------------------------------------------------------
  // deInit has passed its first wait: nothing goes to the output port any more and no reconfiguration
  // begins a step.
  bool tearingDown = false;
  int fills = 0;  // calls of fillBuffer in progress, which the command to go Idle must not overtake

  // --- Reconfiguration (decoder, event thread) -----------------------------------------------------
  bool handlingEvent = false;          // the event thread is inside onEvent
  bool reconfigurationStep = false;    // ... and inside a step of IOMX calls that deInit lets finish first
  bool componentFailed = false;        // an error event waits behind the one being handled
  bool changingSettings = false;       // from the disable until the enable has completed
  bool settingsChangePending = false;  // announced while the last change was still being carried out

  // --- Platform wrapper ------------------------------------------------------------------------------------
  int wrapperUses = 0;

  // --- Sleepers on each semaphore that more than one thread may wait for --------------------------------
  int stateWaiters = 0;
  int endOfOutputWaiters = 0;
  int outputReturnWaiters = 0;
  int inputFreeWaiters = 0;

  // Waits until `ready()` holds or the session ends; `held` is the lock, released while asleep.
  // A post wakes one sleeper: the one that leaves wakes the next, who tests for itself.
  template <typename Ready>
  void await(Lock& held, sem_t& wakeUp, int& waiters, Ready ready) {
    ++waiters;
    while (!ending && !ready()) {
      held.unlock();
      sleepOn(wakeUp);
      held.lock();
    }
    if (--waiters > 0) sem_post(&wakeUp);
  }

  // Waits for one post of `wakeUp`, whatever signals interrupt it.
  static void sleepOn(sem_t& wakeUp);

  // Starts a session thread, or keeps the one that runs. 0, or pthread_create's error.
  int startThread(Thread& thread, pthread_t& handle, void* (*entry)(void*), void* argument);
  // A session thread's last act, with the lock held: having let go of that, it touches the session no
  // more.
  void leaveThread(Thread& thread, const Lock& held);
  // Reaps a thread that has left or is about to; the caller makes sure that it was told to.
  void joinThread(Thread& thread, pthread_t handle);
};

// One use of a port's records outside the lock (an IOMX call, a copy, a callback): they are not freed
// before it has left. Made without the lock, begun with it, together with the look-up of the record.
class PortUse {
 public:
  PortUse(SessionState& state, int port);
  ~PortUse();
  void begin(const SessionState::Lock& held);
  PortUse(const PortUse&) = delete;
  PortUse& operator=(const PortUse&) = delete;

 private:
  SessionState& _state;
  SessionState::Port& _port;
  bool _begun = false;
};

// An operation in progress: the session is not destroyed before it has left. Cheap enough for the
// feeding path (one uncontended lock each way).
class SessionCall {
 public:
  explicit SessionCall(SessionState& state);
  ~SessionCall();
  SessionCall(const SessionCall&) = delete;
  SessionCall& operator=(const SessionCall&) = delete;

 private:
  SessionState& _state;
};
