#include "tests/faults/life.h"

#include <algorithm>
#include <utility>
#include <vector>

#include "omxbridge/omxbridge.h"
#include "tests/core/bounded.h"
#include "tests/core/session_fixture.h"
#include "tests/faults/standstill.h"

namespace omxtest {

namespace {

constexpr int kWidth = 176;
constexpr int kHeight = 144;

}  // namespace

// False at a standstill before the end, when there is nothing left that was delayed up to then.
bool Life::ends(const std::function<bool()>& ended) {
  do {
    requireEventually([&] { return ended() || atStandstill(); }, "the end of all movement");
  } while (!ended() && _injector.release(Kind::Delayed));
  return ended();
}

void Life::settle() {
  static_cast<void>(ends([] { return false; }));
}

bool Life::take(Step step, const std::function<int()>& call) {
  _injector.enter(step);
  _owner.start(call);
  if (!ends([this] { return _owner.isDone(); })) help(step);
  int& result = _outcome.results[step];
  if (result == 0) result = _owner.result();
  settle();
  return _session != nullptr;
}

// What the owner waits for does not come. It gets what was kept from it; or the session is destroyed.
void Life::help(Step step) {
  const bool again = std::exchange(_outcome.stuck, step).has_value();
  if (_injector.release(Kind::Withheld)) {
    if (ends([this] { return _owner.isDone(); })) return;
  }
  if (again || _session == nullptr) _outcome.hang = name(step);
  _injector.enter(Step::Destroy);
  void* const session = std::exchange(_session, nullptr);
  _other.start([session] { return omx_interface_destroy(session); });
  require(ends([this] { return _other.isDone() && _owner.isDone(); }), "the end of a destroyed session");
  _outcome.results[Step::Destroy] = _other.result();
}

Outcome Life::live() {
  if (create() && run()) {
    take(Step::Destroy,
         [session = std::exchange(_session, nullptr)] { return omx_interface_destroy(session); });
  }
  if (_injector.release(Kind::Late)) settle();
  _outcome.pictures = _pictures;
  return _outcome;
}

bool Life::create() {
  return take(Step::Create, [this] {
    int result = -1;
    OmxVideoCodec codec = settings();
    _session = _encoding ? encoder_create(&result, &codec) : decoder_create(&result, nullptr);
    return result;
  });
}

int Life::configure() {
  omx_interface_register_input_callback(_session, onInput, this);
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
bool Life::run() {
  if (!take(Step::Configure, [this] { return configure(); })) return false;
  if (!take(Step::Init, [session = _session] { return omx_interface_init(session); })) return false;
  if (_outcome.results[Step::Init] != 0) return true;
  if (!feed(Step::Feed)) return false;
  if (!_encoding) {
    const auto announce = [this] {
      _server.decoder().announce(2 * kWidth, 2 * kHeight);
      return 0;
    };
    if (!take(Step::Reconfigure, announce) || !feed(Step::FeedMore)) return false;
  }
  // A failure ends the traffic.
  const auto end = [session = _session] { return omx_interface_send_end_of_input_flag(session, 9); };
  if (omx_interface_error(_session) == 0 && !take(Step::EndOfInput, end)) return false;
  return take(Step::DeInit, [session = _session] { return omx_interface_deinit(session); });
}

bool Life::feed(Step step) {
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

int Life::onOutput(void* /*first*/, void* /*data*/, unsigned int length, void* /*bufferId*/, void* context,
                   unsigned int /*timestamp*/) {
  auto& self = *static_cast<Life*>(context);
  if (length > 0) ++self._pictures;
  self._injector.awaitRepeat();
  return 0;
}

}  // namespace omxtest
