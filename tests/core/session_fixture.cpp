#include "tests/core/session_fixture.h"

#include <string.h>

#include <algorithm>
#include <map>
#include <utility>

#include <utils/String8.h>

namespace omxtest {

namespace {

// The port definition's index, and what is wrong with its record if something is.
std::string definitionText(const Call& call) {
  const auto record = call.as<OMX_PARAM_PORTDEFINITIONTYPE>();
  if (!record || call.size != sizeof(*record)) return " a record that is too short";
  std::string text = " definition of port " + std::to_string(record->nPortIndex);
  if (record->nSize != sizeof(*record)) text += " size word " + std::to_string(record->nSize);
  if (record->nVersion.nVersion != 0x0101) text += " version " + std::to_string(record->nVersion.nVersion);
  return text;
}

std::string parameterText(const Call& call) {
  if (call.index == OMX_IndexParamPortDefinition) return definitionText(call);
  return android::String8::format(" 0x%08x size %zu", static_cast<unsigned>(call.index), call.size).string();
}

std::string commandText(const Call& call) {
  switch (call.command) {
    case OMX_CommandStateSet:
      return " state " + std::to_string(call.param);
    case OMX_CommandPortDisable:
      return " disable " + std::to_string(call.param);
    case OMX_CommandPortEnable:
      return " enable " + std::to_string(call.param);
    default:
      return " command " + std::to_string(call.command) + " " + std::to_string(call.param);
  }
}

}  // namespace

std::string describeState(OmxInterface& session) {
  SessionState& state = *session._state;
  const SessionState::Lock held(state.lock, std::try_to_lock);
  std::string text = held.owns_lock() ? "" : "the session's lock is taken\n";
  const auto busy = [&session](int port) {
    size_t count = 0;
    for (const BufferInfo& record : session._portBuffers[port]) count += record.busy ? size_t{1} : 0;
    return count;
  };
  text += android::String8::format(
              "state %d awaited %d reached %d error %d; input %zu of %zu busy, output %zu of %zu busy\n",
              static_cast<int>(session._omxState), state.awaitedState, state.awaitedStateReached,
              static_cast<int>(session._threadError), busy(0), session._portBuffers[0].size(), busy(1),
              session._portBuffers[1].size())
              .string();
  text += android::String8::format(
              "ending %d calls %d output thread %d event thread %d delivering %d uses %d %d; tearing down %d "
              "reconfiguring %d step %d handling %d\n",
              state.ending, state.calls, state.outputThread.running, state.eventThread.running,
              state.delivering, state.ports[0].uses, state.ports[1].uses, state.tearingDown,
              static_cast<bool>(session._portReconfiguring), state.reconfigurationStep, state.handlingEvent)
              .string();
  text += android::String8::format(
              "waiting: %d state, %d end of output, %d output buffers, %d input buffer\n", state.stateWaiters,
              state.endOfOutputWaiters, state.outputReturnWaiters, state.inputFreeWaiters)
              .string();
  return text;
}

SessionTest::SessionTest(const char* device) : _server(device) {
  hangReport() = [this] {
    fprintf(stderr, "%s", omx().describeCalls().c_str());
    for (const std::string& line : log()) fprintf(stderr, "log: %s\n", line.c_str());
    if (_session != nullptr) fprintf(stderr, "%s", describeState(*_session).c_str());
  };
}

SessionTest::~SessionTest() {
  for (Gate& gate : _gates) gate.open();
  if (_session != nullptr) destroy();
  hangReport() = nullptr;
}

void SessionTest::construct(Kind kind) {
  _kind = kind;
  _session = std::make_unique<OmxInterface>();
  _session->_isEncoder = kind == Kind::Encoder;
}

void SessionTest::connect(Kind kind) {
  construct(kind);
  ASSERT_EQ(_session->setupIOMXConnections(), OMXI_OK);
  _application.attach(*_session);
}

void SessionTest::start(Kind kind) {
  ASSERT_NO_FATAL_FAILURE(connect(kind));
  ASSERT_EQ(init(), OMXI_OK);
}

Later<int> SessionTest::beginInit() {
  return {"init()", [session = _session.get()] { return session->init(); }};
}

Later<int> SessionTest::beginDeInit() {
  return {"deInit()", [session = _session.get()] { return session->deInit(); }};
}

Later<int> SessionTest::beginEndOfInput(int timestamp) {
  return {"sendEndOfInputFlag()",
          [session = _session.get(), timestamp] { return session->sendEndOfInputFlag(timestamp); }};
}

void SessionTest::endOfStream(int timestamp) {
  ASSERT_EQ(beginEndOfInput(timestamp).result(), 0);
  requireEventually([this]() -> bool { return _session->_endOfOutputReached; }, "the end of output");
}

Later<bool> SessionTest::beginDestroy() {
  // The pointer stays readable for calls in progress on other threads of the test.
  return {"destruction", [session = _session.release()] {
            delete session;
            return true;
          }};
}

Later<bool> SessionTest::beginDestroyOfBusySession() {
  SessionState& state = *_session->_state;
  Later<bool> destroyed = beginDestroy();
  requireEventually(
      [&] {
        const SessionState::Lock held(state.lock);
        return state.ending;
      },
      "the beginning of the destruction");
  return destroyed;
}

void SessionTest::destroy() {
  beginDestroy().result();
}

int SessionTest::feed(const std::string& text, int timestamp) {
  std::string bytes = text;
  return _session->sendInputData(bytes.data(), static_cast<unsigned int>(bytes.size()), timestamp);
}

void SessionTest::feedThrough(const std::string& text, int timestamp) {
  const size_t before = _application.outputs().size();
  ASSERT_EQ(feed(text, timestamp), 0);
  _application.waitForOutputs(before + 1);
}

void SessionTest::componentProduces(const std::string& text, OMX_TICKS timestamp, OMX_U32 flags) {
  script().produce(Packet(text, timestamp, flags));
}

void SessionTest::deliver(const android::omx_message& message) {
  const Match same = [message](const android::omx_message& other) {
    return other.type == message.type && memcmp(&other.u, &message.u, sizeof(message.u)) == 0;
  };
  const size_t before = messages().deliveredCount(same);
  ASSERT_TRUE(messages().forge(_session->_node, message));
  require(messages().waitForDelivered(same, before + 1), "the delivery of a forged message");
}

size_t SessionTest::busyCount(int port) const {
  const SessionState::Lock held(_session->_state->lock);
  const auto& records = _session->_portBuffers[port];
  return static_cast<size_t>(std::count_if(records.begin(), records.end(),
                                           [](const BufferInfo& record) -> bool { return record.busy; }));
}

Trace SessionTest::trace(size_t from) {
  Trace lines;
  std::map<void*, std::string> names;
  size_t made[2] = {0, 0};
  for (const Call& call : _server.omx().calls()) {
    std::string line = name(call.method);
    switch (call.method) {
      case Method::AllocateNode:
        line += " " + call.text;
        made[0] = made[1] = 0;
        break;
      case Method::SendCommand:
        line += commandText(call);
        break;
      case Method::GetParameter:
      case Method::SetParameter:
        line += parameterText(call);
        break;
      case Method::UseBuffer:
      case Method::AllocateBuffer:
      case Method::AllocateBufferWithBackup: {
        const size_t size = call.method == Method::AllocateBuffer ? call.size : call.blockSize;
        std::string& place = names[call.buffer];
        place = (call.port == 0 ? "in" : "out") + std::to_string(made[call.port]++);
        line += " " + place + " of " + std::to_string(size);
        break;
      }
      case Method::FreeBuffer:
        line += " " + std::to_string(call.port) + " " + names[call.buffer];
        break;
      case Method::FillBuffer:
        line += " " + names[call.buffer];
        break;
      case Method::EmptyBuffer:
        line += " " + names[call.buffer] +
                android::String8::format(" %u+%u flags 0x%x time %lld", call.offset, call.length, call.flags,
                                         static_cast<long long>(call.timestamp))
                    .string();
        break;
      default:
        break;
    }
    if (call.status != android::OK) line += " failed";
    lines.push_back(line);
  }
  lines.erase(lines.begin(), lines.begin() + static_cast<ptrdiff_t>(std::min(from, lines.size())));
  return lines;
}

int SessionTest::valueOf(sem_t& semaphore) {
  int value = -1;
  sem_getvalue(&semaphore, &value);
  return value;
}

void SessionTest::waitForSleeper(int SessionState::*waiters, int count) const {
  requireEventually(
      [&] {
        const SessionState::Lock held(_session->_state->lock);
        return _session->_state->*waiters == count;
      },
      "a thread that waits");
}

}  // namespace omxtest
