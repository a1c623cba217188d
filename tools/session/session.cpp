#include "tools/session/session.h"

#include <algorithm>
#include <cmath>

#include <omxhost/device.h>

#include "tools/base/text.h"

namespace tool {

namespace {

// A component that has kept input for so long without doing anything is not waited for.
constexpr std::chrono::seconds kStuck{10};

constexpr int kNoBuffer = -1;

constexpr const char* kNoMediaServer =
    "; is libomxmediaserver.so beside the other libraries, or OMXBRIDGE_MEDIASERVER set to where it is?";

webrtc::VideoCodec codecRecord(const EncoderSettings& settings) {
  webrtc::VideoCodec codec{};
  codec.codecType = webrtc::kVideoCodecH264;
  codec.width = static_cast<uint16_t>(settings.size.width);
  codec.height = static_cast<uint16_t>(settings.size.height);
  codec.maxFramerate = wholeFrameRate(settings.rate);
  const double kilobits = bitRateTarget(settings) / 1e3 * bitRateFactor(settings.rate);
  codec.startBitrate = static_cast<uint32_t>(std::clamp(std::round(kilobits), 1.0, 4e6));
  codec.codecSpecific.H264.profile = settings.profile;
  codec.codecSpecific.H264.keyFrameInterval = settings.keyInterval;
  codec.codecSpecific.H264.referenceFrames = settings.references;
  codec.codecSpecific.H264.entropyCoding = settings.arithmeticCoding ? 1 : 0;
  codec.codecSpecific.H264.transform8x8 = settings.largeTransform ? 1 : 0;
  return codec;
}

// A result code in words, without the line end that some have.
std::string description(int code) {
  std::string text = resultDescription(code);
  while (text.ends_with('\n')) text.pop_back();
  return text;
}

}  // namespace

uint32_t bitRateTarget(const EncoderSettings& settings) {
  return std::max(1U, (settings.bitRate + 500) / 1000) * 1000;
}

uint8_t wholeFrameRate(FrameRate rate) {
  return static_cast<uint8_t>(std::clamp(rate.perSecond() + 0.5, 1.0, 255.0));
}

double bitRateFactor(FrameRate rate) {
  return wholeFrameRate(rate) / rate.perSecond();
}

Session::Session(Kind kind, OutputHandler handler) : _kind(kind), _handler(std::move(handler)) {}

Session::~Session() {
  omx_interface_destroy(_handle);
}

Result<std::unique_ptr<Session>> Session::openEncoder(const EncoderSettings& settings,
                                                      StreamHandler handler) {
  std::unique_ptr<Session> session(new Session(
      Kind::Encoder,
      [handler = std::move(handler)](const void*, std::span<const uint8_t> data, uint32_t timestamp) {
        if (!data.empty()) handler(data, timestamp);
      }));
  webrtc::VideoCodec codec = codecRecord(settings);
  auto opened = connect(std::move(session), [&codec](int* code) { return encoder_create(code, &codec); });
  const char* const component = omxhost::posedDevice().encoderComponent;
  if (opened.ok() || component == nullptr || omx_component_is_available(component) == 0) return opened;
  // It is there, so it must be what was asked of it.
  Failure failure = opened.failure();
  failure.text += formatted("; asked for %dx%d, %.4g frames/s, %u kbit/s: try less", settings.size.width,
                            settings.size.height, settings.rate.perSecond(), codec.startBitrate);
  return failure;
}

Result<std::unique_ptr<Session>> Session::openDecoder(PictureHandler handler) {
  std::unique_ptr<Session> session(new Session(
      Kind::Decoder,
      [handler = std::move(handler)](const void* info, std::span<const uint8_t> data, uint32_t timestamp) {
        handler(*static_cast<const DECODEDDATAINFO*>(info), data, timestamp);
      }));
  return connect(std::move(session), [](int* code) { return decoder_create(code, nullptr); });
}

Result<std::unique_ptr<Session>> Session::connect(std::unique_ptr<Session> session,
                                                  const std::function<void*(int*)>& create) {
  const omxhost::Device& device = omxhost::posedDevice();
  const bool isEncoder = session->_kind == Kind::Encoder;
  if ((isEncoder ? device.encoderComponent : device.decoderComponent) == nullptr) {
    return Failure{
        ExitCode::Device,
        formatted("device %s has no H.264 %s; choose one that has (omxbridge devices) with --device",
                  device.name, session->kindName())};
  }
  int code = OMXI_OK;
  void* const handle = create(&code);
  if (handle == nullptr) {
    Failure failure = session->failure(ExitCode::Device, "cannot be created", code);
    if (code == OMXI_ERR_IOMX || code == OMXI_ERR_MEDIA_PLAYER_SERVICE) failure.text += kNoMediaServer;
    return failure;
  }
  session->_handle = handle;
  omx_interface_register_input_callback(handle, onInputReturned, session.get());
  omx_interface_register_output_callback(handle, onOutput, session.get());
  return session;
}

const char* Session::kindName() const {
  return _kind == Kind::Encoder ? "encoder" : "decoder";
}

Failure Session::failure(ExitCode code, const char* step, int result) const {
  return {code, formatted("the %s of device %s %s: %s (code %d)", kindName(), omxhost::posedDevice().name,
                          step, description(result).c_str(), result)};
}

Outcome Session::recordedFailure() const {
  const int error = omx_interface_error(_handle);
  if (error == OMXI_OK) return {};
  return failure(ExitCode::Failed, "has failed", error);
}

Outcome Session::start() {
  const int result = omx_interface_init(_handle);
  if (result == OMXI_OK) return {};
  return failure(ExitCode::Device, "cannot be started", result);
}

int Session::onInputReturned(void* /*session*/, void* context) {
  auto* const self = static_cast<Session*>(context);
  const std::lock_guard held(self->_mutex);
  ++self->_returned;
  self->_moved.notify_all();
  return 0;
}

int Session::onOutput(void* sessionOrInfo, void* data, unsigned int length, void* /*bufferId*/, void* context,
                      unsigned int timestamp) {
  auto* const self = static_cast<Session*>(context);
  self->_handler(sessionOrInfo, {static_cast<const uint8_t*>(data), length}, timestamp);
  const std::lock_guard held(self->_mutex);
  if (length > 0) ++self->_delivered;
  self->_moved.notify_all();
  return 0;
}

uint64_t Session::activity() const {
  const std::lock_guard held(_mutex);
  return _returned + _delivered;
}

// Waits until `ready`, which is asked with the mutex held. False: stopped, or out of time.
template <typename Ready>
bool Session::await(const std::stop_token& stop, std::optional<Clock::time_point> deadline, Ready ready) {
  std::unique_lock held(_mutex);
  return deadline ? _moved.wait_until(held, stop, *deadline, ready) : _moved.wait(held, stop, ready);
}

Result<std::optional<Session::InputBuffer>> Session::reserve(const std::stop_token& stop,
                                                             std::optional<Clock::time_point> deadline) {
  for (;;) {
    const uint64_t before = activity();
    void* buffer = nullptr;
    void* data = nullptr;
    const int result = omx_interface_reserve_input_buffer(_handle, &buffer, &data);
    if (result == 0) return std::optional(InputBuffer{buffer, static_cast<uint8_t*>(data)});
    if (auto failed = recordedFailure()) return *failed;
    if (result != kNoBuffer) return failure(ExitCode::Failed, "takes no more input", result);
    if (!await(stop, deadline, [&] { return _returned + _delivered != before; })) {
      return std::optional<InputBuffer>();
    }
  }
}

Outcome Session::send(const InputBuffer& buffer, size_t length, uint32_t timestamp) {
  const int result = omx_interface_send_input_buffer(_handle, buffer.handle, static_cast<int>(length),
                                                     static_cast<int>(timestamp));
  if (result != 0) return failure(ExitCode::Failed, "refused a picture", result);
  ++_sent;
  return {};
}

void Session::settle(const std::stop_token& stop) {
  await(stop, Clock::now() + kStuck, [this] { return _returned >= _sent; });
}

Outcome Session::change(CONFIGTYPE item, uint32_t value) {
  const int result = omx_interface_set_config(_handle, item, value);
  if (result != OMXI_OK) return failure(ExitCode::Device, "refused a change", result);
  return {};
}

Result<bool> Session::sendCopy(std::span<const uint8_t> bytes, uint32_t timestamp,
                               const std::stop_token& stop) {
  for (;;) {
    uint64_t returned = 0;
    {
      const std::lock_guard held(_mutex);
      returned = _returned;
    }
    // The library only reads what it is given.
    const int result =
        omx_interface_send_input_data(_handle, const_cast<uint8_t*>(bytes.data()),
                                      static_cast<unsigned int>(bytes.size()), static_cast<int>(timestamp));
    if (result == 0) {
      ++_sent;
      return true;
    }
    if (auto failed = recordedFailure()) return *failed;
    if (result != kNoBuffer) return failure(ExitCode::Failed, "refused a piece of the stream", result);
    // -1 with all buffers at home: it is the size that does not fit.
    if (returned >= _sent) {
      return Failure{
          ExitCode::Failed,
          formatted("a coded picture of %zu bytes is larger than the input buffers of the %s of device %s",
                    bytes.size(), kindName(), omxhost::posedDevice().name)};
    }
    if (!await(stop, std::nullopt, [&] { return _returned != returned; })) return false;
  }
}

void Session::awaitOutputs(uint64_t expected, Clock::duration patience) {
  std::unique_lock held(_mutex);
  for (bool moving = true; moving && _delivered < expected;) {
    const uint64_t before = _returned + _delivered;
    const Clock::duration limit = _returned >= _sent ? patience : Clock::duration(kStuck);
    moving = _moved.wait_for(held, limit, [&] { return _returned + _delivered != before; });
  }
}

Outcome Session::finish(uint64_t expectedOutputs, uint32_t timestamp, Clock::duration patience) {
  if (!recordedFailure()) {
    awaitOutputs(expectedOutputs, patience);
    const int ended = omx_interface_send_end_of_input_flag(_handle, static_cast<int>(timestamp));
    if (ended != 0 && !recordedFailure()) return failure(ExitCode::Failed, "refused the end of input", ended);
  }
  const int result = omx_interface_deinit(_handle);
  if (result != OMXI_OK) return failure(ExitCode::Failed, "has failed", result);
  return {};
}

}  // namespace tool
