// Commands: what is accepted, in which order it is carried out, and when it is complete.

#include <algorithm>

#include "host/mediaserver/node.h"

namespace mediaserver {

namespace {

struct Transition {
  OMX_STATETYPE from;
  OMX_STATETYPE to;
};

// Invalid can be reached from everywhere and is not listed.
constexpr Transition kTransitions[] = {
    {OMX_StateLoaded, OMX_StateIdle},
    {OMX_StateIdle, OMX_StateLoaded},
    {OMX_StateIdle, OMX_StateExecuting},
    {OMX_StateIdle, OMX_StatePause},
    {OMX_StateExecuting, OMX_StateIdle},
    {OMX_StateExecuting, OMX_StatePause},
    {OMX_StatePause, OMX_StateIdle},
    {OMX_StatePause, OMX_StateExecuting},
    {OMX_StateLoaded, OMX_StateWaitForResources},
    {OMX_StateWaitForResources, OMX_StateLoaded},
};

bool legal(OMX_STATETYPE from, OMX_STATETYPE to) {
  if (to == OMX_StateInvalid) return from != OMX_StateInvalid;
  return std::any_of(std::begin(kTransitions), std::end(kTransitions),
                     [&](const Transition& t) { return t.from == from && t.to == to; });
}

bool changesPort(OMX_COMMANDTYPE command) {
  return command == OMX_CommandPortDisable || command == OMX_CommandPortEnable;
}

// States in which the codec is started.
bool active(OMX_STATETYPE state) {
  return state == OMX_StateExecuting || state == OMX_StatePause;
}

}  // namespace

OMX_ERRORTYPE Node::sendCommand(OMX_COMMANDTYPE command, OMX_U32 param) {
  std::lock_guard<std::mutex> lock(_mutex);
  if (!usable()) return OMX_ErrorInvalidState;
  if (command > OMX_CommandMarkBuffer) return OMX_ErrorBadParameter;
  if (command != OMX_CommandStateSet && param == OMX_ALL) {
    for (OMX_U32 port = 0; port < kPortCount; ++port) accept({command, port});
  } else {
    accept({command, param});
  }
  return OMX_ErrorNone;
}

// What a client may do next depends on the command that it has just sent, not on when the worker comes to
// it: where a state leads, and whether a port counts as enabled, changes here.
void Node::accept(const Command& command) {
  if (command.kind == OMX_CommandStateSet) {
    const auto target = static_cast<OMX_STATETYPE>(command.param);
    if (legal(_target, target)) _target = target;
  } else if (changesPort(command.kind) && command.param < kPortCount) {
    Port& port = _ports[command.param];
    port.enabledInTheEnd = command.kind == OMX_CommandPortEnable;
    if (port.commands++ == 0) port.definition.bEnabled = port.enabledInTheEnd ? OMX_TRUE : OMX_FALSE;
  }
  _commands.push_back(command);
  signal();
}

bool Node::runnable(const Command& command) const {
  if (command.kind == OMX_CommandStateSet) {
    // A way to Idle that waits for buffers can be given up.
    return _awaited == OMX_StateInvalid || (_awaited == OMX_StateIdle && command.param == OMX_StateLoaded) ||
           command.param == OMX_StateInvalid;
  }
  if (changesPort(command.kind) && command.param < kPortCount) {
    return _ports[command.param].change == Port::Change::None;
  }
  return true;
}

bool Node::runCommand(Lock& lock) {
  const auto next = std::find_if(_commands.begin(), _commands.end(),
                                 [this](const Command& command) { return runnable(command); });
  if (next == _commands.end() || _state == OMX_StateInvalid) return false;
  const Command command = *next;
  _commands.erase(next);
  if (command.kind == OMX_CommandStateSet) {
    setState(static_cast<OMX_STATETYPE>(command.param), lock);
  } else if (command.param >= kPortCount) {
    error(OMX_ErrorBadPortIndex);
  } else if (command.kind == OMX_CommandFlush) {
    flush(command.param, lock);
  } else if (changesPort(command.kind)) {
    changePort(command.param, command.kind == OMX_CommandPortEnable);
  } else {
    error(OMX_ErrorNotImplemented);  // a mark's data cannot travel through IOMX
  }
  return true;
}

void Node::setState(OMX_STATETYPE target, Lock& lock) {
  const bool givingUp = _awaited == OMX_StateIdle && target == OMX_StateLoaded;
  OMX_ERRORTYPE failure = OMX_ErrorNone;
  if (!givingUp && !legal(_state, target)) {
    failure = target == _state ? OMX_ErrorSameState : OMX_ErrorIncorrectStateTransition;
  } else if (target == OMX_StateInvalid) {
    stopCodec(lock);
    _state = OMX_StateInvalid;
    _awaited = OMX_StateInvalid;
    failure = OMX_ErrorInvalidState;
  } else if (target == OMX_StateLoaded && _state != OMX_StateWaitForResources) {
    _awaited = OMX_StateLoaded;
  } else if (target == OMX_StateIdle && _state == OMX_StateLoaded) {
    _awaited = OMX_StateIdle;
  } else if (target == OMX_StateIdle) {
    stopCodec(lock);
    for (OMX_U32 port = 0; port < kPortCount; ++port) giveBackAll(port);
    endAnnouncement(Settings::Due);
    enterState(OMX_StateIdle);
  } else {
    if (active(target) && _state == OMX_StateIdle) failure = startCodec(lock);
    if (failure == OMX_ErrorNone) enterState(target);
  }
  if (failure != OMX_ErrorNone) {
    forgetTarget();
    error(failure);
  }
  settle();
}

void Node::enterState(OMX_STATETYPE state) {
  _state = state;
  _awaited = OMX_StateInvalid;
  completed(OMX_CommandStateSet, state);
  signal();
}

// After a refused command the remaining ones lead on from where the node stands.
void Node::forgetTarget() {
  _target = _awaited != OMX_StateInvalid ? _awaited : _state;
  for (const Command& command : _commands) {
    const auto target = static_cast<OMX_STATETYPE>(command.param);
    if (command.kind == OMX_CommandStateSet && legal(_target, target)) _target = target;
  }
}

OMX_ERRORTYPE Node::startCodec(Lock& lock) {
  const PortPair ports = definitions();
  _configureDue = false;
  lock.unlock();
  _codec->configure(ports);
  const OMX_ERRORTYPE result = _codec->start();
  lock.lock();
  _started = result == OMX_ErrorNone;
  _draining = false;
  return result;
}

void Node::stopCodec(Lock& lock) {
  if (!_started) return;
  lock.unlock();
  _codec->stop();
  lock.lock();
  _started = false;
  _draining = false;
}

void Node::flush(OMX_U32 port, Lock& lock) {
  if (_started) {
    lock.unlock();
    _codec->flush(port);
    lock.lock();
    if (port == kInputPort) _draining = false;
  }
  giveBackAll(port);
  completed(OMX_CommandFlush, port);
}

void Node::changePort(OMX_U32 index, bool enable) {
  Port& port = _ports[index];
  port.definition.bEnabled = enable ? OMX_TRUE : OMX_FALSE;
  port.change = enable ? Port::Change::Enabling : Port::Change::Disabling;
  if (!enable) {
    giveBackAll(index);
    if (index == kOutputPort) endAnnouncement(Settings::Reallocating);
  }
  settle();
}

// Completes whatever waited for buffers to be given or freed.
void Node::settle() {
  if (_state == OMX_StateInvalid) return;
  settleState();
  for (OMX_U32 port = 0; port < kPortCount; ++port) settlePort(port);
}

void Node::settleState() {
  if (_awaited == OMX_StateInvalid) return;
  const OMX_STATETYPE target = _awaited;
  const bool reached = std::all_of(_ports.begin(), _ports.end(), [&](const Port& port) {
    if (!port.enabled()) return true;
    return target == OMX_StateIdle ? port.populated() : port.buffers.empty();
  });
  if (!reached) return;
  enterState(target);
  // New buffers come with the present definition.
  if (target == OMX_StateLoaded) _settings = Settings::Agreed;
}

void Node::settlePort(OMX_U32 index) {
  Port& port = _ports[index];
  if (port.change == Port::Change::None) return;
  const bool enabling = port.change == Port::Change::Enabling;
  const bool unloaded = _state == OMX_StateLoaded || _state == OMX_StateWaitForResources;
  if (enabling ? !unloaded && !port.populated() : !port.buffers.empty()) return;
  port.change = Port::Change::None;
  --port.commands;
  if (enabling) {
    _configureDue = true;
    if (index == kOutputPort) _settings = Settings::Agreed;
  }
  completed(enabling ? OMX_CommandPortEnable : OMX_CommandPortDisable, index);
  signal();
}

}  // namespace mediaserver
