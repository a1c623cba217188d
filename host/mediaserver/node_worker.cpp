// The worker thread: commands first, then one step of the codec at a time.

#include <utility>

#include "host/mediaserver/node.h"

namespace mediaserver {

void Node::work() {
  Lock lock(_mutex);
  while (!_stopping) {
    // Cleared before looking around: whatever comes during a codec call is seen in the next round.
    _signalled = false;
    _awaitsReader = false;
    if (runCommand(lock) || process(lock)) continue;
    deliver(lock);
    pause(lock);
  }
  stopCodec(lock);
}

void Node::deliver(Lock& lock) {
  lock.unlock();
  _channel.deliver();
  lock.lock();
}

void Node::pause(Lock& lock) {
  const bool limited = _awaitsReader;
  const auto limit = _lastExchange + _readingTime;
  bool inTime = true;
  while (inTime && !_signalled && !_stopping) {
    _asleep = true;
    lock.unlock();
    if (limited) {
      inTime = _wakeUp.waitUntil(limit);
    } else {
      _wakeUp.wait();
    }
    lock.lock();
    _asleep = false;
  }
}

bool Node::process(Lock& lock) {
  if (_state != OMX_StateExecuting) return false;
  if (_configureDue) {
    _configureDue = false;
    const PortPair ports = definitions();
    lock.unlock();
    _codec->configure(ports);
    lock.lock();
    return true;
  }
  return announce() || receiveOutput(lock) || sendInput(lock);
}

// New settings are told only while an output buffer can be held back: clients recognise the return of the
// last one, after they have disabled the port, as the moment at which all of them are theirs.
bool Node::announce() {
  if (_settings != Settings::Due || _ports[kOutputPort].line.empty()) return false;
  _settings = Settings::Announced;
  event(OMX_EventPortSettingsChanged, kOutputPort, _settingsIndex);
  return true;
}

// The client has answered the announcement, or the work has been stopped.
void Node::endAnnouncement(Settings next) {
  if (next == Settings::Reallocating && _settings != Settings::Agreed) _settings = next;
  if (next == Settings::Due && _settings == Settings::Announced) _settings = next;
  for (const android::omx_message& message : _deferred) _channel.post(message);
  _deferred.clear();
}

bool Node::receiveOutput(Lock& lock) {
  Port& port = _ports[kOutputPort];
  if (_settings != Settings::Agreed || port.line.empty()) return false;
  const std::shared_ptr<Buffer> buffer = port.takeFirst();
  OutputSpace space{buffer->data(), buffer->capacity()};
  lock.unlock();
  const Received received = _codec->receive(space);
  lock.lock();
  // With nothing to go on with, the rest is written at once: what it is made from is still close to this
  // processor.
  if (received == Received::Filled && space.complete && _ports[kInputPort].line.empty()) {
    lock.unlock();
    std::exchange(space.complete, nullptr)();
    lock.lock();
  }

  switch (received) {
    case Received::Filled:
      finishOutput(buffer, std::move(space), lock);
      return true;
    case Received::Drained:
      if (_draining) {
        OutputSpace end{buffer->data(), buffer->capacity()};
        end.flags = OMX_BUFFERFLAG_EOS;
        end.timestamp = _drainTime;
        finishOutput(buffer, std::move(end), lock);
        return true;
      }
      break;
    case Received::NewGeometry:
      port.putBack(buffer);
      return readersAreDone() && changeGeometry(lock);
    case Received::Nothing:
      break;
  }
  port.putBack(buffer);
  return false;
}

// Clients look at the port's definition for each picture, when they come to it. It should describe that
// picture and not the next, so it changes when the client has read what it got before: when it has sent that
// back, or freed it. Only time tells one that reads from one that keeps a picture until the next one comes,
// or sends nothing back any more because it has sent its end mark. Compressed output describes itself.
bool Node::readersAreDone() {
  const Port& port = _ports[kOutputPort];
  _awaitsReader =
      !port.compressed() && port.unread() && std::chrono::steady_clock::now() < _lastExchange + _readingTime;
  return !_awaitsReader;
}

bool Node::changeGeometry(Lock& lock) {
  Port& port = _ports[kOutputPort];
  PortDefinition definition = port.definition;
  lock.unlock();
  const OMX_U32 changed = _codec->geometry(definition);
  lock.lock();
  port.grant(definition);
  ++_revision;
  if (changed == 0 || changed == OMX_IndexParamPortDefinition) {
    _settings = Settings::Due;
    _settingsIndex = changed;
  } else {
    event(OMX_EventPortSettingsChanged, kOutputPort, changed);
  }
  return true;
}

void Node::finishOutput(const std::shared_ptr<Buffer>& buffer, OutputSpace space, Lock& lock) {
  buffer->header.nOffset = space.offset;
  buffer->header.nFilledLen = space.length;
  buffer->header.nFlags = space.flags;
  buffer->header.nTimeStamp = space.timestamp;
  buffer->unread = space.length > 0;
  _lastExchange = std::chrono::steady_clock::now();
  if ((space.flags & OMX_BUFFERFLAG_EOS) != 0) {
    _draining = false;
    // Before the buffer, which clients may take for the last they hear.
    event(OMX_EventBufferFlag, kOutputPort, space.flags);
  }
  giveBack(kOutputPort, buffer, std::move(space.complete));
  if (_ports[kInputPort].line.empty()) {
    deliver(lock);
  } else {
    _channel.wake();  // the codec goes on beside the delivery
  }
}

bool Node::sendInput(Lock& lock) {
  Port& port = _ports[kInputPort];
  // What follows the end of a stream belongs to the next one.
  if (_draining || port.line.empty()) return false;
  const std::shared_ptr<Buffer> buffer = port.takeFirst();
  const OMX_BUFFERHEADERTYPE& header = buffer->header;
  const InputView view{buffer->data() + header.nOffset, header.nFilledLen, header.nTimeStamp, header.nFlags};
  const bool end = (view.flags & OMX_BUFFERFLAG_EOS) != 0;
  _channel.wake();
  lock.unlock();
  const bool taken = _codec->send(view) == Sent::Taken;
  if (taken && end) _codec->drain(view.timestamp);
  lock.lock();
  if (!taken) {
    port.putBack(buffer);
    return false;
  }
  if (end) {
    _draining = true;
    _drainTime = view.timestamp;
  } else if (!_configureDue) {
    receiveOutput(lock);  // first of all: it is what the client waits for
  }
  giveBack(kInputPort, buffer);  // told with what comes next, or else before the pause
  return true;
}

}  // namespace mediaserver
