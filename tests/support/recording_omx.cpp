#include "tests/support/recording_omx.h"

#include <algorithm>

namespace omxtest {

using android::status_t;

RecordingOmx::~RecordingOmx() {
  freeAbandonedNodes();
  for (const auto& [node, buffers] : _allocated) OmxServer::freeNode(node);
}

std::vector<Call> RecordingOmx::calls() const {
  std::vector<Call> all = _calls.all();
  std::sort(all.begin(), all.end(), [](const Call& a, const Call& b) { return a.number < b.number; });
  return all;
}

std::vector<Call> RecordingOmx::calls(Method method) const {
  std::vector<Call> chosen = calls();
  std::erase_if(chosen, [=](const Call& call) { return call.method != method; });
  return chosen;
}

void RecordingOmx::clearCalls() {
  locked([&] {
    _calls.clear();
    _cleared = _begun;
  });
}

size_t RecordingOmx::outstandingBuffers() const {
  std::lock_guard<std::mutex> lock(_mutex);
  size_t sum = 0;
  for (const auto& [node, buffers] : _allocated) sum += buffers.size();
  return sum;
}

void RecordingOmx::freeAbandonedNodes() {
  const std::set<node_id> abandoned = locked([&] { return std::exchange(_abandoned, {}); });
  for (node_id node : abandoned) {
    OmxServer::freeNode(node);
    _messages.detach(node);
  }
}

// Every failure is asked about every call, which it may count.
status_t RecordingOmx::begin(Call* call) {
  std::lock_guard<std::mutex> lock(_mutex);
  call->number = ++_begun;
  status_t failed = android::OK;
  for (Failure& failure : _failures) {
    const status_t status = failure(*call);
    if (status != android::OK) failed = status;
  }
  return failed;
}

status_t RecordingOmx::run(Call call, const Forward& forward) {
  call.status = begin(&call);
  call.forwarded = call.status == android::OK;
  if (call.forwarded) {
    if (const Hook hook = locked([&] { return _before[call.method]; })) hook(call);
    call.status = forward(call);
  }
  keepBooks(call);
  if (call.forwarded) {
    if (const Hook hook = locked([&] { return _after[call.method]; })) hook(call);
  }
  std::lock_guard<std::mutex> lock(_mutex);
  if (call.number > _cleared) _calls.add(call);
  return call.status;
}

void RecordingOmx::keepBooks(const Call& call) {
  std::lock_guard<std::mutex> lock(_mutex);
  if (call.forwarded && call.status != android::OK) return;
  if (call.method == Method::AllocateNode && call.forwarded) _allocated[call.node];
  const auto node = _allocated.find(call.node);
  if (node == _allocated.end()) return;  // freed by somebody else meanwhile, and its buffers with it
  if (call.method == Method::FreeNode) {
    if (call.forwarded) _buffersFreedWithNode += node->second.size();
    if (!call.forwarded) _abandoned.insert(call.node);
    _allocated.erase(node);
  } else if (call.method == Method::FreeBuffer && call.forwarded) {
    node->second.erase(call.buffer);
  } else if (call.method >= Method::UseBuffer && call.method <= Method::AllocateBufferWithBackup) {
    if (call.forwarded) node->second.insert(call.buffer);
  }
}

status_t RecordingOmx::runRecord(Method method, node_id node, OMX_INDEXTYPE index, const void* params,
                                 size_t size, const std::function<status_t()>& forward) {
  const auto* const bytes = static_cast<const uint8_t*>(params);
  return run({.method = method, .node = node, .index = index, .record = {bytes, bytes + size}, .size = size},
             [&](Call& call) {
               const status_t status = forward();
               call.record.assign(bytes, bytes + size);  // of a get: as answered
               return status;
             });
}

status_t RecordingOmx::runBuffer(Method method, node_id node, OMX_U32 port, size_t size, buffer_id* buffer,
                                 const std::function<status_t()>& forward) {
  *buffer = nullptr;
  return run({.method = method, .node = node, .size = size, .port = port}, [&](Call& call) {
    const status_t status = forward();
    call.buffer = *buffer;
    return status;
  });
}

}  // namespace omxtest
