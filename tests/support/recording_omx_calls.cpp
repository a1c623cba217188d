// Each operation of IOMX: written down, and forwarded.

#include <utility>

#include "tests/support/recording_omx.h"

namespace omxtest {

using android::sp;
using android::status_t;

namespace {

// Clients that hand in a nonsensical size get it recorded, but not read.
constexpr size_t kLargestRecord = 65536;

std::vector<uint8_t> copyRecord(const void* params, size_t size) {
  const auto* const bytes = static_cast<const uint8_t*>(params);
  if (bytes == nullptr || size > kLargestRecord) return {};
  return {bytes, bytes + size};
}

Call makeCall(Method method, android::IOMX::node_id node = nullptr) {
  Call call;
  call.method = method;
  call.node = node;
  return call;
}

template <typename T>
void setIfWanted(T* out, T value) {
  if (out != nullptr) *out = value;
}

}  // namespace

bool RecordingOmx::livesLocally(pid_t pid) {
  bool local = false;
  run(makeCall(Method::LivesLocally), [&](Call&) {
    local = _omx->livesLocally(pid);
    return status_t{android::OK};
  });
  return local;
}

status_t RecordingOmx::listNodes(android::List<ComponentInfo>* list) {
  return run(makeCall(Method::ListNodes), [&](Call&) { return _omx->listNodes(list); });
}

status_t RecordingOmx::allocateNode(const char* name, const sp<android::IOMXObserver>& observer,
                                    node_id* node) {
  Call call = makeCall(Method::AllocateNode);
  if (name != nullptr) call.text = name;
  setIfWanted<node_id>(node, nullptr);
  return run(std::move(call), [&](Call& c) {
    if (observer.get() == nullptr || node == nullptr) return _omx->allocateNode(name, observer, node);
    const sp<android::IOMXObserver> wrapped = _messages.wrap(observer);
    if (wrapped.get() == nullptr) return kFailed;
    const status_t status = _omx->allocateNode(name, wrapped, node);
    c.node = *node;
    if (status == android::OK) _messages.attach(wrapped, *node);
    return status;
  });
}

status_t RecordingOmx::freeNode(node_id node) {
  return run(makeCall(Method::FreeNode, node), [&](Call&) {
    const status_t status = _omx->freeNode(node);
    if (status == android::OK) _messages.detach(node);
    return status;
  });
}

status_t RecordingOmx::sendCommand(node_id node, OMX_COMMANDTYPE cmd, OMX_S32 param) {
  Call call = makeCall(Method::SendCommand, node);
  call.command = cmd;
  call.param = param;
  return run(std::move(call), [&](Call&) { return _omx->sendCommand(node, cmd, param); });
}

status_t RecordingOmx::getRecord(Method method, node_id node, OMX_INDEXTYPE index, void* params,
                                 size_t size) {
  Call call = makeCall(method, node);
  call.index = index;
  call.size = size;
  call.record = copyRecord(params, size);
  return run(std::move(call), [&](Call& c) {
    const status_t status = method == Method::GetParameter ? _omx->getParameter(node, index, params, size)
                                                           : _omx->getConfig(node, index, params, size);
    if (status == android::OK) c.record = copyRecord(params, size);
    return status;
  });
}

status_t RecordingOmx::setRecord(Method method, node_id node, OMX_INDEXTYPE index, const void* params,
                                 size_t size) {
  Call call = makeCall(method, node);
  call.index = index;
  call.size = size;
  call.record = copyRecord(params, size);
  return run(std::move(call), [&](Call&) {
    return method == Method::SetParameter ? _omx->setParameter(node, index, params, size)
                                          : _omx->setConfig(node, index, params, size);
  });
}

status_t RecordingOmx::getParameter(node_id node, OMX_INDEXTYPE index, void* params, size_t size) {
  return getRecord(Method::GetParameter, node, index, params, size);
}

status_t RecordingOmx::setParameter(node_id node, OMX_INDEXTYPE index, const void* params, size_t size) {
  return setRecord(Method::SetParameter, node, index, params, size);
}

status_t RecordingOmx::getConfig(node_id node, OMX_INDEXTYPE index, void* params, size_t size) {
  return getRecord(Method::GetConfig, node, index, params, size);
}

status_t RecordingOmx::setConfig(node_id node, OMX_INDEXTYPE index, const void* params, size_t size) {
  return setRecord(Method::SetConfig, node, index, params, size);
}

status_t RecordingOmx::getState(node_id node, OMX_STATETYPE* state) {
  return run(makeCall(Method::GetState, node), [&](Call&) { return _omx->getState(node, state); });
}

status_t RecordingOmx::storeMetaDataInBuffers(node_id node, OMX_U32 port_index, OMX_BOOL enable) {
  Call call = makeCall(Method::StoreMetaDataInBuffers, node);
  call.port = port_index;
  call.enable = enable;
  return run(std::move(call), [&](Call&) { return _omx->storeMetaDataInBuffers(node, port_index, enable); });
}

status_t RecordingOmx::enableGraphicBuffers(node_id node, OMX_U32 port_index, OMX_BOOL enable) {
  Call call = makeCall(Method::EnableGraphicBuffers, node);
  call.port = port_index;
  call.enable = enable;
  return run(std::move(call), [&](Call&) { return _omx->enableGraphicBuffers(node, port_index, enable); });
}

status_t RecordingOmx::getGraphicBufferUsage(node_id node, OMX_U32 port_index, OMX_U32* usage) {
  Call call = makeCall(Method::GetGraphicBufferUsage, node);
  call.port = port_index;
  return run(std::move(call), [&](Call&) { return _omx->getGraphicBufferUsage(node, port_index, usage); });
}

status_t RecordingOmx::giveBlock(Method method, node_id node, OMX_U32 port, const sp<android::IMemory>& block,
                                 buffer_id* buffer) {
  Call call = makeCall(method, node);
  call.port = port;
  if (block.get() != nullptr) {
    call.blockSize = block->size();
    call.blockOffset = block->offset();
  }
  setIfWanted<buffer_id>(buffer, nullptr);
  return run(std::move(call), [&](Call& c) {
    const status_t status = method == Method::UseBuffer
                                ? _omx->useBuffer(node, port, block, buffer)
                                : _omx->allocateBufferWithBackup(node, port, block, buffer);
    if (buffer != nullptr) c.buffer = *buffer;
    return status;
  });
}

status_t RecordingOmx::useBuffer(node_id node, OMX_U32 port_index, const sp<android::IMemory>& params,
                                 buffer_id* buffer) {
  return giveBlock(Method::UseBuffer, node, port_index, params, buffer);
}

status_t RecordingOmx::allocateBufferWithBackup(node_id node, OMX_U32 port_index,
                                                const sp<android::IMemory>& params, buffer_id* buffer) {
  return giveBlock(Method::AllocateBufferWithBackup, node, port_index, params, buffer);
}

status_t RecordingOmx::useGraphicBuffer(node_id node, OMX_U32 port_index,
                                        const sp<android::GraphicBuffer>& graphicBuffer, buffer_id* buffer) {
  Call call = makeCall(Method::UseGraphicBuffer, node);
  call.port = port_index;
  setIfWanted<buffer_id>(buffer, nullptr);
  return run(std::move(call),
             [&](Call&) { return _omx->useGraphicBuffer(node, port_index, graphicBuffer, buffer); });
}

status_t RecordingOmx::allocateBuffer(node_id node, OMX_U32 port_index, size_t size, buffer_id* buffer,
                                      void** buffer_data) {
  Call call = makeCall(Method::AllocateBuffer, node);
  call.port = port_index;
  call.size = size;
  setIfWanted<buffer_id>(buffer, nullptr);
  setIfWanted<void*>(buffer_data, nullptr);
  return run(std::move(call), [&](Call& c) {
    const status_t status = _omx->allocateBuffer(node, port_index, size, buffer, buffer_data);
    if (buffer != nullptr) c.buffer = *buffer;
    return status;
  });
}

status_t RecordingOmx::freeBuffer(node_id node, OMX_U32 port_index, buffer_id buffer) {
  Call call = makeCall(Method::FreeBuffer, node);
  call.port = port_index;
  call.buffer = buffer;
  return run(std::move(call), [&](Call&) { return _omx->freeBuffer(node, port_index, buffer); });
}

status_t RecordingOmx::fillBuffer(node_id node, buffer_id buffer) {
  Call call = makeCall(Method::FillBuffer, node);
  call.buffer = buffer;
  return run(std::move(call), [&](Call&) { return _omx->fillBuffer(node, buffer); });
}

status_t RecordingOmx::emptyBuffer(node_id node, buffer_id buffer, OMX_U32 range_offset, OMX_U32 range_length,
                                   OMX_U32 flags, OMX_TICKS timestamp) {
  Call call = makeCall(Method::EmptyBuffer, node);
  call.buffer = buffer;
  call.offset = range_offset;
  call.length = range_length;
  call.flags = flags;
  call.timestamp = timestamp;
  return run(std::move(call), [&](Call&) {
    return _omx->emptyBuffer(node, buffer, range_offset, range_length, flags, timestamp);
  });
}

status_t RecordingOmx::getExtensionIndex(node_id node, const char* parameter_name, OMX_INDEXTYPE* index) {
  Call call = makeCall(Method::GetExtensionIndex, node);
  if (parameter_name != nullptr) call.text = parameter_name;
  return run(std::move(call), [&](Call&) { return _omx->getExtensionIndex(node, parameter_name, index); });
}

}  // namespace omxtest
