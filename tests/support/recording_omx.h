#pragma once
// An IOMX in front of another one: writes down the calls that sessions make, fails those that a test asks
// for, runs a test's code before and after calls, and counts what is allocated. Messages pass its tap.
// Any thread may call it, several at once; hooks run on the calling thread and without a lock, so they may
// call the wrapper again and block. Keeps the wrapped IOMX alive.

#include <condition_variable>
#include <functional>
#include <map>
#include <mutex>
#include <optional>
#include <set>
#include <vector>

#include <media/IOMX.h>

#include "tests/support/call.h"
#include "tests/support/message_tap.h"

namespace omxtest {

class RecordingOmx : public android::BnOMX {
 public:
  using Hook = std::function<void(const Call&)>;
  using Choice = std::function<bool(const Call&)>;

  explicit RecordingOmx(const android::sp<android::IOMX>& omx) : _omx(omx) {}

  MessageTap& messages() { return _messages; }

  // --- The record.

  // Completed calls, in the order in which they began.
  std::vector<Call> calls() const;
  std::vector<Call> calls(Method method) const;
  size_t count() const;  // of all completed calls
  size_t count(Method method) const;
  // Waits until `total` calls of that method have returned since the last clear.
  [[nodiscard]] bool waitForCalls(Method method, size_t total) const;
  // Forgets the calls; numbers go on. Calls in progress are not noted.
  void clearCalls();

  // --- Failures. A failed call is not forwarded and not counted as allocated or freed; outputs are as
  // IOMX leaves them on failure.

  static constexpr auto kFailed = static_cast<android::status_t>(android::UNKNOWN_ERROR);

  // The n-th call of that method from now on, counting from 1, and only that one.
  void fail(Method method, size_t n = 1, android::status_t status = kFailed);
  // Every call that the choice picks. The choice runs on the caller's thread, without a lock.
  void failWhere(Choice choice);
  // Forgets failures that did not come yet.
  void failNothing();

  // --- Hooks: run around each forwarded call of that method until it is set anew; null: none.

  void before(Method method, Hook hook);
  void after(Method method, Hook hook);

  // --- Allocated and not freed. Buffers of a freed node are gone with it.

  size_t outstandingNodes() const;
  size_t outstandingBuffers() const;
  // Frees nodes whose freeNode was failed on request: their client could do no more. Not outstanding.
  void freeAbandonedNodes();
  // Buffers that nobody freed before their node.
  size_t buffersFreedWithNode() const;

  // --- IOMX.

  android::status_t listNodes(android::List<ComponentInfo>* list) override;
  android::status_t allocateNode(const char* name, const android::sp<android::IOMXObserver>& observer,
                                 node_id* node) override;
  android::status_t freeNode(node_id node) override;
  android::status_t sendCommand(node_id node, OMX_COMMANDTYPE cmd, OMX_S32 param) override;
  android::status_t getParameter(node_id node, OMX_INDEXTYPE index, void* params, size_t size) override;
  android::status_t setParameter(node_id node, OMX_INDEXTYPE index, const void* params, size_t size) override;
  android::status_t getConfig(node_id node, OMX_INDEXTYPE index, void* params, size_t size) override;
  android::status_t setConfig(node_id node, OMX_INDEXTYPE index, const void* params, size_t size) override;
  android::status_t storeMetaDataInBuffers(node_id node, OMX_U32 port, OMX_BOOL enable) override;
  android::status_t useBuffer(node_id node, OMX_U32 port, const android::sp<android::IMemory>& params,
                              buffer_id* buffer) override;
  android::status_t allocateBuffer(node_id node, OMX_U32 port, size_t size, buffer_id* buffer,
                                   void** data) override;
  android::status_t allocateBufferWithBackup(node_id node, OMX_U32 port,
                                             const android::sp<android::IMemory>& params,
                                             buffer_id* buffer) override;
  android::status_t freeBuffer(node_id node, OMX_U32 port, buffer_id buffer) override;
  android::status_t fillBuffer(node_id node, buffer_id buffer) override;
  android::status_t emptyBuffer(node_id node, buffer_id buffer, OMX_U32 offset, OMX_U32 length, OMX_U32 flags,
                                OMX_TICKS timestamp) override;

  // Passed on as they are.
  bool livesLocally(pid_t pid) override { return _omx->livesLocally(pid); }
  android::status_t getState(node_id node, OMX_STATETYPE* state) override {
    return _omx->getState(node, state);
  }
  android::status_t enableGraphicBuffers(node_id node, OMX_U32 port, OMX_BOOL enable) override {
    return _omx->enableGraphicBuffers(node, port, enable);
  }
  android::status_t getGraphicBufferUsage(node_id node, OMX_U32 port, OMX_U32* usage) override {
    return _omx->getGraphicBufferUsage(node, port, usage);
  }
  android::status_t useGraphicBuffer(node_id node, OMX_U32 port,
                                     const android::sp<android::GraphicBuffer>& graphicBuffer,
                                     buffer_id* buffer) override {
    return _omx->useGraphicBuffer(node, port, graphicBuffer, buffer);
  }
  android::status_t getExtensionIndex(node_id node, const char* extension, OMX_INDEXTYPE* index) override {
    return _omx->getExtensionIndex(node, extension, index);
  }

 private:
  struct Failure {
    Method method;
    size_t left;
    android::status_t status;
  };
  using Forward = std::function<android::status_t(Call& call)>;

  // Runs one call: failures, hooks, `forward`, books.
  android::status_t run(Call call, const Forward& forward);
  // The same for calls with a record, and for those that make a buffer.
  android::status_t runRecord(Method method, node_id node, OMX_INDEXTYPE index, const void* params,
                              size_t size, const std::function<android::status_t()>& forward);
  android::status_t runBuffer(Method method, node_id node, OMX_U32 port, size_t size, buffer_id* buffer,
                              const std::function<android::status_t()>& forward);
  std::optional<android::status_t> begin(Call* call);
  void keepBooks(const Call& call);
  Hook hook(const std::map<Method, Hook>& hooks, Method method) const;

  const android::sp<android::IOMX> _omx;
  MessageTap _messages;

  mutable std::mutex _mutex;  // guards everything below; never held during a call or a hook
  mutable std::condition_variable _changed;
  size_t _begun = 0;
  size_t _cleared = 0;  // calls up to this number are forgotten
  std::map<size_t, Call> _calls;
  std::vector<Failure> _failures;
  Choice _failureChoice;
  std::map<Method, Hook> _before;
  std::map<Method, Hook> _after;
  std::map<node_id, std::set<buffer_id>> _allocated;
  std::set<node_id> _abandoned;
  size_t _buffersFreedWithNode = 0;
};

}  // namespace omxtest
