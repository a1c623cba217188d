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
  if (_step == step && !_marks.empty()) return;
  _step = step;
  _marks.push_back({step, omxhost::memoryBlocksAsked(), threadsMade()});
}

size_t Injector::nth(const Likeness& likeness) {
  return ++_alike[likeness];
}

bool Injector::refuses(const Call& call) {
  const std::lock_guard<std::mutex> lock(_mutex);
  const OMX_U32 port = portOf(call);
  const size_t nth = this->nth({static_cast<size_t>(_step), static_cast<size_t>(call.method), port,
                                static_cast<size_t>(call.index), static_cast<size_t>(call.command),
                                static_cast<size_t>(call.param)});
  if (++_calls != _fault.number || _fault.place != Place::Call) return false;
  _hit = {_step, nth, call, port, {}};
  _happened = true;
  return true;
}

Fate Injector::fate(android::omx_message& message) {
  const std::lock_guard<std::mutex> lock(_mutex);
  const size_t nth = this->nth({static_cast<size_t>(_step), SIZE_MAX, static_cast<size_t>(message.type)});
  if (++_messages != _fault.number || _fault.place != Place::Message) return Fate::Pass;
  _hit = {_step, nth, {}, 0, message};
  _happened = true;
  switch (_fault.kind) {
    case Kind::Lost:
      return Fate::Drop;
    case Kind::Doubled:
      return Fate::Repeat;
    case Kind::Forged:
      if (message.type == android::omx_message::EVENT) message.node = kNobody;
      if (message.type == android::omx_message::EMPTY_BUFFER_DONE) message.u.buffer_data.buffer = kNobody;
      if (message.type == android::omx_message::FILL_BUFFER_DONE)
        message.u.extended_buffer_data.buffer = kNobody;
      return Fate::Pass;
    default:
      return Fate::Hold;
  }
}

bool Injector::release(Kind kind) {
  return _fault.kind == kind && _server.messages().release();
}

void Injector::awaitRepeat() const {
  if (_fault.kind != Kind::Doubled || !_happened) return;
  static_cast<void>(_server.messages().waitForDelivered(anyMessage(), _fault.number + 1));
}

uint64_t Injector::threadsMade() const {
  const size_t asked = _fault.place == Place::Thread ? _fault.number : kCounting;
  return asked - _threadFault.left();
}

std::array<size_t, kPlaces> Injector::counts() const {
  const std::lock_guard<std::mutex> lock(_mutex);
  return {_calls, omxhost::memoryBlocksAsked(), threadsMade(), _messages};
}

std::optional<Hit> Injector::hit() const {
  const std::lock_guard<std::mutex> lock(_mutex);
  if (_happened) return _hit;
  if (_fault.place == Place::Call || _fault.place == Place::Message) return {};
  // In the last step that began before it.
  const bool memory = _fault.place == Place::Memory;
  if ((memory ? omxhost::memoryBlocksAsked() : threadsMade()) < _fault.number) return {};
  Hit hit;
  for (const Mark& mark : _marks) {
    const uint64_t before = memory ? mark.blocks : mark.threads;
    if (before < _fault.number) hit = {mark.step, _fault.number - before, {}, 0, {}};
  }
  return hit;
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
