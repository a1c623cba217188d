// The IOMX of this media server: the list of components and the table of nodes. Finds a call's node by its
// id, checks arguments, and turns the node's IL results into statuses.
// Any thread may call it, several at once. A call keeps its node alive until it returns, also when the
// node is freed meanwhile. No lock is held while a node or a client is called. Ids are numbers: one that is
// unknown or out of date gives UNKNOWN_ERROR, as every misuse does. A client whose observer dies has gone
// away without freeing its nodes, and they are freed for it.
#pragma once

#include <chrono>
#include <cstdint>
#include <map>
#include <memory>
#include <mutex>
#include <vector>

#include <media/IOMX.h>

#include "host/mediaserver/codec.h"
#include "host/mediaserver/node.h"

namespace mediaserver {

class OmxServer : public android::BnOMX, public android::IBinder::DeathRecipient {
 public:
  // Clients see the components in this order. `readingTime`: see Node::create.
  explicit OmxServer(std::vector<Component> components,
                     std::chrono::milliseconds readingTime = std::chrono::milliseconds(500));
  ~OmxServer() override;

  // How many nodes are allocated.
  size_t nodeCount() const;

  bool livesLocally(pid_t pid) override;
  android::status_t listNodes(android::List<ComponentInfo>* list) override;
  android::status_t allocateNode(const char* name, const android::sp<android::IOMXObserver>& observer,
                                 node_id* node) override;
  // No message is delivered after it has returned; see Node::shutdown for what it waits for.
  android::status_t freeNode(node_id node) override;
  android::status_t sendCommand(node_id node, OMX_COMMANDTYPE cmd, OMX_S32 param) override;
  android::status_t getParameter(node_id node, OMX_INDEXTYPE index, void* params, size_t size) override;
  android::status_t setParameter(node_id node, OMX_INDEXTYPE index, const void* params, size_t size) override;
  android::status_t getConfig(node_id node, OMX_INDEXTYPE index, void* params, size_t size) override;
  android::status_t setConfig(node_id node, OMX_INDEXTYPE index, const void* params, size_t size) override;
  android::status_t getState(node_id node, OMX_STATETYPE* state) override;
  // Works where the codec declares the extension of that name.
  android::status_t storeMetaDataInBuffers(node_id node, OMX_U32 port_index, OMX_BOOL enable) override;
  // There are no graphic buffers here: these three always fail.
  android::status_t enableGraphicBuffers(node_id node, OMX_U32 port_index, OMX_BOOL enable) override;
  android::status_t getGraphicBufferUsage(node_id node, OMX_U32 port_index, OMX_U32* usage) override;
  android::status_t useGraphicBuffer(node_id node, OMX_U32 port_index,
                                     const android::sp<android::GraphicBuffer>& graphicBuffer,
                                     buffer_id* buffer) override;
  android::status_t useBuffer(node_id node, OMX_U32 port_index, const android::sp<android::IMemory>& params,
                              buffer_id* buffer) override;
  android::status_t allocateBuffer(node_id node, OMX_U32 port_index, size_t size, buffer_id* buffer,
                                   void** buffer_data) override;
  android::status_t allocateBufferWithBackup(node_id node, OMX_U32 port_index,
                                             const android::sp<android::IMemory>& params,
                                             buffer_id* buffer) override;
  android::status_t freeBuffer(node_id node, OMX_U32 port_index, buffer_id buffer) override;
  android::status_t fillBuffer(node_id node, buffer_id buffer) override;
  android::status_t emptyBuffer(node_id node, buffer_id buffer, OMX_U32 range_offset, OMX_U32 range_length,
                                OMX_U32 flags, OMX_TICKS timestamp) override;
  android::status_t getExtensionIndex(node_id node, const char* parameter_name,
                                      OMX_INDEXTYPE* index) override;
  void binderDied(const android::wp<android::IBinder>& who) override;

 private:
  struct Entry {
    std::shared_ptr<Node> node;
    android::wp<android::IBinder> client;
  };

  std::shared_ptr<Node> find(node_id node) const;
  android::status_t addBuffer(node_id node, OMX_U32 port, const std::shared_ptr<Buffer>& buffer,
                              buffer_id* id);

  const std::vector<Component> _components;
  const std::chrono::milliseconds _readingTime;
  mutable std::mutex _mutex;  // guards the two below
  uintptr_t _lastId = 0;
  std::map<node_id, Entry> _nodes;
};

}  // namespace mediaserver
