// The way of the application's data into the component, and of the emptied buffers back.
#include <string.h>

#include "core/log.h"
#include "core/omx_interface.h"
#include "core/session_state.h"

using android::IOMX;
using android::status_t;

namespace {

constexpr int kNoBuffer = -1;    // none free, or the zero-copy send was refused
constexpr int kInputEnded = -2;  // the session is shutting down, or the copying send was refused

}  // namespace

// Takes the first free input buffer, lowest index first, or null. Finding and taking are one step,
// so that several threads may feed. With the lock held.
BufferInfo* OmxInterface::claimInputBuffer() {
  if (_state->ports[kOmxInputPort].freeing) return nullptr;
  auto& records = _portBuffers[kOmxInputPort];
  for (size_t i = 0; i < records.size(); ++i) {
    if (records[i].busy) continue;
    BufferInfo& record = records.editItemAt(i);
    record.busy = true;
    return &record;
  }
  return nullptr;
}

// The record that `handle` is, or null when it is none of the input port's. With the lock held.
BufferInfo* OmxInterface::inputRecord(void* handle) {
  if (_state->ports[kOmxInputPort].freeing) return nullptr;
  auto& records = _portBuffers[kOmxInputPort];
  for (size_t i = 0; i < records.size(); ++i) {
    if (&records[i] == handle) return &records.editItemAt(i);
  }
  return nullptr;
}

// Gives a claimed buffer to the component. 0, or `refused` with a line that names `step`; the buffer
// stays claimed in both cases.
int OmxInterface::emptyBuffer(IOMX::buffer_id id, uint32_t length, uint32_t flags, int timestamp,
                              const char* step, int refused) {
  const status_t status = _omx->emptyBuffer(_node, id, 0, length, flags, OMX_TICKS{timestamp});
  if (status == android::OK) return 0;
  return failWith(refused, "OMXINTERFACE - %s::emptyBuffer failed w/ error 0x%08x \n", step,
                  static_cast<unsigned int>(status));
}

int OmxInterface::reserveInputBuffer(void** handle, void** data) {
  const SessionCall call(*_state);
  if (handle == nullptr || data == nullptr) {
    return failWith(kNoBuffer, "OMXINTERFACE - Nowhere to put the reserved buffer");
  }
  *handle = nullptr;
  *data = nullptr;
  if (_inputClosed) {
    return failWith(kInputEnded, "OMXINTERFACE - Client Shutting Down: Input Data ignored");
  }
  const SessionState::Lock held(_state->lock);
  if (_state->ending) return kInputEnded;
  BufferInfo* record = claimInputBuffer();
  if (record == nullptr) return kNoBuffer;
  *handle = record;
  *data = record->data;
  return 0;
}

void OmxInterface::releaseInputBuffer(void* handle) {
  const SessionCall call(*_state);
  const SessionState::Lock held(_state->lock);
  BufferInfo* record = inputRecord(handle);
  if (record == nullptr) return;
  record->busy = false;
  if (_endOfInputPending) sem_post(&_semInputBufferFree);
}

uint32_t OmxInterface::inputBufferCapacity() {
  const SessionCall call(*_state);
  const SessionState::Lock held(_state->lock);
  return _state->ports[kOmxInputPort].capacity;
}

// Both zero-copy sends: checks the handle and the length, then sends the buffer with `flags`.
int OmxInterface::sendReserved(void* handle, int length, uint32_t flags, int timestamp, const char* step) {
  const SessionCall call(*_state);
  PortUse use(*_state, kOmxInputPort);
  IOMX::buffer_id id = nullptr;
  {
    SessionState::Lock held(_state->lock);
    BufferInfo* record = inputRecord(handle);
    if (record == nullptr) {
      held.unlock();
      return failWith(kNoBuffer, "OMXINTERFACE - %p is no input buffer of this session", handle);
    }
    const uint32_t capacity = _state->ports[kOmxInputPort].capacity;
    if (length < 0 || static_cast<uint32_t>(length) > capacity) {
      held.unlock();
      return failWith(kNoBuffer, "OMXINTERFACE - %d bytes do not fit an input buffer of %u", length,
                      capacity);
    }
    record->length = static_cast<uint32_t>(length);
    record->busy = true;  // it was when it was reserved; a forged return may have cleared it
    id = record->bufferId;
    use.begin(held);
  }
  return emptyBuffer(id, static_cast<uint32_t>(length), flags, timestamp, step, kNoBuffer);
}

int OmxInterface::sendInputBuffer(void* handle, int length, int timestamp) {
  return sendReserved(handle, length, OMX_BUFFERFLAG_ENDOFFRAME, timestamp, "SEND INPUT BUFFER");
}

int OmxInterface::sendFinalBuffer(void* handle, int timestamp) {
  return sendReserved(handle, 0, OMX_BUFFERFLAG_EOS, timestamp, "ETB");
}

int OmxInterface::sendInputData(void* data, unsigned int length, int timestamp) {
  const SessionCall call(*_state);
  if (_inputClosed) return 0;  // Kept: late data is dropped without a word
  PortUse use(*_state, kOmxInputPort);
  IOMX::buffer_id id = nullptr;
  void* target = nullptr;
  {
    SessionState::Lock held(_state->lock);
    if (_state->ending) return kInputEnded;
    if (_portBuffers[kOmxInputPort].isEmpty()) return kNoBuffer;
    const uint32_t capacity = _state->ports[kOmxInputPort].capacity;
    if (length > capacity || (data == nullptr && length > 0)) {
      held.unlock();
      return failWith(kNoBuffer, "OMXINTERFACE - Input of %u bytes at %p refused: a buffer holds %u", length,
                      data, capacity);
    }
    BufferInfo* record = claimInputBuffer();
    if (record == nullptr) return kNoBuffer;
    if (record->data == nullptr && length > 0) {
      record->busy = false;
      held.unlock();
      return failWith(kNoBuffer, "OMXINTERFACE - Input refused: the component's buffer has no address here");
    }
    id = record->bufferId;
    target = record->data;
    use.begin(held);
  }
  if (length > 0) memcpy(target, data, length);
  return emptyBuffer(id, length, 0, timestamp, "ETB", kInputEnded);
}

int OmxInterface::sendEndOfInputFlag(int timestamp) {
  const SessionCall call(*_state);
  PortUse use(*_state, kOmxInputPort);
  IOMX::buffer_id id = nullptr;
  {
    SessionState::Lock held(_state->lock);
    _endOfInputPending = true;
    const BufferInfo* record = nullptr;
    _state->await(held, _semInputBufferFree, _state->inputFreeWaiters, [this, &record] {
      record = claimInputBuffer();
      return record != nullptr;
    });
    if (record == nullptr) return kInputEnded;
    id = record->bufferId;
    use.begin(held);
  }
  const int result = emptyBuffer(id, 0, OMX_BUFFERFLAG_EOS, timestamp, "ETB", kInputEnded);
  if (result == 0) _inputClosed = true;
  return result;
}

void OmxInterface::onOmxObserverEmptyBufferDone(const android::omx_message& message) {
  const IOMX::buffer_id id = message.u.buffer_data.buffer;
  bool known = false;
  bool wasOurs = false;
  InputCallback callback = nullptr;
  void* context = nullptr;
  {
    const SessionState::Lock held(_state->lock);
    BufferInfo* record = findRecord(kOmxInputPort, id);
    if (record != nullptr) {
      known = true;
      wasOurs = !record->busy;
      record->busy = false;
      callback = _inputCallback;
      context = _inputCallbackContext;
    }
  }
  if (!known) {
    logError("OMXINTERFACE - Buffer not found in buffer vector.\n");
    setThreadError(OMXI_ERR_BUFFER_NOT_FOUND);
    return;
  }
  if (wasOurs) {
    logWarning("OMXINTERFACE - We already own input buffer %p, yet received an EMPTY_BUFFER_DONE.", id);
  }
  if (callback != nullptr) callback(this, context);

  const SessionState::Lock held(_state->lock);
  if (_endOfInputPending) sem_post(&_semInputBufferFree);
  if ((_portReconfiguring || _endOfOutputReached) && allReturned(kOmxInputPort)) {
    sem_post(&_semInputBuffersReturned);
  }
}
