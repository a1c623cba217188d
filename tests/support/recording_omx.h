#pragma once
// A media server's IOMX that writes down the calls that sessions make, fails those that a test asks for, runs
// a test's code before and after calls, and counts what is allocated. Messages pass its tap.
// Any thread may call it, several at once; hooks run on the calling thread and without a lock, so they may
// call it again and block.

#include <functional>
#include <map>
#include <mutex>
#include <set>
#include <type_traits>
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

  using OmxServer::OmxServer;
  ~RecordingOmx() override;  // frees what is left: the tap outlives its nodes

  MessageTap& messages() { return _messages; }

  // --- The record.

  // Completed calls, in the order in which they began.
  std::vector<Call> calls() const;
  std::vector<Call> calls(Method method) const;
  size_t count() const { return calls().size(); }  // of all completed calls
  size_t count(Method method) const { return calls(method).size(); }
  // Waits until `total` calls of that method have returned since the last clear.
  [[nodiscard]] bool waitForCalls(Method method, size_t total) const {
    return _calls.waitFor([=](const Call& call) { return call.method == method; }, total);
  }
  // Forgets the calls; numbers go on. Calls in progress are not noted.
  void clearCalls();

  // --- Failures. A failed call is not forwarded and not counted as allocated or freed; outputs are as
  // IOMX leaves them on failure.

  static constexpr auto kFailed = static_cast<android::status_t>(android::UNKNOWN_ERROR);

  // The n-th call of that method from now on, counting from 1, and only that one.
  void fail(Method method, size_t n = 1, android::status_t status = kFailed) {
    addFailure([=, left = n](const Call& call) mutable {
      return call.method == method && --left == 0 ? status : android::status_t{android::OK};
    });
  }
  // Every call that the choice picks. The choice must not call this object.
  void failWhere(const Choice& choice) {
    addFailure([=](const Call& call) { return choice(call) ? kFailed : android::status_t{android::OK}; });
  }
  // Forgets failures that did not come yet.
  void failNothing() {
    locked([&] { _failures.clear(); });
  }

  // --- Hooks: run around each forwarded call of that method until it is set anew; null: none.

  void before(Method method, Hook hook) {
    locked([&] { _before[method] = std::move(hook); });
  }
  void after(Method method, Hook hook) {
    locked([&] { _after[method] = std::move(hook); });
  }

  // --- Allocated and not freed. Buffers of a freed node are gone with it.

  size_t outstandingNodes() const {
    return locked([&] { return _allocated.size(); });
  }
  size_t outstandingBuffers() const;
  // Frees nodes whose freeNode was failed on request: their client could do no more. Not outstanding.
  void freeAbandonedNodes();
  // Buffers that nobody freed before their node.
  size_t buffersFreedWithNode() const {
    return locked([&] { return _buffersFreedWithNode; });
  }

  // --- IOMX: the calls of sessions, written down and forwarded.

  android::status_t listNodes(android::List<ComponentInfo>* list) override {
    return run({.method = Method::ListNodes}, [&](Call&) { return OmxServer::listNodes(list); });
  }
  android::status_t allocateNode(const char* name, const android::sp<android::IOMXObserver>& observer,
                                 node_id* node) override {
    *node = nullptr;
    return run({.method = Method::AllocateNode, .text = name}, [&](Call& call) {
      const android::sp<android::IOMXObserver> wrapped = _messages.wrap(observer);
      if (wrapped.get() == nullptr) return kFailed;
      const android::status_t status = OmxServer::allocateNode(name, wrapped, node);
      call.node = *node;
      if (status == android::OK) _messages.attach(wrapped, *node);
      return status;
    });
  }
  android::status_t freeNode(node_id node) override {
    return run({.method = Method::FreeNode, .node = node}, [&](Call&) {
      const android::status_t status = OmxServer::freeNode(node);
      if (status == android::OK) _messages.detach(node);
      return status;
    });
  }
  android::status_t sendCommand(node_id node, OMX_COMMANDTYPE cmd, OMX_S32 param) override {
    return run({.method = Method::SendCommand, .node = node, .command = cmd, .param = param},
               [&](Call&) { return OmxServer::sendCommand(node, cmd, param); });
  }
  android::status_t getParameter(node_id node, OMX_INDEXTYPE index, void* params, size_t size) override {
    return runRecord(Method::GetParameter, node, index, params, size,
                     [&] { return OmxServer::getParameter(node, index, params, size); });
  }
  android::status_t getConfig(node_id node, OMX_INDEXTYPE index, void* params, size_t size) override {
    return runRecord(Method::GetConfig, node, index, params, size,
                     [&] { return OmxServer::getConfig(node, index, params, size); });
  }
  android::status_t setParameter(node_id node, OMX_INDEXTYPE index, const void* params,
                                 size_t size) override {
    return runRecord(Method::SetParameter, node, index, params, size,
                     [&] { return OmxServer::setParameter(node, index, params, size); });
  }
  android::status_t setConfig(node_id node, OMX_INDEXTYPE index, const void* params, size_t size) override {
    return runRecord(Method::SetConfig, node, index, params, size,
                     [&] { return OmxServer::setConfig(node, index, params, size); });
  }
  android::status_t storeMetaDataInBuffers(node_id node, OMX_U32 port, OMX_BOOL enable) override {
    return run({.method = Method::StoreMetaDataInBuffers, .node = node, .port = port, .enable = enable},
               [&](Call&) { return OmxServer::storeMetaDataInBuffers(node, port, enable); });
  }
  android::status_t useBuffer(node_id node, OMX_U32 port, const android::sp<android::IMemory>& params,
                              buffer_id* buffer) override {
    return runBuffer(Method::UseBuffer, node, port, params->size(), buffer,
                     [&] { return OmxServer::useBuffer(node, port, params, buffer); });
  }
  android::status_t allocateBufferWithBackup(node_id node, OMX_U32 port,
                                             const android::sp<android::IMemory>& params,
                                             buffer_id* buffer) override {
    return runBuffer(Method::AllocateBufferWithBackup, node, port, params->size(), buffer,
                     [&] { return OmxServer::allocateBufferWithBackup(node, port, params, buffer); });
  }
  android::status_t allocateBuffer(node_id node, OMX_U32 port, size_t size, buffer_id* buffer,
                                   void** data) override {
    *data = nullptr;
    return runBuffer(Method::AllocateBuffer, node, port, size, buffer,
                     [&] { return OmxServer::allocateBuffer(node, port, size, buffer, data); });
  }
  android::status_t freeBuffer(node_id node, OMX_U32 port, buffer_id buffer) override {
    return run({.method = Method::FreeBuffer, .node = node, .port = port, .buffer = buffer},
               [&](Call&) { return OmxServer::freeBuffer(node, port, buffer); });
  }
  android::status_t fillBuffer(node_id node, buffer_id buffer) override {
    return run({.method = Method::FillBuffer, .node = node, .buffer = buffer},
               [&](Call&) { return OmxServer::fillBuffer(node, buffer); });
  }
  android::status_t emptyBuffer(node_id node, buffer_id buffer, OMX_U32 offset, OMX_U32 length, OMX_U32 flags,
                                OMX_TICKS timestamp) override {
    return run({.method = Method::EmptyBuffer,
                .node = node,
                .buffer = buffer,
                .offset = offset,
                .length = length,
                .flags = flags,
                .timestamp = timestamp},
               [&](Call&) { return OmxServer::emptyBuffer(node, buffer, offset, length, flags, timestamp); });
  }

 private:
  using Failure = std::function<android::status_t(const Call&)>;  // what the call is to fail with, or OK
  using Forward = std::function<android::status_t(Call& call)>;

  template <typename Action>
  std::invoke_result_t<Action> locked(Action action) const {
    const std::lock_guard<std::mutex> lock(_mutex);
    return action();
  }
  void addFailure(const Failure& failure) {
    locked([&] { _failures.push_back(failure); });
  }
  // Runs one call: failures, hooks, `forward`, books.
  android::status_t run(Call call, const Forward& forward);
  // The same for calls with a record, and for those that make a buffer.
  android::status_t runRecord(Method method, node_id node, OMX_INDEXTYPE index, const void* params,
                              size_t size, const std::function<android::status_t()>& forward);
  android::status_t runBuffer(Method method, node_id node, OMX_U32 port, size_t size, buffer_id* buffer,
                              const std::function<android::status_t()>& forward);
  android::status_t begin(Call* call);
  void keepBooks(const Call& call);

  MessageTap _messages;
  Journal<Call> _calls;
  mutable std::mutex _mutex;  // guards everything below; never held during a call or a hook
  size_t _begun = 0;
  size_t _cleared = 0;  // calls up to this number are forgotten
  std::vector<Failure> _failures;
  std::map<Method, Hook> _before;
  std::map<Method, Hook> _after;
  std::map<node_id, std::set<buffer_id>> _allocated;
  std::set<node_id> _abandoned;
  size_t _buffersFreedWithNode = 0;
};

}  // namespace omxtest
