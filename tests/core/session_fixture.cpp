#include "tests/core/session_fixture.h"

#include <string.h>

#include <algorithm>
#include <map>
#include <utility>

#include <utils/String8.h>

namespace omxtest {

namespace {

size_t countBusy(const android::Vector<BufferInfo>& records) {
  return static_cast<size_t>(std::count_if(records.begin(), records.end(),
                                           [](const BufferInfo& record) -> bool { return record.busy; }));
}

// The port definition's index, and what is wrong with its record if something is.
std::string parameterText(const Call& call) {
  if (call.index != OMX_IndexParamPortDefinition)
    return android::String8::format(" 0x%08x size %zu", static_cast<unsigned>(call.index), call.size)
        .string();
  const auto record = call.as<OMX_PARAM_PORTDEFINITIONTYPE>();
  if (!record || call.size != sizeof(*record)) return " a record of another size";
  std::string text = " definition of port " + std::to_string(record->nPortIndex);
  if (record->nSize != sizeof(*record)) text += " size word " + std::to_string(record->nSize);
  if (record->nVersion.nVersion != 0x0101) text += " version " + std::to_string(record->nVersion.nVersion);
  return text;
}

std::string commandText(const Call& call) {
  static constexpr const char* kNames[] = {" state ", " flush ", " disable ", " enable ", " mark "};
  return kNames[call.command] + std::to_string(call.param);
}

}  // namespace

Trace traceOf(RecordingOmx& omx, size_t from) {
  Trace lines;
  std::map<void*, std::string> names;
  size_t made[2] = {0, 0};
  for (const Call& call : omx.calls()) {
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
        std::string& place = names[call.buffer];
        place = (call.port == 0 ? "in" : "out") + std::to_string(made[call.port]++);
        line += " " + place + " of " + std::to_string(call.size);
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

SessionTest::SessionTest(const char* device) : _server(device) {
  hangReport() = [this] {
    for (const Trace& lines : {trace(), log()}) {
      for (const std::string& line : lines) fprintf(stderr, "%s\n", line.c_str());
    }
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
  EXPECT_FALSE(destroyed.isDone());
  return destroyed;
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

void SessionTest::holdInputAllBut(size_t left) {
  script().holdInput();
  for (size_t i = left; i < kInputs; ++i) ASSERT_EQ(feed("held"), 0);
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
  return countBusy(_session->_portBuffers[port]);
}

int SessionTest::valueOf(sem_t& semaphore) {
  int value = -1;
  sem_getvalue(&semaphore, &value);
  return value;
}

void SessionTest::waitForSleeper(int SessionState::*waiters, int count) {
  requireUnderLock([=](SessionState& state) { return state.*waiters == count; }, "a thread that waits");
}

void SessionTest::waitForBusy(int port, size_t count) {
  requireEventually([&] { return busyCount(port) == count; }, "buffers to be where they should");
}

void SessionTest::waitForFills(size_t count) {
  require(omx().waitForCalls(Method::FillBuffer, count), "a buffer given to the component");
}

void SessionTest::waitForOutputThreadToEnd() {
  requireUnderLock([](SessionState& state) { return !state.outputThread.running; },
                   "the end of the output thread");
}

}  // namespace omxtest
