// The event thread: component events, and the reconfiguration of the output port.
#include <memory>
#include <new>

#include "core/log.h"
#include "core/session_state.h"
#include "decoder/omx_interface_decoder.h"

namespace {

// Kept: the number in the line tells support which of the two checks it was.
void logQueueGone(int line) {
  logError("OmxInterfaceDecoder::EventMonitorThread ! _queueThreadMessages==NULL !line:%d  \n", line);
}

}  // namespace

// One run of IOMX calls of a reconfiguration. Not begun once deInit() takes the session down, and
// deInit() lets one that has begun finish before it commands a state: no enable follows that command.
// Nothing inside a step waits for a message.
class OmxInterfaceDecoder::Step {
 public:
  explicit Step(SessionState& state) : _state(state), _begun(false) {}
  ~Step() { end(); }
  Step(const Step&) = delete;
  Step& operator=(const Step&) = delete;

  bool begin(const SessionState::Lock& /*held*/) {
    _begun = !_state.tearingDown && !_state.ending;
    _state.reconfigurationStep = _begun;
    return _begun;
  }
  void end() {
    if (!_begun) return;
    _begun = false;
    const SessionState::Lock held(_state.lock);
    _state.reconfigurationStep = false;
    _state.left.notify_all();
  }

 private:
  SessionState& _state;
  bool _begun;
};

void OmxInterfaceDecoder::onOmxObserverEvent(const android::omx_message& message) {
  OmxInterface::onOmxObserverEvent(message);
  std::unique_ptr<android::omx_message> event;
  {
    const SessionState::Lock held(_state->lock);
    if (_queueThreadMessages == nullptr) return;
  }
  event.reset(new (std::nothrow) android::omx_message());
  if (event == nullptr) {
    logError("OmxInterfaceDecoder::onOmxObserverEvent(const omx_message &message),Malloc null");
    return;
  }
  event->u.event_data = message.u.event_data;
  {
    const SessionState::Lock held(_state->lock);
    if (_queueThreadMessages == nullptr) return;
    _queueThreadMessages->lock();
    if (_queueThreadMessages->add(event.get())) static_cast<void>(event.release());
    _queueThreadMessages->unlock();
    if (message.u.event_data.event == OMX_EventError) {
      // The event thread may be waiting for buffers that a failed component never returns.
      _state->componentFailed = true;
      sem_post(&_semOutputBuffersReturned);
    }
  }
  sem_post(&_semEventQueued);
}

void* OmxInterfaceDecoder::EventMonitorThread(void* session) {
  auto& self = *static_cast<OmxInterfaceDecoder*>(session);
  self.monitorEvents();
  const SessionState::Lock held(self._state->lock);
  self._state->leaveThread(self._state->eventThread, held);
  return nullptr;
}

void OmxInterfaceDecoder::monitorEvents() {
  for (;;) {
    if (eventQueueGone()) {
      if (!_deinitDone) logQueueGone(290);
      return;
    }
    SessionState::sleepOn(_semEventQueued);
    // Kept: one post from outside goes through both waits; the flag shows the destructor a thread that
    // is between them.
    _eventThreadWaiting = true;
    sem_post(&_semEventQueued);
    SessionState::sleepOn(_semEventQueued);
    _eventThreadWaiting = false;
    if (eventQueueGone()) {
      if (!_deinitDone) logQueueGone(305);
      return;
    }
    while (handleNextEvent()) {
    }
    if (_threadError != OMXI_OK || _deinitDone) return;
  }
}

bool OmxInterfaceDecoder::eventQueueGone() {
  const SessionState::Lock held(_state->lock);
  return _queueThreadMessages == nullptr;
}

// Takes the oldest event out and handles it with no lock held: the delivery thread, which may have to
// bring the very buffers that the event waits for, can queue another one meanwhile. False when there
// is none.
bool OmxInterfaceDecoder::handleNextEvent() {
  std::unique_ptr<android::omx_message> record;
  {
    const SessionState::Lock held(_state->lock);
    if (_queueThreadMessages == nullptr) return false;
    _queueThreadMessages->lock();
    record.reset(static_cast<android::omx_message*>(_queueThreadMessages->dequeue()));
    _queueThreadMessages->unlock();
    if (record == nullptr) return false;
    _state->handlingEvent = true;
  }
  const auto& event = record->u.event_data;
  onEvent(event.event, event.data1, event.data2);
  const SessionState::Lock held(_state->lock);
  _state->handlingEvent = false;
  _state->left.notify_all();
  return true;
}

void OmxInterfaceDecoder::onEvent(OMX_EVENTTYPE event, unsigned long data1, unsigned long data2) {
  switch (event) {
    case OMX_EventCmdComplete: {
      const int result = onCommandComplete(static_cast<OMX_COMMANDTYPE>(data1), data2);
      if (result != OMXI_OK) setThreadError(result);
      return;
    }
    case OMX_EventError: {
      setThreadError(OMXI_ERR_EVENT_ERROR);
      const SessionState::Lock held(_state->lock);
      _endOfOutputReached = true;
      sem_post(&_semEndOfOutput);
      wakeIfOutputReturned();
      return;
    }
    case OMX_EventPortSettingsChanged:
      return onPortSettingsChanged(data1);
    default:
      // As the devices' 32-bit long prints them.
      logError("Unknown Event (%d, %ld, %ld)", static_cast<int>(event),
               static_cast<long>(static_cast<int32_t>(data1)),
               static_cast<long>(static_cast<int32_t>(data2)));
  }
}

// First half of a reconfiguration: disables the output port, and once all of its buffers are back and
// their pictures delivered, frees them. The completion of the disable goes on from there.
void OmxInterfaceDecoder::onPortSettingsChanged(unsigned long port) {
  if (_omxState != OMX_StateExecuting) return;
  if (port != kOmxOutputPort) {
    return logError("ERROR: PORT SETTING CHANGED - being called on INPUT PORT \n");
  }
  Step step(*_state);
  {
    const SessionState::Lock held(_state->lock);
    if (_state->changingSettings) {
      _state->settingsChangePending = true;  // carried out when the port is enabled again
      return;
    }
    if (!step.begin(held)) return;
    _state->changingSettings = true;
    _portReconfiguring = true;  // no buffer goes to the component from here on
  }
  const android::status_t status = _omx->sendCommand(_node, OMX_CommandPortDisable, kOmxOutputPort);
  step.end();
  if (status != android::OK) {
    logError("ERROR: PORT SETTING CHANGED - Unable to send command to disable port: error %d\n", status);
    // Kept: _portReconfiguring stays set, so nothing more comes out until another change is announced.
    const SessionState::Lock held(_state->lock);
    _state->changingSettings = false;
    return;
  }
  {
    SessionState::Lock held(_state->lock);
    const auto returned = [this] { return allReturned(kOmxOutputPort) && outputDelivered(); };
    _state->await(held, _semOutputBuffersReturned, _state->outputReturnWaiters,
                  [this, &returned] { return returned() || _state->componentFailed; });
    // A component that failed may still be using its buffers; the failure is next to be recorded, and
    // deInit() frees the port.
    if (!returned() || !step.begin(held)) return;
  }
  auto definition = OMX_PARAM_PORTDEFINITIONTYPE();
  if (readPortDefinition(kOmxOutputPort, &definition) == android::OK) {
    const SessionState::Lock held(_state->lock);
    _portFrameSize[kOmxOutputPort] = {static_cast<int32_t>(definition.format.video.nFrameWidth),
                                      static_cast<int32_t>(definition.format.video.nFrameHeight)};
  }
  static_cast<void>(freeBuffersOnPort(kOmxOutputPort));  // the component reports what it refuses
}

int OmxInterfaceDecoder::onCommandComplete(OMX_COMMANDTYPE command, unsigned long data) {
  {
    // What completes behind deInit()'s command to go Idle is no failure: deInit() sees to the port.
    const SessionState::Lock held(_state->lock);
    if (_state->tearingDown) return OMXI_OK;
  }
  switch (command) {
    case OMX_CommandPortDisable: {
      if (_threadError != OMXI_OK) return OMXI_OK;
      if (_omxState != OMX_StateExecuting) {
        return failWith(OMXI_ERR_INCORRECT_STATE, "Incorrect State Reached: %d\n",
                        static_cast<int>(_omxState));
      }
      Step step(*_state);
      {
        const SessionState::Lock held(_state->lock);
        if (!step.begin(held)) return OMXI_OK;
      }
      const auto port = static_cast<int32_t>(data);
      const android::status_t status = _omx->sendCommand(_node, OMX_CommandPortEnable, port);
      if (status != android::OK) {
        return failWith(OMXI_ERR_SEND_COMMAND_STATE, "Unable to send command state enabling port: error %d\n",
                        status);
      }
      return allocateBuffersOnPort(port);  // the enable completes when the port has its buffers
    }
    case OMX_CommandPortEnable:
      if (_omxState != OMX_StateExecuting) {
        return failWith(OMXI_ERR_INCORRECT_STATE, "Incorrect State Reached: %d\n",
                        static_cast<int>(_omxState));
      }
      onPortEnabled();
      return OMXI_OK;
    default:
      return OMXI_OK;  // state changes were dealt with on the delivery thread
  }
}

void OmxInterfaceDecoder::onPortEnabled() {
  bool again = false;
  {
    const SessionState::Lock held(_state->lock);
    _portReconfiguring = false;
    _state->changingSettings = false;
    again = _state->settingsChangePending;
    _state->settingsChangePending = false;
  }
  static_cast<void>(fillOutputBuffers());  // a refusal has been logged
  if (again) onPortSettingsChanged(kOmxOutputPort);
}
