// Several hundred sessions, encoders and decoders side by side, on random ways through their lives: fed from
// several threads, taken down or destroyed at any point, while the media server delays, repeats and forges
// messages and fails calls. Nothing may hang, leak or touch freed memory.
//
// Each run has another seed; OMXBRIDGE_STRESS_SEED repeats one (threads still meet as they like).
#include <stdlib.h>

#include <atomic>
#include <random>
#include <thread>

#include "omxbridge/omxbridge.h"
#include "tests/core/session_fixture.h"

namespace omxtest {
namespace {

constexpr unsigned kSessions = 400;  // of each kind

std::mutex g_drawing;
std::mt19937 g_engine;

// One of 0 to `count` - 1. Any thread.
unsigned draw(size_t count) {
  const std::lock_guard<std::mutex> lock(g_drawing);
  return static_cast<unsigned>(g_engine() % count);
}
bool chance(unsigned percent) {
  return draw(100) < percent;
}

// One session after the other, of one kind, on a thread of its own; and a second thread that sends the
// present one messages that are late, or that nobody sent.
class Lane {
 public:
  Lane(ScriptedMediaServer& server, bool encoding) : _server(server), _encoding(encoding) {}

  size_t outputs() const { return _outputs; }

  void run() {
    std::atomic<bool> over{false};
    std::thread forger([&] {
      while (!over) forge();
    });
    for (unsigned number = 0; number < kSessions; ++number) live();
    over = true;
    forger.join();
  }

  // A buffer has come into the world.
  void note(const Call& made) {
    const std::lock_guard<std::mutex> lock(_mutex);
    if (made.node == _node) _buffers.push_back(made.buffer);
  }

 private:
  void live() {
    Application application;
    application.leaveDataAlone();  // the component may still be writing what it is said to have given back
    application.onOutput([this](const Output&) { return useInCallback(); });
    application.onInput([this] { useInCallback(); });
    create();
    application.attach(*_session);
    OmxInterface* const session = _session;
    Later starting("init()", [=] { return session->init(); });
    awaitBegun(starting, [](const SessionState& state) {
      return state.outputThread.joinable || state.eventThread.joinable;
    });
    // It may never get there; some are given the time that a slow machine needs.
    const std::chrono::milliseconds limit(chance(25) ? 2000 : draw(20));
    if (eventually([&] { return starting.isDone(); }, limit)) {
      traffic(application);
    }
    // What destruction finds in progress.
    const unsigned way = draw(3);
    Later ending("a call at the end", [=] {
      return way == 0 ? session->deInit() : way == 1 ? session->sendEndOfInputFlag(0) : 0;
    });
    awaitBegun(ending, [=](const SessionState& state) {
      return state.endOfOutputWaiters > 0 || state.tearingDown || session->_endOfInputPending;
    });
    Later("destruction", [=] { return delete session, 0; }).result();
    starting.result();
    ending.result();
    _outputs += application.outputs().size();
  }

  void create() {
    webrtc::VideoCodec codec = settings();
    int result = -1;
    void* const handle = _encoding ? encoder_create(&result, &codec) : decoder_create(&result, nullptr);
    ASSERT_EQ(result, OMXI_OK);
    _session = static_cast<OmxInterface*>(handle);
    const std::lock_guard<std::mutex> lock(_mutex);
    _node = _session->_node;
    _buffers.assign(1, this);
  }

  // Until the call is under way: one that begins after the session's end is the application's fault.
  template <typename Begun>
  void awaitBegun(const Later& call, Begun begun) {
    const auto come = [&] {
      if (call.isDone()) return true;
      const SessionState::Lock held(_session->_state->lock);
      return begun(*_session->_state);
    };
    requireEventually(come, "the beginning of a call");
  }

  // One in eight feeds, or gives a buffer back: nobody is fed for ever.
  int useInCallback() {
    const unsigned number = draw(16);
    if (number == 0) static_cast<void>(_session->sendInputData(nullptr, 0, 0));
    if (number == 8) _session->returnIomxOutputBuffer(this);
    return number > 12 ? 1 : 0;
  }

  void traffic(const Application& application) {
    std::vector<std::thread> feeders;
    for (unsigned feeder = 0; feeder <= draw(3); ++feeder) {
      feeders.emplace_back([&] {
        for (unsigned input = draw(16); input > 0; --input) feed();
        for (const Output& output : application.outputs()) _session->returnIomxOutputBuffer(output.bufferId);
      });
    }
    Script& script = _encoding ? _server.encoder() : _server.decoder();
    if (!_encoding && chance(40)) script.announce(16 * (1 + draw(40)), 144);
    for (unsigned count = draw(16); count > 0; --count) script.produce(Packet("a picture"));
    if (chance(5)) script.raiseError(OMX_ErrorHardware);
    for (std::thread& feeder : feeders) feeder.join();
  }

  void feed() {
    void* handle = nullptr;
    void* data = nullptr;
    if (chance(50)) {
      static_cast<void>(_session->sendInputData(nullptr, 0, 0));
    } else if (_session->reserveInputBuffer(&handle, &data) == 0) {
      if (chance(10)) _session->releaseInputBuffer(handle);
      static_cast<void>(_session->sendInputBuffer(handle, 0, 0));
    }
    if (chance(1)) _session->setThreadError(OMXI_ERR_APPLICATION);
  }

  void forge() {
    MessageTap& messages = _server.messages();
    if (messages.waitForHeld(1, std::chrono::milliseconds(1))) messages.release(draw(4));
    const std::lock_guard<std::mutex> lock(_mutex);
    if (_node == nullptr || !chance(10)) return;
    const OMX_U32 few = draw(5);
    void* const buffer = _buffers[draw(_buffers.size())];
    const android::omx_message forged[] = {makeEmptyBufferDone(buffer),
                                           makeFillBufferDone(buffer, few, few == 0 ? OMX_BUFFERFLAG_EOS : 0),
                                           makeEvent(OMX_EventCmdComplete, few, draw(4)),
                                           makeEvent(static_cast<OMX_EVENTTYPE>(draw(8)), few, few)};
    messages.forge(_node, forged[draw(chance(80) ? 2 : 4)]);
  }

  ScriptedMediaServer& _server;
  const bool _encoding;
  size_t _outputs = 0;
  OmxInterface* _session = nullptr;
  std::mutex _mutex;  // guards the two below
  void* _node = nullptr;
  std::vector<void*> _buffers;
};

TEST(StressTest, SessionsStandEveryOrderOfEvents) {
  const char* const again = getenv("OMXBRIDGE_STRESS_SEED");
  const unsigned seed = again != nullptr ? static_cast<unsigned>(atol(again)) : std::random_device()();
  printf("OMXBRIDGE_STRESS_SEED=%u\n", seed);
  fflush(stdout);
  const omxhost::LogCapture log;  // thousands of lines that nobody reads
  g_engine.seed(seed);
  ScriptedMediaServer server("msm8960");
  Lane lanes[] = {{server, true}, {server, false}};
  for (const Method method : {Method::UseBuffer, Method::AllocateBufferWithBackup}) {
    server.omx().after(method, [&](const Call& call) {
      for (Lane& lane : lanes) lane.note(call);
    });
  }
  server.messages().setFilter([&](const android::omx_message&) {
    return chance(5) ? Fate::Hold : chance(5) ? Fate::Repeat : Fate::Pass;
  });
  server.omx().failWhere([&](const Call& call) { return call.method >= Method::UseBuffer && chance(1); });
  std::thread encoders([&] { lanes[0].run(); });
  lanes[1].run();
  encoders.join();
  server.messages().passAll();
  for (const Lane& lane : lanes) EXPECT_GT(lane.outputs(), kSessions / 10);  // else it was no stress
}

}  // namespace
}  // namespace omxtest
