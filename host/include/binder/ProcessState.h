// ProcessState: the process's part in binder. A client starts the pool that delivers its callbacks.
#pragma once

#include <utils/RefBase.h>

namespace android {

class ProcessState : public virtual RefBase {
 public:
  static sp<ProcessState> self();

  // May be called any number of times, from any thread. On this port services deliver from threads of
  // their own, so nothing but the wish is noted (see omxhost/services.h).
  void startThreadPool();

 private:
  ProcessState();
  ~ProcessState() override;
};

}  // namespace android
