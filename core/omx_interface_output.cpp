// Output buffers on their round: to the component, filled, to the application, back.
#include "core/log.h"
#include "core/omx_interface.h"
#include "core/session_state.h"

using android::IOMX;
using android::status_t;

// Nothing is queued for the output thread and it is not inside a callback. An output thread that has
// ended takes nothing any more, so what is queued then is delivered to nobody. With the lock held.
bool OmxInterface::outputDelivered() const {
  if (!_state->outputThread.running || _queueOutputData == nullptr) return true;
  _queueOutputData->lock();
  const bool empty = _queueOutputData->isEmpty();
  _queueOutputData->unlock();
  return empty && !_state->delivering;
}

// For whoever waits for the output buffers: called by everyone who may have returned the last one or
// delivered it. With the lock held.
void OmxInterface::wakeIfOutputReturned() {
  const bool awaited = _portReconfiguring || _endOfOutputReached || _state->outputReturnWaiters > 0;
  if (awaited && allReturned(kOmxOutputPort)) sem_post(&_semOutputBuffersReturned);
}

int OmxInterface::fillOutputBuffer(BufferInfo* record) {
  const SessionCall call(*_state);
  IOMX::buffer_id id = nullptr;
  bool known = false;
  {
    const SessionState::Lock held(_state->lock);
    auto& records = _portBuffers[kOmxOutputPort];
    for (size_t i = 0; i < records.size() && !known; ++i) {
      known = &records[i] == record;
      if (known) id = record->bufferId;
    }
  }
  if (!known) {
    return failWith(OMXI_ERR_FILL_BUFFER, "OMXINTERFACE - %p is no output buffer of this session",
                    static_cast<void*>(record));
  }
  return submitOutputBuffer(id);
}

int OmxInterface::fillOutputBuffers() {
  const SessionCall call(*_state);
  for (size_t i = 0;; ++i) {
    IOMX::buffer_id id = nullptr;
    {
      const SessionState::Lock held(_state->lock);
      if (i >= _portBuffers[kOmxOutputPort].size()) return OMXI_OK;
      id = _portBuffers[kOmxOutputPort][i].bufferId;
    }
    if (submitOutputBuffer(id) != OMXI_OK) return OMXI_ERR_FILL_BUFFER;
  }
}

void OmxInterface::returnIomxOutputBuffer(void* bufferId) {
  const SessionCall call(*_state);
  static_cast<void>(submitOutputBuffer(bufferId));  // a refusal has been logged
}

// Gives the buffer to the component unless that has it, it waits for delivery, or the port takes none.
// Testing for all that and marking it busy is one step: nobody frees it in between. 0 or 8.
int OmxInterface::submitOutputBuffer(IOMX::buffer_id id) {
  PortUse use(*_state, kOmxOutputPort);
  {
    const SessionState::Lock held(_state->lock);
    if (_portReconfiguring || _state->tearingDown || _state->ending) return OMXI_OK;
    BufferInfo* record = _state->ports[kOmxOutputPort].freeing ? nullptr : findRecord(kOmxOutputPort, id);
    if (record == nullptr || record->busy || awaitsDelivery(id)) return OMXI_OK;
    record->outputData = nullptr;
    record->rangeLength = 0;
    record->eos = false;
    record->busy = true;
    ++_state->fills;
    use.begin(held);
  }
  const status_t status = _omx->fillBuffer(_node, id);
  {
    const SessionState::Lock held(_state->lock);
    if (--_state->fills == 0) _state->left.notify_all();
    if (status == android::OK) return OMXI_OK;
    findRecord(kOmxOutputPort, id)->busy = false;  // the use keeps it in the table
    wakeIfOutputReturned();
  }
  return failWith(OMXI_ERR_FILL_BUFFER, "OMXINTERFACE - fillBuffer failed w/ error 0x%08x",
                  static_cast<unsigned int>(status));
}

// True for a buffer that the application gave back although it never got it: its picture is still to be
// delivered. With the lock held.
bool OmxInterface::awaitsDelivery(IOMX::buffer_id id) const {
  if (_queueOutputData == nullptr) return false;
  _queueOutputData->lock();
  const bool queued = _queueOutputData->contains(id);
  _queueOutputData->unlock();
  return queued;
}

void OmxInterface::onOmxObserverFillBufferDone(const android::omx_message& message) {
  const auto& filled = message.u.extended_buffer_data;
  SessionState::Lock held(_state->lock);
  BufferInfo* record = findRecord(kOmxOutputPort, filled.buffer);
  // A doubled, forged or late message: the component did not have this buffer. (The null id stands
  // for buffers that no component call was made for.)
  if (filled.buffer == nullptr || record == nullptr || !record->busy) return;
  const SessionState::Port& port = _state->ports[kOmxOutputPort];
  const uint32_t length = filled.range_length;
  const bool tooLong = length > port.capacity;
  record->busy = false;
  record->rangeLength = tooLong ? port.capacity : length;
  record->eos = (filled.flags & OMX_BUFFERFLAG_EOS) != 0;
  record->timestamp = static_cast<uint32_t>(filled.timestamp);
  // Kept: delivered data starts at the buffer's start, whatever range_offset says. With a heap of the
  // component's own the receiver goes by the buffer id.
  if (_mpMemHeap == nullptr) record->outputData = record->data;
  // A buffer that is about to be freed is not delivered any more.
  const bool lost = !port.freeing && !queueForDelivery(filled.buffer);
  wakeIfOutputReturned();
  held.unlock();
  sem_post(&_semOutputDataReady);  // outside, so that the thread that wakes need not wait for the lock

  if (tooLong) {
    logError("OMXINTERFACE - Output of %u bytes cut to the buffer's %u", length, port.capacity);
  }
  // Silence would have deInit() wait for an end of stream that nobody delivers.
  if (lost) setThreadError(OMXI_ERR_ALLOCATE_MEMORY);
}

// False when there is no memory for it. With the lock held.
bool OmxInterface::queueForDelivery(IOMX::buffer_id id) {
  if (_queueOutputData == nullptr) return false;
  _queueOutputData->lock();
  const bool queued = _queueOutputData->add(id);
  _queueOutputData->unlock();
  return queued;
}

int OmxInterface::callOutputCallbackFunction(void* data, unsigned int size, void* bufferId,
                                             unsigned int timestamp) {
  OutputCallback callback = nullptr;
  void* context = nullptr;
  {
    const SessionState::Lock held(_state->lock);
    callback = _outputCallback;
    context = _outputCallbackContext;
  }
  return callback != nullptr ? callback(this, data, size, bufferId, context, timestamp) : 0;
}

void* OmxInterface::DataOutputThread(void* session) {
  auto& self = *static_cast<OmxInterface*>(session);
  // Looked at before each sleep: a thread started late may have missed the post that ended its sleep.
  while (!self.sessionEnding()) {
    SessionState::sleepOn(self._semOutputDataReady);
    if (!self.outputPass()) break;
  }
  if (self._isEncoder) {
    logWarning("OMXINTERFACE - ===DataOutputThread over! enc thread!\n");
  } else {
    logWarning("OMXINTERFACE - ===DataOutputThread over! dec thread!\n");
  }
  const SessionState::Lock held(self._state->lock);
  self._state->leaveThread(self._state->outputThread, held);
  self.wakeIfOutputReturned();  // nobody delivers what is queued now: a reconfiguration need not wait for it
  return nullptr;
}

bool OmxInterface::sessionEnding() {
  const SessionState::Lock held(_state->lock);
  return _state->ending;
}

size_t OmxInterface::queuedOutputCount() {
  const SessionState::Lock held(_state->lock);
  if (_queueOutputData == nullptr) return 0;
  _queueOutputData->lock();
  const size_t count = _queueOutputData->size();
  _queueOutputData->unlock();
  return count;
}

// One wake-up of the output thread: everything queued to the application, then what that is done with
// back to the component. False when the thread has to end.
bool OmxInterface::outputPass() {
  SimpleQueue refill;  // this thread's own: needs no locking
  // What comes in meanwhile is for the next pass: a component short of output buffers gets some back
  // first, and after the end of the stream there is no next pass, so nobody gets to see the empty buffers
  // that a component on its way to Idle returns.
  for (size_t left = queuedOutputCount(); left > 0 && deliverNext(refill); --left) {
  }
  if (_omxState == OMX_StateExecuting) {
    if (_endOfOutputReached) return false;
    while (!refill.isEmpty()) static_cast<void>(submitOutputBuffer(refill.dequeue()));  // logged there
  }
  return !sessionEnding() && !_endOfOutputReached && _threadError == OMXI_OK;
}

// Hands the oldest filled buffer to the application; false when there is none.
bool OmxInterface::deliverNext(SimpleQueue& refill) {
  PortUse use(*_state, kOmxOutputPort);
  IOMX::buffer_id id = nullptr;
  void* data = nullptr;
  uint32_t length = 0;
  uint32_t timestamp = 0;
  bool eos = false;
  {
    const SessionState::Lock held(_state->lock);
    if (_state->ending || _queueOutputData == nullptr) return false;
    _queueOutputData->lock();
    id = _queueOutputData->dequeue();
    _queueOutputData->unlock();
    if (id == nullptr) return false;
    const BufferInfo* record = findRecord(kOmxOutputPort, id);
    if (record == nullptr) return true;  // freed meanwhile: nothing left to deliver
    // All that is needed of it is read now: the application may give the buffer back, and have it
    // cleared, before the callback ends.
    data = record->outputData;
    length = record->rangeLength;
    timestamp = record->timestamp;
    eos = record->eos;
    _state->delivering = true;
    use.begin(held);
  }
  const int kept = callOutputCallbackFunction(data, length, id, timestamp);

  const SessionState::Lock held(_state->lock);
  _state->delivering = false;
  if (eos) {
    _endOfOutputReached = true;
    sem_post(&_semEndOfOutput);
  } else if (kept == 0 && !_endOfInputPending) {
    refill.add(id);
  }
  wakeIfOutputReturned();
  return true;
}
