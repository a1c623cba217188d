// Buffers: given, freed, and sent to the component.

#include <atomic>
#include <cstdint>

#include "host/mediaserver/node.h"

namespace mediaserver {

namespace {

// Ids are numbers, never addresses, and are not used again, so an id that is out of date finds nothing.
android::IOMX::buffer_id nextBufferId() {
  static std::atomic<uintptr_t> last{0};
  return reinterpret_cast<android::IOMX::buffer_id>(last.fetch_add(1, std::memory_order_relaxed) + 1);
}

}  // namespace

// Buffers are given on the way from Loaded to Idle, and to a port that is being, or about to be, enabled.
bool Node::takesBuffers(const Port& port) const {
  if (_state == OMX_StateLoaded) {
    return port.enabled() &&
           (_target == OMX_StateIdle || _target == OMX_StateExecuting || _target == OMX_StatePause);
  }
  if (_state == OMX_StateWaitForResources) return false;
  if (port.enabled()) return port.commands > 0;
  return port.commands == 0;
}

bool Node::expectsFree(const Port& port) const {
  return !port.enabled() || !port.enabledInTheEnd || _target == OMX_StateLoaded;
}

OMX_ERRORTYPE Node::addBuffer(OMX_U32 index, const std::shared_ptr<Buffer>& buffer, BufferId* id) {
  std::lock_guard<std::mutex> lock(_mutex);
  if (!usable()) return OMX_ErrorInvalidState;
  if (index >= kPortCount) return OMX_ErrorBadPortIndex;
  if (buffer == nullptr) return OMX_ErrorInsufficientResources;
  Port& port = _ports[index];
  if (!takesBuffers(port)) return OMX_ErrorIncorrectStateOperation;
  if (port.populated()) return OMX_ErrorInsufficientResources;
  if (buffer->capacity() < port.definition.nBufferSize) return OMX_ErrorBadParameter;
  buffer->id = nextBufferId();
  buffer->header.nSize = sizeof(buffer->header);
  buffer->header.nVersion = port.definition.nVersion;
  (index == kInputPort ? buffer->header.nInputPortIndex : buffer->header.nOutputPortIndex) = index;
  port.add(buffer);
  *id = buffer->id;
  settle();
  return OMX_ErrorNone;
}

OMX_ERRORTYPE Node::freeBuffer(OMX_U32 index, BufferId id) {
  std::shared_ptr<Buffer> buffer;  // released after the lock
  std::lock_guard<std::mutex> lock(_mutex);
  if (!usable() && _state != OMX_StateInvalid) return OMX_ErrorInvalidState;
  if (index >= kPortCount) return OMX_ErrorBadPortIndex;
  Port& port = _ports[index];
  buffer = port.remove(id);
  if (buffer == nullptr) return OMX_ErrorBadParameter;
  if (!expectsFree(port)) error(OMX_ErrorPortUnpopulated);
  settle();
  signal();  // it may have been the last one that somebody was still reading
  return OMX_ErrorNone;
}

// Looks a buffer up for being sent by the client.
OMX_ERRORTYPE Node::claim(OMX_U32 index, BufferId id, std::shared_ptr<Buffer>* buffer) {
  if (!usable()) return OMX_ErrorInvalidState;
  const Port& port = _ports[index];
  *buffer = port.find(id);
  if (*buffer == nullptr) {
    return _ports[kPortCount - 1 - index].find(id) != nullptr ? OMX_ErrorBadPortIndex : OMX_ErrorBadParameter;
  }
  if (_state != OMX_StateExecuting && _state != OMX_StatePause) return OMX_ErrorIncorrectStateOperation;
  if (!port.enabled() || port.commands > 0) return OMX_ErrorIncorrectStateOperation;
  if ((*buffer)->holder != Holder::Client || (*buffer)->incomplete) return OMX_ErrorIncorrectStateOperation;
  return OMX_ErrorNone;
}

// The worker hears of a buffer outside of the lock, which it would have to wait for otherwise: this is the
// way of every picture.
OMX_ERRORTYPE Node::fillBuffer(BufferId id) {
  bool sleeps = false;
  {
    std::lock_guard<std::mutex> lock(_mutex);
    std::shared_ptr<Buffer> buffer;
    const OMX_ERRORTYPE result = claim(kOutputPort, id, &buffer);
    if (result != OMX_ErrorNone) return result;
    buffer->header.nFilledLen = 0;
    buffer->header.nOffset = 0;
    buffer->header.nFlags = 0;
    _ports[kOutputPort].append(buffer);
    _lastExchange = std::chrono::steady_clock::now();
    sleeps = markSignalled();
  }
  if (sleeps) _wakeUp.post();
  return OMX_ErrorNone;
}

OMX_ERRORTYPE Node::emptyBuffer(BufferId id, OMX_U32 offset, OMX_U32 length, OMX_U32 flags,
                                OMX_TICKS timestamp) {
  bool sleeps = false;
  {
    std::lock_guard<std::mutex> lock(_mutex);
    std::shared_ptr<Buffer> buffer;
    const OMX_ERRORTYPE result = claim(kInputPort, id, &buffer);
    if (result != OMX_ErrorNone) return result;
    if (!buffer->contains(offset, length)) return OMX_ErrorBadParameter;
    buffer->header.nOffset = offset;
    buffer->header.nFilledLen = length;
    buffer->header.nFlags = flags;
    buffer->header.nTimeStamp = timestamp;
    _ports[kInputPort].append(buffer);
    sleeps = markSignalled();
  }
  if (sleeps) _wakeUp.post();
  return OMX_ErrorNone;
}

}  // namespace mediaserver
