#include <atomic>

#include <binder/ProcessState.h>
#include <omxhost/services.h>

namespace android {

namespace {

std::atomic<bool> threadPoolStarted{false};

}  // namespace

ProcessState::ProcessState() = default;
ProcessState::~ProcessState() = default;

sp<ProcessState> ProcessState::self() {
  // Never destroyed: threads may still ask while the process exits.
  static const sp<ProcessState>& state = *new sp<ProcessState>(new ProcessState());
  return state;
}

void ProcessState::startThreadPool() {
  threadPoolStarted.store(true);
}

}  // namespace android

bool omxhost::isThreadPoolStarted() {
  return android::threadPoolStarted.load();
}
