// States of the component, failures, callbacks, the platform wrapper's life.
#include "core/log.h"
#include "core/omx_interface.h"
#include "core/session_state.h"
#include "platform/board_platform_wrapper.h"

// Has to be followed by awaitState() when it succeeds.
int OmxInterface::commandState(int32_t state) {
  if (_omx == nullptr) return android::NO_INIT;
  {
    // Before the command goes out: its completion may be here before the call is back.
    const SessionState::Lock held(_state->lock);
    _state->awaitedState = state;
    _state->awaitedStateReached = false;
  }
  return _omx->sendCommand(_node, OMX_CommandStateSet, state);
}

// Waits for the completion of the last state command. False when the session ended instead.
bool OmxInterface::awaitState() {
  SessionState::Lock held(_state->lock);
  _state->await(held, _semStateChanged, _state->stateWaiters, [this] { return _state->awaitedStateReached; });
  return _state->awaitedStateReached;
}

int OmxInterface::init() {
  const SessionCall call(*_state);
  if (_state->startThread(_state->outputThread, _outputThread, DataOutputThread, this) != 0) {
    return OMXI_ERR_CREATE_OUTPUT_THREAD;
  }
  if (commandState(OMX_StateIdle) != android::OK) return OMXI_ERR_SEND_COMMAND_STATE;
  for (const int port : {kOmxInputPort, kOmxOutputPort}) {
    const int result = allocateBuffersOnPort(port);
    if (result != OMXI_OK) return result;
  }
  if (!awaitState()) return OMXI_ERR_SEND_COMMAND_STATE;
  _state->idle = true;
  if (commandState(OMX_StateExecuting) != android::OK) return OMXI_ERR_SET_EXECUTION_STATE;
  _state->idle = false;
  if (!awaitState()) return OMXI_ERR_SET_EXECUTION_STATE;
  return fillOutputBuffers();
}

int OmxInterface::deInit() {
  const SessionCall call(*_state);
  if (_deinitDone) return _threadError;

  // What deInit() returns when the session is destroyed under it.
  const auto ended = [this]() -> int {
    const int error = _threadError;
    return error != OMXI_OK ? error : OMXI_ERR_SEND_COMMAND_STATE;
  };
  {
    SessionState::Lock held(_state->lock);
    _state->await(held, _semEndOfOutput, _state->endOfOutputWaiters,
                  [this] { return _endOfOutputReached || _threadError != OMXI_OK; });
    if (_state->ending) return ended();
    // A reconfiguration that has sent nothing yet is not begun; one that is sending finishes its
    // calls first, so that no enable follows the command to go Idle. Nor does a buffer, which the component
    // would refuse then.
    _state->tearingDown = true;
    _state->left.wait(held, [this] { return !_state->reconfigurationStep && _state->fills == 0; });
  }

  // Where a former call was refused the way on from Idle, the component is there already and would take
  // another command to go there for an error.
  if (!_state->idle) {
    const android::status_t refused = commandState(OMX_StateIdle);
    if (refused != android::OK) {
      // The component goes on; what was held back in between is made up for by the next settings change
      // or the next call.
      {
        const SessionState::Lock held(_state->lock);
        _state->tearingDown = false;
      }
      return failWith(OMXI_ERR_SEND_COMMAND_STATE, "Error Sending Idle State: %d\n", refused);
    }
    if (!awaitState()) return ended();
    _state->idle = true;
  }
  const android::status_t status = commandState(OMX_StateLoaded);
  if (status != android::OK) {
    return failWith(OMXI_ERR_SEND_COMMAND_STATE, "OMXINTERFACE - Error Sending Loaded State: %d\n", status);
  }
  {
    SessionState::Lock held(_state->lock);
    _state->await(held, _semOutputBuffersReturned, _state->outputReturnWaiters,
                  [this] { return allReturned(kOmxOutputPort); });
    if (_state->ending) return ended();
    // The event thread may still be between "all are back" and the end of its event; it owns the
    // output port until then.
    _state->left.wait(held, [this] { return !_state->handlingEvent || _state->ending; });
    if (_state->ending) return ended();
  }
  static_cast<void>(freeBuffersOnPort(kOmxOutputPort));  // Kept: what cannot be freed is freed with the node
  static_cast<void>(freeBuffersOnPort(kOmxInputPort));
  _deinitDone = true;
  if (!awaitState()) return ended();
  releaseWrapper();
  return _threadError;
}

void OmxInterface::setThreadError(int code) {
  const SessionCall call(*_state);
  InputCallback callback = nullptr;
  void* context = nullptr;
  {
    const SessionState::Lock held(_state->lock);
    _threadError = code;
    callback = _inputCallback;
    context = _inputCallbackContext;
  }
  sem_post(&_semEndOfOutput);  // deInit() may have looked just before
  if (callback != nullptr) callback(this, context);
}

void OmxInterface::registerInputCallback(InputCallback callback, void* context) {
  const SessionCall call(*_state);
  const SessionState::Lock held(_state->lock);
  _inputCallback = callback;
  _inputCallbackContext = context;
}

void OmxInterface::registerOutputCallback(OutputCallback callback, void* context) {
  const SessionCall call(*_state);
  const SessionState::Lock held(_state->lock);
  _outputCallback = callback;
  _outputCallbackContext = context;
}

void OmxInterface::onEvent(OMX_EVENTTYPE /*event*/, unsigned long /*data1*/, unsigned long /*data2*/) {}

void OmxInterface::onOmxObserverEvent(const android::omx_message& message) {
  const auto& event = message.u.event_data;
  if (event.event == OMX_EventCmdComplete && event.data1 == OMX_CommandStateSet) {
    const auto state = static_cast<int32_t>(event.data2);
    {
      const SessionState::Lock held(_state->lock);
      _omxState = state;
      if (state == _state->awaitedState) _state->awaitedStateReached = true;
    }
    sem_post(&_semStateChanged);
  } else if (event.event == OMX_EventError) {
    logError("OMXINTERFACE - Event error = %d(0x%x), data2 %d \n", static_cast<int>(event.data1),
             static_cast<unsigned>(event.data1), static_cast<int>(event.data2));
  }
}

OmxInterface::WrapperUse::WrapperUse(OmxInterface& session) : _state(*session._state), _wrapper(nullptr) {
  const SessionState::Lock held(_state.lock);
  _wrapper = session._platformWrapper;
  if (_wrapper != nullptr) ++_state.wrapperUses;
}

OmxInterface::WrapperUse::~WrapperUse() {
  if (_wrapper == nullptr) return;
  const SessionState::Lock held(_state.lock);
  if (--_state.wrapperUses == 0) _state.left.notify_all();
}

// Deletes the wrapper once nobody uses it; whoever asks for it later gets none.
void OmxInterface::releaseWrapper() {
  CBoardPlatformWrapper* wrapper = nullptr;
  {
    SessionState::Lock held(_state->lock);
    wrapper = _platformWrapper;
    _platformWrapper = nullptr;
    _state->left.wait(held, [this] { return _state->wrapperUses == 0; });
  }
  CBoardPlatformWrapper::Destroy(wrapper);
}

void OmxInterface::setPortBufferModes(int32_t inputMode, int32_t outputMode) {
  _portBufferMode[kOmxInputPort] = inputMode;
  _portBufferMode[kOmxOutputPort] = outputMode;
}
