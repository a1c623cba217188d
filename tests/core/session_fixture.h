// A session with a scripted component behind it and an application in front of it, and the verbs in which
// session tests speak. Everything that may block does so on a thread of its own and with a limit.
#pragma once

#include <gtest/gtest.h>

#include <array>
#include <cstring>
#include <deque>
#include <functional>
#include <memory>
#include <vector>

#include <omxhost/log.h>

#include "core/session_state.h"
#include "decoder/omx_interface_decoder.h"
#include "encoder/omx_interface_encoder.h"
#include "tests/core/application.h"
#include "tests/core/bounded.h"
#include "tests/support/scripted_media_server.h"

namespace omxtest {

using Trace = std::vector<std::string>;
using LogLines = std::vector<std::string>;

// A log capture as text: one entry a line, the priority's letter in front ("E text", "W text"); a tag shows
// as "4/tag text". Exact, blanks and line ends included.
LogLines logLines(const omxhost::LogCapture& capture);

// A call in a few words, with `buffer` for the name of the one it concerns: "fillBuffer out0".
std::string describe(const Call& call, const std::string& buffer = "");

// --- Records that a session sends to its component ---

using Words = std::vector<OMX_U32>;

constexpr OMX_U32 kVersion = 0x00000101;  // 1.1.0.0

inline Words words(const std::vector<uint8_t>& bytes) {
  Words result(bytes.size() / sizeof(OMX_U32));
  if (!result.empty()) std::memcpy(result.data(), bytes.data(), result.size() * sizeof(OMX_U32));
  return result;
}

// What has to be written after `read`: its record with some fields changed, everything else, padding too,
// as the component had it.
template <typename Record>
std::vector<uint8_t> edited(const Call& read, const std::function<void(Record&)>& edit) {
  std::vector<uint8_t> bytes = read.record;
  bytes.resize(sizeof(Record));
  Record record;
  std::memcpy(&record, bytes.data(), sizeof(record));
  edit(record);
  std::memcpy(bytes.data(), &record, sizeof(record));
  return bytes;
}

// A record of `size` bytes for `port` with another value in every word, to tell what a client leaves alone.
template <size_t size>
std::array<OMX_U32, size / sizeof(OMX_U32)> patternRecord(OMX_U32 port) {
  std::array<OMX_U32, size / sizeof(OMX_U32)> result;
  for (size_t i = 0; i < result.size(); ++i) result[i] = 0x0A0B0C00 + static_cast<OMX_U32>(i);
  result[2] = port;
  return result;
}

// --- Sessions ---

// Settings with a value of its own in every field that is read.
webrtc::VideoCodec settings();

class SessionTest : public ::testing::Test {
 protected:
  static constexpr size_t kInputs = 4;   // buffers of the scripted components
  static constexpr size_t kOutputs = 6;  // of the encoder

  explicit SessionTest(const char* device = "msm8960") : _server(device) {}
  ~SessionTest() override;

  // A session in place of the former one, with the application registered; Create()'s result. An encoder's
  // calls and log lines are the first ones.
  int createEncoder(webrtc::VideoCodec codec = settings());
  int createDecoder();
  // An encoder in Executing.
  void start();
  OmxInterfaceEncoder& encoder() { return static_cast<OmxInterfaceEncoder&>(*_session); }
  OmxInterfaceDecoder& decoder() { return static_cast<OmxInterfaceDecoder&>(*_session); }
  Later beginInit() {
    return {"init()", [session = _session.get()] { return session->init(); }};
  }
  int init() { return beginInit().result(); }
  Later beginDeInit() {
    return {"deInit()", [session = _session.get()] { return session->deInit(); }};
  }
  int deInit() { return beginDeInit().result(); }
  Later beginEndOfInput(int timestamp = 0) {
    return {"sendEndOfInputFlag()",
            [session = _session.get(), timestamp] { return session->sendEndOfInputFlag(timestamp); }};
  }
  // Sends the end mark and waits until it has come out and been delivered.
  void endOfStream(int timestamp = 0);
  // Destroys the session, from another thread. The pointer stays readable for calls in progress.
  Later beginDestroy();
  void destroy() { beginDestroy().result(); }
  Gate& newGate() { return _gates.emplace_back(); }  // lives as long as the session

  int feed(const std::string& text, int timestamp = 0);
  // Feeds and waits for the output.
  void feedThrough(const std::string& text, int timestamp = 0);
  // The component makes an output of its own accord.
  void componentProduces(const std::string& text, OMX_TICKS timestamp = 0, OMX_U32 flags = 0) {
    script().produce(Packet(text, timestamp, flags));
  }
  // A message of the test's making reaches the session, and has been dealt with.
  void deliver(const android::omx_message& message) { messages().forge(_session->_node, message); }
  void deliverEvent(OMX_EVENTTYPE event, OMX_U32 data1, OMX_U32 data2) {
    deliver(makeEvent(event, data1, data2));
  }
  Script& script() { return _decoding ? _server.decoder() : _server.encoder(); }
  RecordingOmx& omx() { return _server.omx(); }
  MessageTap& messages() { return _server.messages(); }
  void* bufferId(int port, size_t index) const { return _session->_portBuffers[port][index].bufferId; }
  BufferInfo* outputRecord(size_t index) { return &_session->_portBuffers[1].editItemAt(index); }
  size_t busyCount(int port) const;
  // The calls as text, buffers by their place: "fillBuffer out0"; without the first `from` of them.
  Trace trace(size_t from = 0);
  // Calls that read and write settings, in order.
  std::vector<Call> settingCalls();
  // Nobody has to look at what the semaphore is posted for any more.
  static bool isIdle(sem_t& semaphore) {
    int value = -1;
    return sem_getvalue(&semaphore, &value) == 0 && value == 0;
  }
  LogLines log() const { return logLines(_log); }
  // Wait until the condition holds, which is tested with the session's lock held.
  template <typename Condition>
  static void requireUnderLock(SessionState& state, Condition condition, const char* what) {
    const auto holds = [&] {
      const SessionState::Lock held(state.lock);
      return condition(state);
    };
    requireEventually(holds, what);
  }
  template <typename Condition>
  void requireUnderLock(Condition condition, const char* what) {
    requireUnderLock(*_session->_state, condition, what);
  }
  // ... that many threads sleep in the session's wait for ...
  void waitForSleeper(int SessionState::*waiters, int count = 1) {
    requireUnderLock([=](SessionState& state) { return state.*waiters == count; }, "a thread that waits");
  }
  void waitForOutputThreadToEnd() {
    requireUnderLock([](SessionState& state) { return !state.outputThread.running; }, "the thread's end");
  }
  void waitForBusy(int port, size_t count) {
    requireEventually([&] { return busyCount(port) == count; }, "buffers to be where they should");
  }
  void waitForFills(size_t count) {
    require(omx().waitForCalls(Method::FillBuffer, count), "a buffer given to the component");
  }

  std::deque<Gate> _gates;
  omxhost::LogCapture _log;
  ScriptedMediaServer _server;
  Application _application;
  bool _decoding = false;
  std::unique_ptr<OmxInterface> _session;
};

}  // namespace omxtest
