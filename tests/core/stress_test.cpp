// Several hundred sessions, encoders and decoders side by side, on random ways through their lives: fed from
// several threads, ended, failed, taken down or destroyed at any point. The media server delays messages; to
// every other session it also repeats, forges and loses calls. Nothing may hang, leak or touch freed memory,
// and a session that is treated honestly must deliver everything and end well.
//
// Each run has another seed; OMXBRIDGE_STRESS_SEED repeats one (threads still meet as they like), and
// OMXBRIDGE_STRESS_SESSIONS sets the number of sessions.
#include <stdlib.h>
#include <string.h>

#include <set>
#include <thread>

#include "decoder/omx_interface_decoder.h"
#include "tests/core/mischief.h"
#include "tests/core/session_fixture.h"

namespace omxtest::stress {
namespace {

unsigned setting(const char* name, unsigned otherwise) {
  const char* const text = getenv(name);
  return text != nullptr ? static_cast<unsigned>(strtoul(text, nullptr, 10)) : otherwise;
}

// One session after the other, of one kind, on a thread of its own.
class Lane {
 public:
  Lane(ScriptedMediaServer& server, Mischief& mischief, bool encoding, unsigned seed)
      : _server(server), _mischief(mischief), _encoding(encoding), _random(seed) {}

  void run(unsigned sessions) {
    for (unsigned number = 0; number < sessions; ++number) live(number);
  }

  size_t pictures() const { return _pictures; }
  unsigned streamsEnded() const { return _streamsEnded; }

 private:
  void live(unsigned number) {
    _number = number;
    _honest = number % 2 == 0;
    _fed.clear();
    _kept.clear();
    _application = std::make_unique<Application>();
    // What a component is said to have given back it may still be reading or writing.
    if (!_honest) _application->leaveDataAlone();
    _application->onOutput([this](const Output& output) { return take(output); });
    if (!_honest) _application->onInput([this] { useSessionInCallback(); });
    connect();
    if (_random.chance(50)) pester();
    Later<int> starting("init()", [session = _session] { return session->init(); });
    awaitBegun(starting, [](const SessionState& state) {
      return state.outputThread.joinable || state.eventThread.joinable;
    });
    if (_honest && _random.chance(90)) {
      EXPECT_EQ(starting.result(), OMXI_OK);
      return trafficAndEnd();
    }
    // A pestered session may never get there.
    pester();
    if (eventually([&] { return starting.isDone(); }, std::chrono::milliseconds(_random.draw(20)))) {
      trafficAndEnd();
    } else {
      destroy();
    }
    starting.result();
  }

  // Until the call is under way: one that begins after the session's end is the application's fault.
  template <typename Begun>
  void awaitBegun(const Later<int>& call, Begun begun) {
    requireEventually(
        [&] {
          if (call.isDone()) return true;
          const SessionState::Lock held(_session->_state->lock);
          return begun(*_session->_state);
        },
        "the beginning of a call");
  }

  void connect() {
    if (_encoding) {
      _session = new OmxInterface;
      _session->_isEncoder = true;
      ASSERT_EQ(_session->setupIOMXConnections(), OMXI_OK);
    } else {
      OmxInterfaceDecoder* decoder = nullptr;
      ASSERT_EQ(OmxInterfaceDecoder::Create(&decoder, nullptr), OMXI_OK);
      _session = decoder;
    }
    _node = _session->_node;
    _application->attach(*_session);
  }

  void pester() {
    if (_honest) return;
    std::vector<void*> buffers;
    {
      const SessionState::Lock held(_session->_state->lock);
      for (const auto& port : _session->_portBuffers) {
        for (const BufferInfo& record : port) buffers.push_back(record.bufferId);
      }
    }
    _mischief.pester(_node, std::move(buffers));
  }

  Script& script() { return _encoding ? _server.encoder() : _server.decoder(); }

  // Applications feed from their callbacks, and give buffers back there. One in eight does: nobody is fed
  // for ever.
  void useSessionInCallback() {
    const unsigned draw = _random.draw(16);
    if (draw == 0) static_cast<void>(_session->sendInputData(nullptr, 0, 0));
    if (draw == 8) _session->returnIomxOutputBuffer(this);
  }

  int take(const Output& output) {
    if (!_honest) useSessionInCallback();
    // A decoder lets nobody keep a buffer; who gives one back all the same is out of step.
    if (output.bufferId == nullptr || _random.chance(75) || (_honest && !_encoding)) return 0;
    const std::lock_guard<std::mutex> lock(_mutex);
    _kept.push_back(output.bufferId);
    return 1;
  }

  void giveKeptBack() {
    std::vector<void*> kept;
    {
      const std::lock_guard<std::mutex> lock(_mutex);
      kept.swap(_kept);
    }
    for (void* id : kept) _session->returnIomxOutputBuffer(id);
  }

  void trafficAndEnd() {
    pester();
    std::vector<std::thread> feeders;
    for (unsigned feeder = 0; feeder <= _random.draw(3); ++feeder) {
      feeders.emplace_back([this, feeder] { feed(feeder); });
    }
    if (!_encoding && _random.chance(40)) script().announce(16 * (1 + _random.draw(40)), 144);
    if (!_honest && _random.chance(10)) script().raiseError(OMX_ErrorHardware);
    for (std::thread& feeder : feeders) feeder.join();
    end();
  }

  void feed(unsigned feeder) {
    const unsigned inputs = _random.draw(12);
    for (unsigned input = 0; input < inputs; ++input) {
      std::string text = std::to_string(_number) + "." + std::to_string(feeder) + "." + std::to_string(input);
      if (!_honest) text.clear();
      int result = -1;
      do {  // until a buffer is free
        result = send(text);
        giveKeptBack();
      } while (_honest && result == -1);
      EXPECT_TRUE(!_honest || result == 0) << result;
      if (!_honest && _random.chance(2)) _session->setThreadError(OMXI_ERR_APPLICATION);
      const std::lock_guard<std::mutex> lock(_mutex);
      if (_honest) _fed.insert(text);
    }
  }

  int send(std::string& text) {
    const auto length = static_cast<unsigned int>(text.size());
    if (_random.chance(50)) return _session->sendInputData(text.data(), length, 0);
    void* handle = nullptr;
    void* data = nullptr;
    const int result = _session->reserveInputBuffer(&handle, &data);
    if (result != 0) return result;
    if (_random.chance(10)) {
      _session->releaseInputBuffer(handle);
      return -1;
    }
    if (length > 0) memcpy(data, text.data(), length);
    return _session->sendInputBuffer(handle, static_cast<int>(length), 0);
  }

  void end() {
    switch (_random.draw(7)) {
      case 0:
      case 1:
      case 2:
        return endStream();
      case 3:
        return fail();
      case 4:
        return destroyDuring(
            "deInit()", [session = _session] { return session->deInit(); },
            [](const SessionState& state) { return state.endOfOutputWaiters > 0 || state.tearingDown; });
      case 5:
        script().holdInput();
        destroyDuring(
            "sendEndOfInputFlag()", [session = _session] { return session->sendEndOfInputFlag(0); },
            [this](const SessionState&) -> bool { return _session->_endOfInputPending; });
        return script().passInput();
      default:
        return destroy();
    }
  }

  // The application's proper way out: everything comes back, and then the end.
  void endStream() {
    if (!_honest || _session->_omxState != OMX_StateExecuting) return destroy();
    requireEventually(
        [this] {
          giveKeptBack();
          return _application->outputs().size() >= _fed.size() && _session->portBuffersHaveBeenReturned(0);
        },
        "the pictures in flight");
    giveKeptBack();
    EXPECT_EQ(await("sendEndOfInputFlag()", [this] { return _session->sendEndOfInputFlag(0); }), 0);
    EXPECT_EQ(await("deInit()", [this] { return _session->deInit(); }), OMXI_OK);
    std::multiset<std::string> delivered;
    for (const std::string& text : _application->outputTexts()) {
      if (!text.empty()) delivered.insert(text);
    }
    EXPECT_EQ(delivered, _fed);
    ++_streamsEnded;
    destroy();
  }

  static int await(const char* what, std::function<int()> call) {
    return Later<int>(what, std::move(call)).result();
  }

  void fail() {
    if (!_honest || _session->_omxState != OMX_StateExecuting) return destroy();
    _session->setThreadError(OMXI_ERR_APPLICATION);
    EXPECT_EQ(await("deInit()", [this] { return _session->deInit(); }), OMXI_ERR_APPLICATION);
    destroy();
  }

  template <typename Begun>
  void destroyDuring(const char* what, std::function<int()> call, Begun begun) {
    Later<int> later(what, std::move(call));
    awaitBegun(later, begun);
    destroy();
    later.result();
  }

  void destroy() {
    if (_random.chance(30)) _mischief.leaveAlone(_node);  // else to the last moment
    Later<bool>("destruction", [session = _session] {
      delete session;
      return true;
    }).result();
    _mischief.leaveAlone(_node);
    _pictures += _application->outputs().size();
  }

  ScriptedMediaServer& _server;
  Mischief& _mischief;
  const bool _encoding;
  Random _random;

  OmxInterface* _session = nullptr;
  void* _node = nullptr;
  std::unique_ptr<Application> _application;
  std::mutex _mutex;  // guards the two below
  std::vector<void*> _kept;
  std::multiset<std::string> _fed;

  size_t _pictures = 0;
  unsigned _streamsEnded = 0;

  unsigned _number = 0;
  bool _honest = true;
};

TEST(StressTest, SessionsStandEveryOrderOfEvents) {
  const unsigned seed = setting("OMXBRIDGE_STRESS_SEED", std::random_device()());
  const unsigned sessions = setting("OMXBRIDGE_STRESS_SESSIONS", 1000);
  printf("OMXBRIDGE_STRESS_SEED=%u\n", seed);
  fflush(stdout);
  const omxhost::LogCapture log;  // thousands of lines that nobody reads
  ScriptedMediaServer server("msm8960");
  {
    Mischief mischief(server, seed);
    Lane encoders(server, mischief, true, seed + 1);
    Lane decoders(server, mischief, false, seed + 2);
    std::thread encoderThread([&] { encoders.run(sessions / 2); });
    decoders.run(sessions / 2);
    encoderThread.join();
    // Else it was no stress.
    for (const Lane* lane : {&encoders, &decoders}) {
      printf("%zu pictures, %u streams to their end\n", lane->pictures(), lane->streamsEnded());
      EXPECT_GT(lane->pictures(), sessions);
      EXPECT_GT(lane->streamsEnded(), sessions / 20);
    }
  }
  EXPECT_EQ(server.leaks(), "");
}

}  // namespace
}  // namespace omxtest::stress
