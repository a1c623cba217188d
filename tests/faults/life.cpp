#include "tests/faults/life.h"

#include <unistd.h>

#include <algorithm>
#include <filesystem>
#include <fstream>
#include <utility>

#include "omxbridge/omxbridge.h"
#include "tests/core/bounded.h"
#include "tests/core/session_fixture.h"
#include "tests/support/omx_client.h"

namespace omxtest {

namespace {

constexpr int kWidth = 176;
constexpr int kHeight = 144;

// No id of the server's: those are small numbers.
void* const kNobody = reinterpret_cast<void*>(uintptr_t{0xF0F0F0F0});

class Life {
 public:
  Life(ScriptedMediaServer& server, const Fault& fault, bool encoding)
      : _server(server), _fault(fault), _encoding(encoding) {
    server.omx().failWhere([this](const Call& call) { return refuses(call); });
    server.messages().setFilter([this](android::omx_message& message) { return fate(message); });
    hangReport() = [this] { fprintf(stderr, "%s\n", describe(_fault, _outcome.hit).c_str()); };
  }
  ~Life() { hangReport() = nullptr; }

  Outcome live() {
    if (take(Step::Create, [this] { return create(); }) && run()) {
      take(Step::Destroy,
           [session = std::exchange(_session, nullptr)] { return omx_interface_destroy(session); });
    }
    if (release(Kind::Late)) settle();
    const std::lock_guard<std::mutex> lock(_mutex);
    return _outcome;
  }

 private:
  // --- The fault

  Hit seen(const std::string& what) { return {_step, what, ++_alike[what]}; }
  bool refuses(const Call& call) {
    const std::lock_guard<std::mutex> lock(_mutex);
    const Hit hit = seen(describe(call));
    if (++_outcome.calls != _fault.number || _fault.kind != Kind::Refused) return false;
    _outcome.hit = hit;
    return true;
  }
  Fate fate(android::omx_message& message) {
    const std::lock_guard<std::mutex> lock(_mutex);
    const Hit hit = seen(describe(message));
    if (++_outcome.messages != _fault.number || _fault.kind == Kind::Refused) return Fate::Pass;
    _outcome.hit = hit;
    if (_fault.kind != Kind::Forged) return Fate::Hold;
    if (anyEvent()(message)) message.node = kNobody;
    if (emptyBufferDone()(message)) message.u.buffer_data.buffer = kNobody;
    if (fillBufferDone()(message)) message.u.extended_buffer_data.buffer = kNobody;
    return Fate::Pass;
  }
  // Lets the message go that such a fault has kept; false if there is none.
  bool release(Kind kind) { return _fault.kind == kind && _server.messages().release(); }
  void enter(Step step) {
    const std::lock_guard<std::mutex> lock(_mutex);
    if (_step != step) _alike.clear();
    _step = step;
  }

  // --- The life

  // False at a standstill before the end, when there is nothing left that was delayed up to then.
  bool ends(const std::function<bool()>& ended) {
    do {
      requireEventually([&] { return ended() || atStandstill(); }, "the end of all movement");
    } while (!ended() && release(Kind::Delayed));
    return ended();
  }
  void settle() {
    static_cast<void>(ends([] { return false; }));
  }
  // One call; false when the session is gone.
  bool take(Step step, const std::function<int()>& action) {
    enter(step);
    Later call(name(step), action);
    if (!ends([&] { return call.isDone(); })) help(step, call);
    int& result = _outcome.results[step];
    if (const int own = call.result(); result == 0) result = own;
    settle();
    return _session != nullptr;
  }
  // What the call waits for does not come: the session's destruction has to end it.
  void help(Step step, const Later& call) {
    require(_session != nullptr, "the end of a destruction");
    _outcome.stuck = step;
    enter(Step::Destroy);
    Later destruction("destruction", [session = std::exchange(_session, nullptr)] {
      return omx_interface_destroy(session);
    });
    require(ends([&] { return destruction.isDone() && call.isDone(); }), "the end of a destroyed session");
    _outcome.results[Step::Destroy] = destruction.result();
  }
  int create() {
    int result = -1;
    OmxVideoCodec codec = settings();
    _session = _encoding ? encoder_create(&result, &codec) : decoder_create(&result, nullptr);
    return result;
  }
  int configure() {
    omx_interface_register_input_callback(
        _session, [](void*, void*) { return 0; }, nullptr);
    omx_interface_register_output_callback(_session, onOutput, this);
    int failure = 0;  // the first one
    const auto note = [&failure](int result) {
      if (failure == 0) failure = result;
    };
    if (_encoding) {
      for (const CONFIGTYPE item :
           {CONFIG_BITRATE, CONFIG_FRAMERATE, CONFIG_INTRA_PERIOD, CONFIG_REQUEST_IFRAME, CONFIG_ROTATION}) {
        note(omx_interface_set_config(_session, item, 15));
      }
    } else {
      note(omx_decoder_set_input_compression_format(_session, 0));
      note(omx_decoder_set_input_packing_format(_session, 1));
      note(std::min(0, omx_interface_get_buffer_number(_session)));
    }
    return failure;
  }
  // False when the session is gone.
  bool run() {
    if (!take(Step::Configure, [this] { return configure(); })) return false;
    if (!take(Step::Init, [session = _session] { return omx_interface_init(session); })) return false;
    if (_outcome.results[Step::Init] != 0) return true;
    if (!feed(Step::Feed)) return false;
    if (!_encoding) {
      const auto announce = [this] { return _server.decoder().announce(2 * kWidth, 2 * kHeight), 0; };
      if (!take(Step::Reconfigure, announce) || !feed(Step::FeedMore)) return false;
    }
    // A failure ends the traffic.
    const auto end = [session = _session] { return omx_interface_send_end_of_input_flag(session, 9); };
    if (omx_interface_error(_session) == 0 && !take(Step::EndOfInput, end)) return false;
    return take(Step::DeInit, [session = _session] { return omx_interface_deinit(session); });
  }
  bool feed(Step step) {
    std::vector<unsigned char> frame(kWidth * kHeight * 3 / 2, 'x');
    for (size_t i = 0; i < kFrames && omx_interface_error(_session) == 0; ++i) {
      const auto send = [&, session = _session] {
        if (_encoding) return omx_send_data_frame_to_encoder(session, frame.data(), kWidth, kHeight, 1);
        return omx_interface_send_input_data(session, frame.data(), 100, 1);
      };
      if (!take(step, send)) return false;
    }
    return true;
  }
  static int onOutput(void* /*first*/, void* /*data*/, unsigned int length, void* /*bufferId*/, void* context,
                      unsigned int /*timestamp*/) {
    auto& self = *static_cast<Life*>(context);
    const std::lock_guard<std::mutex> lock(self._mutex);
    if (length > 0) ++self._outcome.pictures;
    return 0;
  }

  ScriptedMediaServer& _server;
  const Fault _fault;
  const bool _encoding;
  void* _session = nullptr;
  std::mutex _mutex;                     // guards what calls and messages note:
  Step _step = Step::Create;             // the present one
  std::map<std::string, size_t> _alike;  // how many of each in this step
  Outcome _outcome;                      // its results are the test's alone
};

// How often each of the other threads has been switched away from, by thread. Empty when one is running.
std::map<std::string, std::string> sleepers() {
  const std::string self = std::to_string(gettid());
  std::map<std::string, std::string> result{{self, ""}};  // never empty by itself
  std::error_code gone;                                   // a thread that ends meanwhile
  for (const auto& thread : std::filesystem::directory_iterator("/proc/self/task", gone)) {
    const std::string id = thread.path().filename();
    if (id == self) continue;
    std::ifstream status(thread.path() / "status");
    std::string& switches = result[id];
    for (std::string line; std::getline(status, line);) {
      if (line.starts_with("State:") && line.find("S (sleeping)") == line.npos) return {};
      if (line.find("ctxt_switches:") != line.npos) switches += line;
    }
    if (switches.empty()) return {};
  }
  return result;
}

}  // namespace

const char* name(Step step) {
  static constexpr const char* kNames[] = {"create",    "configure",    "init",   "feed",   "reconfigure",
                                           "feed more", "end of input", "deInit", "destroy"};
  return kNames[static_cast<size_t>(step)];
}

std::string describe(const Fault& fault, const std::optional<Hit>& hit) {
  static constexpr const char* kKinds[] = {"no", "refused", "delayed", "late", "forged"};
  const std::string text = std::string(kKinds[static_cast<size_t>(fault.kind)]) + " ";
  if (!hit.has_value()) return text + std::to_string(fault.number);
  return text + hit->what + " in " + name(hit->step) + ", the " + std::to_string(hit->nth) + ". of its like";
}

Outcome live(ScriptedMediaServer& server, const Fault& fault, bool encoding) {
  return Life(server, fault, encoding).live();
}

// Seen asleep twice, with no switch in between, a thread has slept all the time between the two looks at it.
// If that holds of each, all have slept at the moment between the two rounds.
bool atStandstill() {
  const auto before = sleepers();
  return !before.empty() && before == sleepers();
}

}  // namespace omxtest
