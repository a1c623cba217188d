// The books: what was called, what is to fail, what is allocated. The forwarding itself is in
// recording_omx_calls.cpp.

#include "tests/support/recording_omx.h"

#include <algorithm>
#include <utility>

namespace omxtest {

using android::status_t;

RecordingOmx::RecordingOmx(const android::sp<android::IOMX>& omx) : _omx(omx) {}

RecordingOmx::~RecordingOmx() = default;

std::vector<Call> RecordingOmx::calls() const {
  std::lock_guard<std::mutex> lock(_mutex);
  std::vector<Call> all;
  for (const auto& [number, call] : _calls) all.push_back(call);
  return all;
}

std::vector<Call> RecordingOmx::calls(Method method) const {
  std::vector<Call> chosen = calls();
  std::erase_if(chosen, [=](const Call& call) { return call.method != method; });
  return chosen;
}

size_t RecordingOmx::count() const {
  std::lock_guard<std::mutex> lock(_mutex);
  return _calls.size();
}

size_t RecordingOmx::count(Method method) const {
  std::lock_guard<std::mutex> lock(_mutex);
  return static_cast<size_t>(std::count_if(_calls.begin(), _calls.end(),
                                           [=](const auto& entry) { return entry.second.method == method; }));
}

bool RecordingOmx::waitForCalls(Method method, size_t total, std::chrono::milliseconds limit) const {
  std::unique_lock<std::mutex> lock(_mutex);
  return _changed.wait_for(lock, limit, [&] {
    return static_cast<size_t>(std::count_if(_calls.begin(), _calls.end(), [=](const auto& entry) {
             return entry.second.method == method;
           })) >= total;
  });
}

void RecordingOmx::clearCalls() {
  std::lock_guard<std::mutex> lock(_mutex);
  _calls.clear();
  _cleared = _begun;
}

std::string RecordingOmx::describeCalls() const {
  std::string text;
  for (const Call& call : calls()) text += describe(call) + "\n";
  return text;
}

void RecordingOmx::fail(Method method, size_t n, status_t status) {
  std::lock_guard<std::mutex> lock(_mutex);
  _failures.push_back({method, n, status});
}

void RecordingOmx::failCall(size_t n, status_t status) {
  std::lock_guard<std::mutex> lock(_mutex);
  _failures.push_back({std::nullopt, n, status});
}

void RecordingOmx::failWhere(Choice choice, status_t status) {
  std::lock_guard<std::mutex> lock(_mutex);
  _failureChoice = std::move(choice);
  _choiceStatus = status;
}

void RecordingOmx::failNothing() {
  std::lock_guard<std::mutex> lock(_mutex);
  _failures.clear();
  _failureChoice = nullptr;
}

size_t RecordingOmx::failures() const {
  std::lock_guard<std::mutex> lock(_mutex);
  return _failed;
}

void RecordingOmx::before(Method method, Hook hook) {
  std::lock_guard<std::mutex> lock(_mutex);
  _before[method] = std::move(hook);
}

void RecordingOmx::after(Method method, Hook hook) {
  std::lock_guard<std::mutex> lock(_mutex);
  _after[method] = std::move(hook);
}

size_t RecordingOmx::outstandingNodes() const {
  std::lock_guard<std::mutex> lock(_mutex);
  return _allocated.size();
}

size_t RecordingOmx::outstandingBuffers() const {
  std::lock_guard<std::mutex> lock(_mutex);
  size_t sum = 0;
  for (const auto& [node, buffers] : _allocated) sum += buffers.size();
  return sum;
}

size_t RecordingOmx::abandonedNodes() const {
  std::lock_guard<std::mutex> lock(_mutex);
  return _abandoned.size();
}

void RecordingOmx::freeAbandonedNodes() {
  std::set<node_id> abandoned;
  {
    std::lock_guard<std::mutex> lock(_mutex);
    abandoned.swap(_abandoned);
  }
  for (node_id node : abandoned) {
    _omx->freeNode(node);
    _messages.detach(node);
  }
}

size_t RecordingOmx::buffersFreedWithNode() const {
  std::lock_guard<std::mutex> lock(_mutex);
  return _buffersFreedWithNode;
}

RecordingOmx::Hook RecordingOmx::hook(const std::map<Method, Hook>& hooks, Method method) const {
  std::lock_guard<std::mutex> lock(_mutex);
  const auto entry = hooks.find(method);
  return entry == hooks.end() ? nullptr : entry->second;
}

std::optional<status_t> RecordingOmx::begin(Call* call) {
  Choice choice;
  status_t choiceStatus = kFailed;
  std::optional<status_t> failure;
  {
    std::lock_guard<std::mutex> lock(_mutex);
    call->number = ++_begun;
    for (Failure& candidate : _failures) {
      if (candidate.left == 0 || (candidate.method.has_value() && *candidate.method != call->method))
        continue;
      if (--candidate.left == 0) failure = candidate.status;
    }
    choice = _failureChoice;
    choiceStatus = _choiceStatus;
  }
  if (!failure.has_value() && choice && choice(*call)) failure = choiceStatus;
  return failure;
}

status_t RecordingOmx::run(Call call, const Forward& forward) {
  const std::optional<status_t> failure = begin(&call);
  call.forwarded = !failure.has_value();
  if (call.forwarded) {
    if (const Hook first = hook(_before, call.method)) first(call);
    call.status = forward(call);
  } else {
    call.status = *failure;
  }
  keepBooks(call);
  if (call.forwarded) {
    if (const Hook last = hook(_after, call.method)) last(call);
  }
  finish(call);
  return call.status;
}

void RecordingOmx::finish(const Call& call) {
  std::lock_guard<std::mutex> lock(_mutex);
  if (!call.forwarded) ++_failed;
  if (call.number > _cleared) _calls.emplace(call.number, call);
  _changed.notify_all();
}

void RecordingOmx::keepBooks(const Call& call) {
  std::lock_guard<std::mutex> lock(_mutex);
  if (!call.forwarded) {
    if (call.method == Method::FreeNode && _allocated.erase(call.node) > 0) _abandoned.insert(call.node);
    return;
  }
  if (call.status != android::OK) return;
  switch (call.method) {
    case Method::AllocateNode:
      _allocated[call.node];
      break;
    case Method::FreeNode:
      _buffersFreedWithNode += _allocated[call.node].size();
      _allocated.erase(call.node);
      break;
    case Method::UseBuffer:
    case Method::AllocateBuffer:
    case Method::AllocateBufferWithBackup:
      // A node that was freed by somebody else meanwhile took the buffer along.
      if (_allocated.contains(call.node)) _allocated[call.node].insert(call.buffer);
      break;
    case Method::FreeBuffer:
      if (_allocated.contains(call.node)) _allocated[call.node].erase(call.buffer);
      break;
    default:
      break;
  }
}

}  // namespace omxtest
