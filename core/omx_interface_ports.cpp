// Port definitions and the buffer pool.
#include <stdio.h>

#include <algorithm>
#include <new>

#include "core/log.h"
#include "core/omx_interface.h"
#include "core/omx_record.h"
#include "core/session_state.h"

using android::IMemory;
using android::MemoryDealer;
using android::sp;
using android::status_t;

namespace {

constexpr OMX_U32 kMaxBuffers = 10000;

// As the devices' 32-bit long prints it.
long asLong(OMX_U32 value) {
  return static_cast<int32_t>(value);
}

bool isPort(long port) {
  return port == kOmxInputPort || port == kOmxOutputPort;
}

}  // namespace

status_t OmxInterface::readPortDefinition(int port, OMX_PARAM_PORTDEFINITIONTYPE* definition) {
  *definition = makeOmxRecord<OMX_PARAM_PORTDEFINITIONTYPE>(static_cast<OMX_U32>(port));
  if (_omx == nullptr) return android::NO_INIT;
  return _omx->getParameter(_node, OMX_IndexParamPortDefinition, definition, sizeof(*definition));
}

int OmxInterface::setupPortParameters(int port, int width, int height, int frameRate) {
  const SessionCall call(*_state);
  if (isPort(port)) {
    const SessionState::Lock held(_state->lock);
    _portFrameSize[port] = {width, height};  // Kept: even if the component refuses
  }
  OMX_PARAM_PORTDEFINITIONTYPE definition;
  if (readPortDefinition(port, &definition) != android::OK) return OMXI_ERR_GET_PORT_DEFINITION;
  auto& video = definition.format.video;
  video.nFrameWidth = static_cast<OMX_U32>(width);
  video.nFrameHeight = static_cast<OMX_U32>(height);
  if (frameRate > 0) video.xFramerate = static_cast<OMX_U32>(frameRate) << 16;
  video.eColorFormat = OMX_COLOR_FormatYUV420SemiPlanar;
  const status_t status =
      _omx->setParameter(_node, OMX_IndexParamPortDefinition, &definition, sizeof(definition));
  if (status != android::OK) {
    return failWith(OMXI_ERR_SET_PORT_DEFINITION,
                    "OMXINTERFACE - SETUP PORT PARAMETERS: Set Port Definition Failed: %d\n", status);
  }
  return OMXI_OK;
}

int OmxInterface::debugPortParameters(int port) {
  const SessionCall call(*_state);
  OMX_PARAM_PORTDEFINITIONTYPE definition;
  if (readPortDefinition(port, &definition) != android::OK) {
    return failWith(OMXI_ERR_GET_PORT_DEFINITION, "Could not get port definition for port index %d\n", port);
  }
  struct Line {
    const char* label;
    long value;
  };
  const Line lines[] = {
      {"nSize member", asLong(definition.nSize)},
      {"nPortIndex number", asLong(definition.nPortIndex)},
      {"nBufferCountActual member", asLong(definition.nBufferCountActual)},
      {"nBufferCountMin member", asLong(definition.nBufferCountMin)},
      {"nBufferSize member", asLong(definition.nBufferSize)},
      {"nBufferAlignment member", asLong(definition.nBufferAlignment)},
      {"bEnabled member", asLong(definition.bEnabled)},
      {"bPopulated member", asLong(definition.bPopulated)},
      {"bBuffersContiguous member", asLong(definition.bBuffersContiguous)},
      {"nVersion  member", asLong(definition.nVersion.nVersion)},
      {"eDir member", asLong(definition.eDir)},
      {"eDomain member", asLong(definition.eDomain)},
  };
  logError("OMX_PARAM_PORTDEFINITION structure:\n");
  for (const Line& line : lines) logError("    %s is %ld\n", line.label, line.value);
  puts("OMX_PARAM_PORTDEFINITION structure:");
  for (const Line& line : lines) printf("    %s is %ld\n", line.label, line.value);
  return OMXI_OK;
}

// Drops filled buffers that the output thread has not taken yet; they stay with the session. With the
// lock held.
void OmxInterface::flushOutputQueue() {
  if (_queueOutputData == nullptr) return;
  _queueOutputData->lock();
  while (!_queueOutputData->isEmpty()) _queueOutputData->dequeue();
  _queueOutputData->unlock();
}

// Has the component make a buffer of `size` bytes in the port's mode. `block` is ours; it is dropped
// where the component alone allocates.
status_t OmxInterface::allocateBuffer(int port, sp<IMemory>& block, uint32_t size,
                                      android::IOMX::buffer_id* id, void** data) {
  const auto portIndex = static_cast<OMX_U32>(port);
  switch (_portBufferMode[port]) {
    case OMX_BUFFER_COMPONENT_ALLOCATES: {
      bool componentAlone = false;
      {
        const SessionState::Lock held(_state->lock);
        componentAlone = _mpMemHeap != nullptr;
      }
      if (!componentAlone) return _omx->allocateBufferWithBackup(_node, portIndex, block, id);
      block.clear();
      return _omx->allocateBuffer(_node, portIndex, size, id, data);
    }
    case OMX_BUFFER_CLIENT_MEMORY:
      return _omx->useBuffer(_node, portIndex, block, id);
    default:
      return android::OK;
  }
}

int OmxInterface::allocateBuffersOnPort(int port) {
  const SessionCall call(*_state);
  try {
    return allocateBuffers(port);
  } catch (const std::bad_alloc&) {
    return OMXI_ERR_ALLOCATE_MEMORY;
  }
}

int OmxInterface::allocateBuffers(int port) {
  {
    const SessionState::Lock held(_state->lock);
    flushOutputQueue();
  }

  OMX_PARAM_PORTDEFINITIONTYPE definition;
  status_t known = android::BAD_INDEX;
  if (isPort(port)) known = readPortDefinition(port, &definition);
  if (known != android::OK || definition.nBufferCountActual > kMaxBuffers) {
    return failWith(OMXI_ERR_GET_PORT_DEFINITION,
                    "OMXINTERFACE - ALLOCATE BUFFERS: Could not get port definition: %d", known);
  }
  const uint32_t count = definition.nBufferCountActual;
  const uint32_t size = definition.nBufferSize;
  // Kept: one name on every platform; memory statistics of devices know the pool by it.
  const sp<MemoryDealer> dealer = new MemoryDealer(size_t{count} * size, "QCOMXWrapper");
  _memoryDealer[port] = dealer;
  if (count == 0) return OMXI_OK;
  {
    // Room for all at once: handles are addresses of records, which do not move while these are added.
    SessionState::Lock held(_state->lock);
    auto& records = _portBuffers[port];
    uint32_t& capacity = _state->ports[port].capacity;
    // Records that a former, failed call has left may be smaller than these.
    capacity = records.isEmpty() ? size : std::min(capacity, size);
    if (records.setCapacity(records.size() + count) < 0) {
      held.unlock();
      return failWith(OMXI_ERR_ALLOCATE_MEMORY, "OMXINTERFACE - No memory for %u buffer records of port %d",
                      count, port);
    }
  }

  for (uint32_t i = 0; i < count; ++i) {
    sp<IMemory> block = dealer->allocate(size);
    if (block == nullptr) {
      return failWith(OMXI_ERR_ALLOCATE_MEMORY,
                      "OMXINTERFACE - Memory dealer allocation failed for port %d buffer %d\n", port,
                      static_cast<int>(i));
    }
    BufferInfo record;
    record.length = size;
    const status_t status = allocateBuffer(port, block, size, &record.bufferId, &record.data);
    if (status != android::OK) {
      return failWith(OMXI_ERR_ALLOCATE_MEMORY,
                      "OMXINTERFACE - Could not allocate memory: port %d buffer %d error %d(0x%x)\n", port,
                      static_cast<int>(i), status, static_cast<unsigned int>(status));
    }
    record.memory = block;
    if (block != nullptr) record.data = block->pointer();
    const SessionState::Lock held(_state->lock);
    _portBuffers[port].add(record);
    if (port == kOmxInputPort && _endOfInputPending) sem_post(&_semInputBufferFree);
  }
  return OMXI_OK;
}

int OmxInterface::freeBuffersOnPort(unsigned long port) {
  const SessionCall call(*_state);
  if (!isPort(static_cast<long>(port))) return android::BAD_INDEX;
  SessionState::Port& state = _state->ports[port];
  auto& records = _portBuffers[port];
  size_t left = 0;
  {
    // From here on nobody begins to use a record or queues one for delivery, and whoever was using one
    // has left. Returning messages may still find it.
    SessionState::Lock held(_state->lock);
    state.freeing = true;
    flushOutputQueue();
    _state->left.wait(held, [&state] { return state.uses == 0; });
    left = records.size();
  }
  status_t result = android::OK;
  for (; left > 0; --left) {
    BufferInfo record;
    {
      const SessionState::Lock held(_state->lock);
      record = records[left - 1];
    }
    const status_t status = _omx->freeBuffer(_node, static_cast<OMX_U32>(port), record.bufferId);
    if (status != android::OK) result = status;
    // Kept: the block is given back here and once more when its last reference goes.
    if (_portBufferMode[port] == OMX_BUFFER_CLIENT_MEMORY && record.memory != nullptr) {
      _memoryDealer[port]->deallocate(static_cast<size_t>(record.memory->offset()));
    }
    const SessionState::Lock held(_state->lock);
    records.removeItemsAt(left - 1);
  }
  bool remain = false;
  {
    const SessionState::Lock held(_state->lock);
    state.freeing = false;
    remain = !records.isEmpty();
    wakeIfOutputReturned();
  }
  if (remain) {
    logError("Buffer not empty after deallocated.\n");
    setThreadError(OMXI_ERR_BUFFER_NOT_EMPTIED);
  }
  return result;
}

bool OmxInterface::portBuffersHaveBeenReturned(int port) {
  const SessionCall call(*_state);
  const SessionState::Lock held(_state->lock);
  return !isPort(port) || allReturned(port);
}

bool OmxInterface::allReturned(int port) const {
  return std::none_of(_portBuffers[port].begin(), _portBuffers[port].end(),
                      [](const BufferInfo& record) -> bool { return record.busy; });
}

BufferInfo* OmxInterface::findRecord(int port, android::IOMX::buffer_id id) {
  auto& records = _portBuffers[port];
  for (size_t i = 0; i < records.size(); ++i) {
    if (records[i].bufferId == id) return &records.editItemAt(i);
  }
  return nullptr;
}
