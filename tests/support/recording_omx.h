#pragma once
// A media server's IOMX that writes down the calls that sessions make, fails those that a test asks for, and
// runs a test's code before and after calls. Messages pass a tap, which has to outlive it.
// Any thread may call it; hooks run on the calling thread and without a lock, so they may call it and block.

#include <algorithm>
#include <functional>
#include <map>
#include <mutex>
#include <utility>
#include <vector>

#include "host/mediaserver/omx_server.h"
#include "tests/support/call.h"
#include "tests/support/message_tap.h"

namespace omxtest {

class RecordingOmx : public mediaserver::OmxServer {
 public:
  using Hook = std::function<void(const Call&)>;
  using Choice = std::function<bool(const Call&)>;

  RecordingOmx(MessageTap& messages, std::vector<mediaserver::Component> components,
               std::chrono::milliseconds readingTime)
      : OmxServer(std::move(components), readingTime), _messages(messages) {}

  // --- The record.

  // Completed calls, in the order in which they began.
  std::vector<Call> calls() const {
    std::vector<Call> all = _calls.all();
    std::sort(all.begin(), all.end(), [](const Call& a, const Call& b) { return a.number < b.number; });
    return all;
  }
  std::vector<Call> calls(Method method) const {
    std::vector<Call> chosen = calls();
    std::erase_if(chosen, [=](const Call& call) { return call.method != method; });
    return chosen;
  }
  size_t count() const { return calls().size(); }  // of all completed calls
  size_t count(Method method) const { return calls(method).size(); }
  // Waits until `total` calls of that method have returned since the last clear.
  [[nodiscard]] bool waitForCalls(Method method, size_t total) const {
    return _calls.waitFor([=](const Call& call) { return call.method == method; }, total);
  }
  // Forgets the calls; numbers go on.
  void clearCalls() { _calls.clear(); }

  // --- Failures. A failed call is not forwarded, but for freeNode, after which a client could do no more;
  // outputs are as IOMX leaves them on failure.

  static constexpr auto kFailed = static_cast<android::status_t>(android::UNKNOWN_ERROR);

  // The n-th call of that method from now on, counting from 1, and only that one.
  void fail(Method method, size_t n = 1) {
    failWhere([=, left = n](const Call& call) mutable { return call.method == method && --left == 0; });
  }
  // Every call that the choice picks, which is asked about each call. It must not call this object.
  void failWhere(Choice choice) {
    const std::lock_guard<std::mutex> lock(_mutex);
    _failures.push_back(std::move(choice));
  }

  // --- Hooks: run around each forwarded call of that method until it is set anew; null: none.

  void before(Method method, Hook hook) {
    const std::lock_guard<std::mutex> lock(_mutex);
    _before[method] = std::move(hook);
  }
  void after(Method method, Hook hook) {
    const std::lock_guard<std::mutex> lock(_mutex);
    _after[method] = std::move(hook);
  }

  // --- IOMX: the calls of sessions, written down and forwarded.

  using status_t = android::status_t;
  using Memory = android::sp<android::IMemory>;

  status_t listNodes(android::List<ComponentInfo>* list) override {
    return run({.method = Method::ListNodes}, [&](Call&) { return OmxServer::listNodes(list); });
  }
  status_t allocateNode(const char* name, const android::sp<android::IOMXObserver>& observer,
                        node_id* node) override {
    *node = nullptr;
    return run({.method = Method::AllocateNode, .text = name}, [&](Call& call) {
      const android::sp<MessageTap::Observer> wrapped = new MessageTap::Observer(_messages, observer);
      const status_t status = OmxServer::allocateNode(name, wrapped, node);
      call.node = *node;
      if (status == android::OK) _messages.attach(wrapped, *node);
      return status;
    });
  }
  status_t freeNode(node_id node) override {
    return run({.method = Method::FreeNode, .node = node}, [&](Call&) { return OmxServer::freeNode(node); });
  }
  status_t sendCommand(node_id node, OMX_COMMANDTYPE cmd, OMX_S32 param) override {
    return run({.method = Method::SendCommand, .node = node, .command = cmd, .param = param},
               [&](Call&) { return OmxServer::sendCommand(node, cmd, param); });
  }
  status_t getParameter(node_id node, OMX_INDEXTYPE index, void* params, size_t size) override {
    return runRecord(Method::GetParameter, node, index, params, size,
                     [&] { return OmxServer::getParameter(node, index, params, size); });
  }
  status_t getConfig(node_id node, OMX_INDEXTYPE index, void* params, size_t size) override {
    return runRecord(Method::GetConfig, node, index, params, size,
                     [&] { return OmxServer::getConfig(node, index, params, size); });
  }
  status_t setParameter(node_id node, OMX_INDEXTYPE index, const void* params, size_t size) override {
    return runRecord(Method::SetParameter, node, index, params, size,
                     [&] { return OmxServer::setParameter(node, index, params, size); });
  }
  status_t setConfig(node_id node, OMX_INDEXTYPE index, const void* params, size_t size) override {
    return runRecord(Method::SetConfig, node, index, params, size,
                     [&] { return OmxServer::setConfig(node, index, params, size); });
  }
  status_t storeMetaDataInBuffers(node_id node, OMX_U32 port, OMX_BOOL enable) override {
    return run({.method = Method::StoreMetaDataInBuffers, .node = node, .port = port, .enable = enable},
               [&](Call&) { return OmxServer::storeMetaDataInBuffers(node, port, enable); });
  }
  status_t useBuffer(node_id node, OMX_U32 port, const Memory& params, buffer_id* buffer) override {
    return runBuffer(Method::UseBuffer, node, port, params->size(), buffer,
                     [&] { return OmxServer::useBuffer(node, port, params, buffer); });
  }
  status_t allocateBufferWithBackup(node_id node, OMX_U32 port, const Memory& params,
                                    buffer_id* buffer) override {
    return runBuffer(Method::AllocateBufferWithBackup, node, port, params->size(), buffer,
                     [&] { return OmxServer::allocateBufferWithBackup(node, port, params, buffer); });
  }
  status_t allocateBuffer(node_id node, OMX_U32 port, size_t size, buffer_id* buffer, void** data) override {
    *data = nullptr;
    return runBuffer(Method::AllocateBuffer, node, port, size, buffer,
                     [&] { return OmxServer::allocateBuffer(node, port, size, buffer, data); });
  }
  status_t freeBuffer(node_id node, OMX_U32 port, buffer_id buffer) override {
    return run({.method = Method::FreeBuffer, .node = node, .port = port, .buffer = buffer},
               [&](Call&) { return OmxServer::freeBuffer(node, port, buffer); });
  }
  status_t fillBuffer(node_id node, buffer_id buffer) override {
    return run({.method = Method::FillBuffer, .node = node, .buffer = buffer},
               [&](Call&) { return OmxServer::fillBuffer(node, buffer); });
  }
  status_t emptyBuffer(node_id node, buffer_id buffer, OMX_U32 offset, OMX_U32 length, OMX_U32 flags,
                       OMX_TICKS timestamp) override {
    Call call{.method = Method::EmptyBuffer, .node = node, .buffer = buffer, .offset = offset};
    call.length = length;
    call.flags = flags;
    call.timestamp = timestamp;
    return run(call,
               [&](Call&) { return OmxServer::emptyBuffer(node, buffer, offset, length, flags, timestamp); });
  }

 private:
  // Runs one call: failures, hooks, `forward`, the record.
  status_t run(Call call, const std::function<status_t(Call& call)>& forward) {
    std::unique_lock<std::mutex> lock(_mutex);
    call.number = ++_begun;
    for (const Choice& fails : _failures) {
      if (fails(call)) call.status = kFailed;
    }
    const Hook before = _before[call.method];
    const Hook after = _after[call.method];
    lock.unlock();
    const bool forwarded = call.status == android::OK;
    if (forwarded && before) before(call);
    if (forwarded) call.status = forward(call);
    if (forwarded && after) after(call);
    if (!forwarded && call.method == Method::FreeNode) static_cast<void>(forward(call));
    _calls.add(call);
    return call.status;
  }
  // The same for calls with a record, and for those that make a buffer.
  status_t runRecord(Method method, node_id node, OMX_INDEXTYPE index, const void* params, size_t size,
                     const std::function<status_t()>& forward) {
    const auto* const bytes = static_cast<const uint8_t*>(params);
    Call call{.method = method, .node = node, .index = index, .record = {bytes, bytes + size}, .size = size};
    return run(std::move(call), [&](Call& made) {
      const status_t status = forward();
      made.record.assign(bytes, bytes + size);  // of a get: as answered
      return status;
    });
  }
  status_t runBuffer(Method method, node_id node, OMX_U32 port, size_t size, buffer_id* buffer,
                     const std::function<status_t()>& forward) {
    *buffer = nullptr;
    return run({.method = method, .node = node, .size = size, .port = port}, [&](Call& made) {
      const status_t status = forward();
      made.buffer = *buffer;
      return status;
    });
  }

  MessageTap& _messages;
  Journal<Call> _calls;
  std::mutex _mutex;  // guards everything below; never held during a call or a hook
  size_t _begun = 0;
  std::vector<Choice> _failures;
  std::map<Method, Hook> _before;
  std::map<Method, Hook> _after;
};

}  // namespace omxtest
