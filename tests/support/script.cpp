#include "tests/support/script.h"

#include <utility>

#include "tests/support/scripted_codec.h"

namespace omxtest {

using mediaserver::kInputPort;
using mediaserver::kOutputPort;
using mediaserver::PortDefinition;

namespace {

constexpr OMX_U32 kWidth = 176;
constexpr OMX_U32 kHeight = 144;
constexpr OMX_U32 kCompressedBytes = 65536;
constexpr auto kTiPackedSemiPlanar = static_cast<OMX_COLOR_FORMATTYPE>(0x7F000100);

OMX_U32 pictureBytes(OMX_U32 width, OMX_U32 height) {
  return width * height * 3 / 2;
}

PortDefinition defaultPort(bool compressed, OMX_U32 buffers) {
  PortDefinition port{};
  port.nBufferCountActual = buffers;
  port.nBufferCountMin = 1;
  port.nBufferSize = compressed ? kCompressedBytes : pictureBytes(kWidth, kHeight);
  port.nBufferAlignment = 1;
  auto& video = port.format.video;
  video.nFrameWidth = kWidth;
  video.nFrameHeight = kHeight;
  video.nStride = compressed ? 0 : static_cast<OMX_S32>(kWidth);
  video.nSliceHeight = compressed ? 0 : kHeight;
  video.xFramerate = 24u << 16;
  video.eCompressionFormat = compressed ? OMX_VIDEO_CodingAVC : OMX_VIDEO_CodingUnused;
  video.eColorFormat = compressed ? OMX_COLOR_FormatUnused : OMX_COLOR_FormatYUV420SemiPlanar;
  return port;
}

}  // namespace

Script::Script(Kind kind) : _kind(kind) {
  const bool decoder = kind == Kind::Decoder;
  _ports = {defaultPort(decoder, 4), defaultPort(!decoder, decoder ? 8 : 6)};
  auto& compressed = _formats[decoder ? kInputPort : kOutputPort];
  compressed = {{OMX_VIDEO_CodingAVC, OMX_COLOR_FormatUnused}};
  for (const auto coding : {OMX_VIDEO_CodingMPEG4, OMX_VIDEO_CodingH263, OMX_VIDEO_CodingWMV}) {
    if (decoder) compressed.push_back({coding, OMX_COLOR_FormatUnused});
  }
  _formats[decoder ? kOutputPort : kInputPort] = {{OMX_VIDEO_CodingUnused, OMX_COLOR_FormatYUV420SemiPlanar},
                                                  {OMX_VIDEO_CodingUnused, kTiPackedSemiPlanar}};
}

mediaserver::Component Script::component(const std::string& name) {
  const char* const role = _kind == Kind::Decoder ? "video_decoder.avc" : "video_encoder.avc";
  return {name, {role}, [this](mediaserver::CodecHost& host) {
            return std::make_unique<ScriptedCodec>(*this, host);
          }};
}

void Script::editPort(OMX_U32 port, const PortEdit& edit) {
  const Lock lock(_mutex);
  edit(_ports.at(port));
}

void Script::setFormats(OMX_U32 port, std::vector<mediaserver::VideoFormat> formats) {
  const Lock lock(_mutex);
  _formats.at(port) = std::move(formats);
}

void Script::separatePorts() {
  const Lock lock(_mutex);
  _portsAreSeparate = true;
}

void Script::refuse(Access access, OMX_INDEXTYPE index, OMX_ERRORTYPE error) {
  const Lock lock(_mutex);
  _refused[{access, index}] = error;
}

void Script::answerBytes(OMX_INDEXTYPE index, const void* record, size_t size) {
  const auto* const bytes = static_cast<const uint8_t*>(record);
  const Lock lock(_mutex);
  _answers[index].assign(bytes, bytes + size);
}

void Script::failStart(OMX_ERRORTYPE error) {
  const Lock lock(_mutex);
  _startFailure = error;
}

void Script::setInputBudget(std::optional<size_t> budget) {
  const Lock lock(_mutex);
  _inputBudget = budget;
  wakeAll();
}

void Script::setOutputHeld(bool held) {
  const Lock lock(_mutex);
  _outputHeld = held;
  wakeAll();
}

void Script::onInput(Transform transform) {
  const Lock lock(_mutex);
  _transform = std::move(transform);
}

void Script::produce(const Packet& output) {
  const Lock lock(_mutex);
  for (ScriptedCodec* codec : _codecs) codec->_line.emplace_back(output);
  wakeAll();
}

void Script::setDelay(std::chrono::milliseconds delay) {
  const Lock lock(_mutex);
  _delay = delay;
  _changed.notify_all();
}

void Script::announce(const PortEdit& edit, OMX_U32 index) {
  const Lock lock(_mutex);
  for (ScriptedCodec* codec : _codecs) codec->_line.emplace_back(Announcement{edit, index});
  wakeAll();
}

void Script::announce(OMX_U32 width, OMX_U32 height) {
  announce([=](PortDefinition& output) {
    output.nBufferSize = pictureBytes(width, height);
    output.format.video.nFrameWidth = width;
    output.format.video.nFrameHeight = height;
    output.format.video.nStride = static_cast<OMX_S32>(width);
    output.format.video.nSliceHeight = height;
  });
}

void Script::raiseError(OMX_ERRORTYPE error) {
  const Lock lock(_mutex);
  for (ScriptedCodec* codec : _codecs) codec->_host.raise(OMX_EventError, static_cast<OMX_U32>(error), 0);
}

void Script::wakeAll() {
  for (ScriptedCodec* codec : _codecs) codec->_host.wake();
}

std::vector<Packet> Script::inputs() const {
  const Lock lock(_mutex);
  return _inputs;
}

bool Script::waitForInputs(size_t count) const {
  Lock lock(_mutex);
  return _changed.wait_for(lock, kWaitLimit, [&] { return _inputs.size() >= count; });
}

size_t Script::waiting() const {
  const Lock lock(_mutex);
  size_t sum = 0;
  for (const ScriptedCodec* codec : _codecs) sum += codec->_line.size();
  return sum;
}

std::optional<mediaserver::PortPair> Script::configured() const {
  const Lock lock(_mutex);
  return _configured;
}

size_t Script::liveCodecs() const {
  const Lock lock(_mutex);
  return _codecs.size();
}

size_t Script::starts() const {
  const Lock lock(_mutex);
  return _starts;
}

size_t Script::stops() const {
  const Lock lock(_mutex);
  return _stops;
}

}  // namespace omxtest
