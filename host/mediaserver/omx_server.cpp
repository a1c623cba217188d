#include "host/mediaserver/omx_server.h"

#include <unistd.h>

#include <utility>

#include <android/log.h>
#include <media/stagefright/MediaErrors.h>

#include "host/mediaserver/buffer.h"

namespace mediaserver {

using android::sp;
using android::status_t;

namespace {

constexpr auto kFailed = static_cast<status_t>(android::UNKNOWN_ERROR);

// Clients learn of a component's failures only this much.
status_t statusOf(OMX_ERRORTYPE error) {
  switch (error) {
    case OMX_ErrorNone:
      return android::OK;
    case OMX_ErrorUnsupportedSetting:
      return android::ERROR_UNSUPPORTED;
    default:
      return kFailed;
  }
}

constexpr const char* kMetaDataExtension = "OMX.google.android.index.storeMetaDataInBuffers";

struct StoreMetaDataParams {
  OMX_U32 nSize;
  OMX_VERSIONTYPE nVersion;
  OMX_U32 nPortIndex;
  OMX_BOOL bStoreMetaData;
};
static_assert(sizeof(StoreMetaDataParams) == 16);

}  // namespace

OmxServer::OmxServer(std::vector<Component> components, std::chrono::milliseconds readingTime)
    : _components(std::move(components)), _readingTime(readingTime) {}

OmxServer::~OmxServer() {
  for (const auto& [id, entry] : _nodes) entry.node->shutdown();
}

size_t OmxServer::nodeCount() const {
  std::lock_guard<std::mutex> lock(_mutex);
  return _nodes.size();
}

std::shared_ptr<Node> OmxServer::find(node_id node) const {
  std::lock_guard<std::mutex> lock(_mutex);
  const auto entry = _nodes.find(node);
  return entry == _nodes.end() ? nullptr : entry->second.node;
}

bool OmxServer::livesLocally(pid_t pid) {
  return pid == getpid();
}

status_t OmxServer::listNodes(android::List<ComponentInfo>* list) {
  if (list == nullptr) return kFailed;
  list->clear();
  for (const Component& component : _components) {
    ComponentInfo info;
    info.mName = component.name.c_str();
    for (const std::string& role : component.roles) info.mRoles.push_back(android::String8(role.c_str()));
    list->push_back(info);
  }
  return android::OK;
}

status_t OmxServer::allocateNode(const char* name, const sp<android::IOMXObserver>& observer, node_id* node) {
  if (node == nullptr) return kFailed;
  *node = nullptr;
  if (name == nullptr || observer.get() == nullptr) return kFailed;
  for (const Component& component : _components) {
    if (component.name != name) continue;
    node_id id = nullptr;
    {
      std::lock_guard<std::mutex> lock(_mutex);
      id = reinterpret_cast<node_id>(++_lastId);
    }
    std::shared_ptr<Node> created = Node::create(id, component, observer, _readingTime);
    if (created == nullptr) return kFailed;
    *node = id;
    // The caller holds the observer, so nobody is told before the table knows the node.
    const sp<android::IBinder> client = observer->asBinder();
    client->linkToDeath(this, id);
    std::lock_guard<std::mutex> lock(_mutex);
    _nodes.emplace(id, Entry{std::move(created), client});
    return android::OK;
  }
  return kFailed;
}

status_t OmxServer::freeNode(node_id node) {
  Entry freed;
  {
    std::lock_guard<std::mutex> lock(_mutex);
    const auto entry = _nodes.find(node);
    if (entry == _nodes.end()) return kFailed;
    freed = std::move(entry->second);
    _nodes.erase(entry);
  }
  if (const sp<android::IBinder> client = freed.client.promote(); client != nullptr) {
    client->unlinkToDeath(this, node);
  }
  freed.node->shutdown();
  return android::OK;
}

void OmxServer::binderDied(const android::wp<android::IBinder>& who) {
  std::vector<node_id> left;
  {
    std::lock_guard<std::mutex> lock(_mutex);
    for (const auto& [id, entry] : _nodes) {
      if (entry.client == who) left.push_back(id);
    }
  }
  for (const node_id node : left) {
    if (freeNode(node) != android::OK) continue;
    __android_log_print(ANDROID_LOG_WARN, "omxmediaserver", "node %zu is freed: its client has gone away",
                        reinterpret_cast<size_t>(node));
  }
}

status_t OmxServer::sendCommand(node_id node, OMX_COMMANDTYPE cmd, OMX_S32 param) {
  const std::shared_ptr<Node> found = find(node);
  return found == nullptr ? kFailed : statusOf(found->sendCommand(cmd, static_cast<OMX_U32>(param)));
}

status_t OmxServer::getParameter(node_id node, OMX_INDEXTYPE index, void* params, size_t size) {
  const std::shared_ptr<Node> found = find(node);
  return found == nullptr ? kFailed : statusOf(found->getParameter(index, params, size));
}

status_t OmxServer::setParameter(node_id node, OMX_INDEXTYPE index, const void* params, size_t size) {
  const std::shared_ptr<Node> found = find(node);
  return found == nullptr ? kFailed : statusOf(found->setParameter(index, params, size));
}

status_t OmxServer::getConfig(node_id node, OMX_INDEXTYPE index, void* params, size_t size) {
  const std::shared_ptr<Node> found = find(node);
  return found == nullptr ? kFailed : statusOf(found->getConfig(index, params, size));
}

status_t OmxServer::setConfig(node_id node, OMX_INDEXTYPE index, const void* params, size_t size) {
  const std::shared_ptr<Node> found = find(node);
  return found == nullptr ? kFailed : statusOf(found->setConfig(index, params, size));
}

status_t OmxServer::getState(node_id node, OMX_STATETYPE* state) {
  const std::shared_ptr<Node> found = find(node);
  if (found == nullptr || state == nullptr) return kFailed;
  *state = found->state();
  return android::OK;
}

status_t OmxServer::storeMetaDataInBuffers(node_id node, OMX_U32 port_index, OMX_BOOL enable) {
  const std::shared_ptr<Node> found = find(node);
  if (found == nullptr) return kFailed;
  OMX_INDEXTYPE index{};
  const OMX_ERRORTYPE known = found->extensionIndex(kMetaDataExtension, &index);
  if (known != OMX_ErrorNone) return statusOf(known);
  StoreMetaDataParams params{};
  params.nSize = sizeof(params);
  params.nVersion.s.nVersionMajor = 1;
  params.nPortIndex = port_index;
  params.bStoreMetaData = enable;
  return statusOf(found->setParameter(index, &params, sizeof(params)));
}

status_t OmxServer::enableGraphicBuffers(node_id, OMX_U32, OMX_BOOL) {
  return kFailed;
}

status_t OmxServer::getGraphicBufferUsage(node_id, OMX_U32, OMX_U32*) {
  return kFailed;
}

status_t OmxServer::useGraphicBuffer(node_id, OMX_U32, const sp<android::GraphicBuffer>&, buffer_id* buffer) {
  if (buffer != nullptr) *buffer = nullptr;
  return kFailed;
}

status_t OmxServer::addBuffer(node_id node, OMX_U32 port, const std::shared_ptr<Buffer>& buffer,
                              buffer_id* id) {
  if (id == nullptr) return kFailed;
  *id = nullptr;
  const std::shared_ptr<Node> found = find(node);
  // Kept: unlike the other calls, those that give buffers know one failure only.
  if (found == nullptr || found->addBuffer(port, buffer, id) != OMX_ErrorNone) return kFailed;
  return android::OK;
}

status_t OmxServer::useBuffer(node_id node, OMX_U32 port_index, const sp<android::IMemory>& params,
                              buffer_id* buffer) {
  return addBuffer(node, port_index, Buffer::onBlock(params), buffer);
}

status_t OmxServer::allocateBuffer(node_id node, OMX_U32 port_index, size_t size, buffer_id* buffer,
                                   void** buffer_data) {
  if (buffer != nullptr) *buffer = nullptr;
  if (buffer_data == nullptr) return kFailed;
  *buffer_data = nullptr;
  const std::shared_ptr<Buffer> made = Buffer::own(size);
  const status_t status = addBuffer(node, port_index, made, buffer);
  if (status == android::OK) *buffer_data = made->data();
  return status;
}

status_t OmxServer::allocateBufferWithBackup(node_id node, OMX_U32 port_index,
                                             const sp<android::IMemory>& params, buffer_id* buffer) {
  // Where the component's memory is the client's too, the block can be the buffer itself, and a whole picture
  // less is copied.
  return addBuffer(node, port_index, Buffer::onBlock(params), buffer);
}

status_t OmxServer::freeBuffer(node_id node, OMX_U32 port_index, buffer_id buffer) {
  const std::shared_ptr<Node> found = find(node);
  return found == nullptr ? kFailed : statusOf(found->freeBuffer(port_index, buffer));
}

status_t OmxServer::fillBuffer(node_id node, buffer_id buffer) {
  const std::shared_ptr<Node> found = find(node);
  return found == nullptr ? kFailed : statusOf(found->fillBuffer(buffer));
}

status_t OmxServer::emptyBuffer(node_id node, buffer_id buffer, OMX_U32 range_offset, OMX_U32 range_length,
                                OMX_U32 flags, OMX_TICKS timestamp) {
  const std::shared_ptr<Node> found = find(node);
  if (found == nullptr) return kFailed;
  return statusOf(found->emptyBuffer(buffer, range_offset, range_length, flags, timestamp));
}

status_t OmxServer::getExtensionIndex(node_id node, const char* parameter_name, OMX_INDEXTYPE* index) {
  const std::shared_ptr<Node> found = find(node);
  return found == nullptr ? kFailed : statusOf(found->extensionIndex(parameter_name, index));
}

}  // namespace mediaserver
