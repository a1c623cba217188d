#include "tests/support/recording_omx.h"

#include <utility>

namespace omxtest {

using android::sp;
using android::status_t;

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
  return calls(method).size();
}

bool RecordingOmx::waitForCalls(Method method, size_t total) const {
  std::unique_lock<std::mutex> lock(_mutex);
  return _changed.wait_for(lock, kWaitLimit, [&] {
    size_t found = 0;
    for (const auto& [number, call] : _calls) found += call.method == method ? size_t{1} : 0;
    return found >= total;
  });
}

void RecordingOmx::clearCalls() {
  std::lock_guard<std::mutex> lock(_mutex);
  _calls.clear();
  _cleared = _begun;
}

void RecordingOmx::fail(Method method, size_t n, status_t status) {
  std::lock_guard<std::mutex> lock(_mutex);
  _failures.push_back({method, n, status});
}

void RecordingOmx::failWhere(Choice choice) {
  std::lock_guard<std::mutex> lock(_mutex);
  _failureChoice = std::move(choice);
}

void RecordingOmx::failNothing() {
  std::lock_guard<std::mutex> lock(_mutex);
  _failures.clear();
  _failureChoice = nullptr;
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
  std::optional<status_t> failure;
  {
    std::lock_guard<std::mutex> lock(_mutex);
    call->number = ++_begun;
    for (Failure& candidate : _failures) {
      if (candidate.left == 0 || candidate.method != call->method) continue;
      if (--candidate.left == 0) failure = candidate.status;
    }
    choice = _failureChoice;
  }
  if (!failure.has_value() && choice && choice(*call)) failure = kFailed;
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
  std::lock_guard<std::mutex> lock(_mutex);
  if (call.number > _cleared) _calls.emplace(call.number, call);
  _changed.notify_all();
  return call.status;
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

// --- Each operation: written down, and forwarded.

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

status_t RecordingOmx::listNodes(android::List<ComponentInfo>* list) {
  return run({.method = Method::ListNodes}, [&](Call&) { return _omx->listNodes(list); });
}

status_t RecordingOmx::allocateNode(const char* name, const sp<android::IOMXObserver>& observer,
                                    node_id* node) {
  *node = nullptr;
  return run({.method = Method::AllocateNode, .text = name}, [&](Call& call) {
    const sp<android::IOMXObserver> wrapped = _messages.wrap(observer);
    if (wrapped.get() == nullptr) return kFailed;
    const status_t status = _omx->allocateNode(name, wrapped, node);
    call.node = *node;
    if (status == android::OK) _messages.attach(wrapped, *node);
    return status;
  });
}

status_t RecordingOmx::freeNode(node_id node) {
  return run({.method = Method::FreeNode, .node = node}, [&](Call&) {
    const status_t status = _omx->freeNode(node);
    if (status == android::OK) _messages.detach(node);
    return status;
  });
}

status_t RecordingOmx::sendCommand(node_id node, OMX_COMMANDTYPE cmd, OMX_S32 param) {
  return run({.method = Method::SendCommand, .node = node, .command = cmd, .param = param},
             [&](Call&) { return _omx->sendCommand(node, cmd, param); });
}

status_t RecordingOmx::getParameter(node_id node, OMX_INDEXTYPE index, void* params, size_t size) {
  return runRecord(Method::GetParameter, node, index, params, size,
                   [&] { return _omx->getParameter(node, index, params, size); });
}

status_t RecordingOmx::getConfig(node_id node, OMX_INDEXTYPE index, void* params, size_t size) {
  return runRecord(Method::GetConfig, node, index, params, size,
                   [&] { return _omx->getConfig(node, index, params, size); });
}

status_t RecordingOmx::setParameter(node_id node, OMX_INDEXTYPE index, const void* params, size_t size) {
  return runRecord(Method::SetParameter, node, index, params, size,
                   [&] { return _omx->setParameter(node, index, params, size); });
}

status_t RecordingOmx::setConfig(node_id node, OMX_INDEXTYPE index, const void* params, size_t size) {
  return runRecord(Method::SetConfig, node, index, params, size,
                   [&] { return _omx->setConfig(node, index, params, size); });
}

status_t RecordingOmx::storeMetaDataInBuffers(node_id node, OMX_U32 port, OMX_BOOL enable) {
  return run({.method = Method::StoreMetaDataInBuffers, .node = node, .port = port, .enable = enable},
             [&](Call&) { return _omx->storeMetaDataInBuffers(node, port, enable); });
}

status_t RecordingOmx::useBuffer(node_id node, OMX_U32 port, const sp<android::IMemory>& params,
                                 buffer_id* buffer) {
  return runBuffer(Method::UseBuffer, node, port, params->size(), buffer,
                   [&] { return _omx->useBuffer(node, port, params, buffer); });
}

status_t RecordingOmx::allocateBufferWithBackup(node_id node, OMX_U32 port,
                                                const sp<android::IMemory>& params, buffer_id* buffer) {
  return runBuffer(Method::AllocateBufferWithBackup, node, port, params->size(), buffer,
                   [&] { return _omx->allocateBufferWithBackup(node, port, params, buffer); });
}

status_t RecordingOmx::allocateBuffer(node_id node, OMX_U32 port, size_t size, buffer_id* buffer,
                                      void** data) {
  *data = nullptr;
  return runBuffer(Method::AllocateBuffer, node, port, size, buffer,
                   [&] { return _omx->allocateBuffer(node, port, size, buffer, data); });
}

status_t RecordingOmx::freeBuffer(node_id node, OMX_U32 port, buffer_id buffer) {
  return run({.method = Method::FreeBuffer, .node = node, .port = port, .buffer = buffer},
             [&](Call&) { return _omx->freeBuffer(node, port, buffer); });
}

status_t RecordingOmx::fillBuffer(node_id node, buffer_id buffer) {
  return run({.method = Method::FillBuffer, .node = node, .buffer = buffer},
             [&](Call&) { return _omx->fillBuffer(node, buffer); });
}

status_t RecordingOmx::emptyBuffer(node_id node, buffer_id buffer, OMX_U32 offset, OMX_U32 length,
                                   OMX_U32 flags, OMX_TICKS timestamp) {
  return run({.method = Method::EmptyBuffer,
              .node = node,
              .buffer = buffer,
              .offset = offset,
              .length = length,
              .flags = flags,
              .timestamp = timestamp},
             [&](Call&) { return _omx->emptyBuffer(node, buffer, offset, length, flags, timestamp); });
}

}  // namespace omxtest
