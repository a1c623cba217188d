#include "tests/faults/injector.h"

#include <omxhost/faults.h>

#include "tests/support/omx_client.h"

namespace omxtest {

namespace {

// No id of the server's: those are small numbers.
void* const kNobody = reinterpret_cast<void*>(uintptr_t{0xF0F0F0F0});

constexpr size_t kCounting = SIZE_MAX;

}  // namespace

const char* name(Step step) {
  static constexpr const char* kNames[] = {"create",    "configure",    "init",   "feed",   "reconfigure",
                                           "feed more", "end of input", "deInit", "destroy"};
  return kNames[static_cast<size_t>(step)];
}

OMX_U32 portOf(const Call& call) {
  const auto words = call.as<std::array<OMX_U32, 3>>();  // size, version, port
  return words.has_value() ? words->at(2) : call.port;
}

Injector::Injector(ScriptedMediaServer& server, const Fault& fault)
    : _server(server),
      _fault(fault),
      _threadFault(faults::Failing::Thread, fault.place == Place::Thread ? fault.number : kCounting) {
  omxhost::failMemoryBlock(fault.place == Place::Memory ? fault.number : 0);
  server.omx().failWhere([this](const Call& call) { return refuses(call); });
  server.messages().setFilter([this](android::omx_message& message) { return fate(message); });
}

Injector::~Injector() {
  omxhost::failMemoryBlock(0);
  _server.omx().failNothing();
  _server.messages().passAll();
}

void Injector::enter(Step step) {
  const std::lock_guard<std::mutex> lock(_mutex);
  if (_step == step) return;
  _step = step;
  _alike.clear();
  // Until it happens: that step is the last one that begins before.
  if (!_happened && asked() < _fault.number) _hit = {step, _fault.number - asked(), {}, 0, {}};
}

bool Injector::refuses(const Call& call) {
  const std::lock_guard<std::mutex> lock(_mutex);
  const OMX_U32 port = portOf(call);
  const size_t nth = ++_alike[{static_cast<OMX_U32>(call.method), port, static_cast<OMX_U32>(call.index),
                               call.command, static_cast<OMX_U32>(call.param)}];
  if (++_calls != _fault.number || _fault.place != Place::Call) return false;
  _hit = {_step, nth, call, port, {}};
  _happened = true;
  return true;
}

Fate Injector::fate(android::omx_message& message) {
  const std::lock_guard<std::mutex> lock(_mutex);
  const size_t nth = ++_alike[{~OMX_U32{0}, static_cast<OMX_U32>(message.type)}];
  if (++_messages != _fault.number || _fault.place != Place::Message) return Fate::Pass;
  _hit = {_step, nth, {}, 0, message};
  _happened = true;
  if (_fault.kind == Kind::Lost) return Fate::Drop;
  if (_fault.kind == Kind::Doubled) return Fate::Repeat;
  if (_fault.kind != Kind::Forged) return Fate::Hold;
  if (message.type == android::omx_message::EVENT) message.node = kNobody;
  if (message.type == android::omx_message::EMPTY_BUFFER_DONE) message.u.buffer_data.buffer = kNobody;
  if (message.type == android::omx_message::FILL_BUFFER_DONE) message.u.extended_buffer_data.buffer = kNobody;
  return Fate::Pass;
}

bool Injector::release(Kind kind) {
  return _fault.kind == kind && _server.messages().release();
}

void Injector::awaitRepeat() const {
  if (_fault.kind != Kind::Doubled || !_happened) return;
  static_cast<void>(_server.messages().waitForDelivered(anyMessage(), _fault.number + 1));
}

uint64_t Injector::threadsMade() const {
  const size_t allowed = _fault.place == Place::Thread ? _fault.number : kCounting;
  return allowed - _threadFault.left();
}

// Blocks of memory or threads, whichever the fault is one of.
uint64_t Injector::asked() const {
  return _fault.place == Place::Memory ? omxhost::memoryBlocksAsked() : threadsMade();
}

std::array<size_t, kPlaces> Injector::counts() const {
  const std::lock_guard<std::mutex> lock(_mutex);
  return {_calls, omxhost::memoryBlocksAsked(), threadsMade(), _messages};
}

std::optional<Hit> Injector::hit() const {
  const std::lock_guard<std::mutex> lock(_mutex);
  const bool noted = _fault.place == Place::Call || _fault.place == Place::Message;
  if (noted ? !_happened : asked() < _fault.number) return {};
  return _hit;
}

std::string Injector::describe() const {
  static constexpr const char* kKinds[] = {"no",      "refused", "lost",    "withheld",
                                           "delayed", "late",    "doubled", "forged"};
  static constexpr const char* kPlaceNames[] = {"call", "block of memory", "thread", "message"};
  std::string text = std::string(kKinds[static_cast<size_t>(_fault.kind)]) + " " +
                     kPlaceNames[static_cast<size_t>(_fault.place)] + " " + std::to_string(_fault.number);
  const std::optional<Hit> hit = this->hit();
  if (!hit.has_value()) return text;
  text += std::string(" in ") + name(hit->step);
  if (_fault.place == Place::Call) text += std::string(" (") + name(hit->call.method) + ")";
  if (_fault.place == Place::Message) text += " (" + omxtest::describe(hit->message) + ")";
  return text + ", the " + std::to_string(hit->nth) + ". of its like";
}

}  // namespace omxtest
