#include "tests/support/script.h"

#include <algorithm>
#include <cstring>
#include <utility>

#include "tests/support/script_state.h"

namespace omxtest {

using mediaserver::kInputPort;
using mediaserver::kOutputPort;
using mediaserver::PortDefinition;

namespace {

constexpr OMX_U32 kWidth = 176;
constexpr OMX_U32 kHeight = 144;
constexpr OMX_U32 kCompressedBytes = 65536;
constexpr auto kTiPackedSemiPlanar = static_cast<OMX_COLOR_FORMATTYPE>(0x7F000100);
constexpr auto kMetaDataIndex = static_cast<OMX_INDEXTYPE>(0x7F000F01);

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

Script::Script(Kind kind) : _state(std::make_shared<State>(kind)) {
  const bool decoder = kind == Kind::Decoder;
  _state->ports = {defaultPort(decoder, 4), defaultPort(!decoder, decoder ? 8 : 6)};
  std::vector<mediaserver::VideoFormat> compressed{{OMX_VIDEO_CodingAVC, OMX_COLOR_FormatUnused}};
  if (decoder) {
    for (const OMX_VIDEO_CODINGTYPE coding :
         {OMX_VIDEO_CodingMPEG4, OMX_VIDEO_CodingH263, OMX_VIDEO_CodingWMV}) {
      compressed.push_back({coding, OMX_COLOR_FormatUnused});
    }
  }
  _state->formats[decoder ? kInputPort : kOutputPort] = std::move(compressed);
  _state->formats[decoder ? kOutputPort : kInputPort] = {
      {OMX_VIDEO_CodingUnused, OMX_COLOR_FormatYUV420SemiPlanar},
      {OMX_VIDEO_CodingUnused, kTiPackedSemiPlanar}};
  _state->extensions = {{"OMX.google.android.index.storeMetaDataInBuffers", kMetaDataIndex}};
}

Script::~Script() = default;

mediaserver::Component Script::component(const std::string& name) {
  const char* const role = _state->kind == Kind::Decoder ? "video_decoder.avc" : "video_encoder.avc";
  return {name, {role}, [state = _state](mediaserver::CodecHost& host) {
            return std::make_unique<ScriptedCodec>(state, host);
          }};
}

void Script::editPort(OMX_U32 port, const std::function<void(PortDefinition&)>& edit) {
  std::lock_guard<std::mutex> lock(_state->mutex);
  edit(_state->ports.at(port));
}

void Script::setFormats(OMX_U32 port, std::vector<mediaserver::VideoFormat> formats) {
  std::lock_guard<std::mutex> lock(_state->mutex);
  _state->formats.at(port) = std::move(formats);
}

void Script::setExtensions(std::vector<mediaserver::Extension> extensions) {
  std::lock_guard<std::mutex> lock(_state->mutex);
  _state->extensions = std::move(extensions);
}

void Script::refuse(Access access, OMX_INDEXTYPE index, OMX_ERRORTYPE error, std::optional<OMX_U32> port) {
  std::lock_guard<std::mutex> lock(_state->mutex);
  _state->refused[{access, index}] = {error, port};
}

void Script::accept(Access access, OMX_INDEXTYPE index) {
  std::lock_guard<std::mutex> lock(_state->mutex);
  _state->refused.erase({access, index});
  _state->accepted.insert({access, index});
}

void Script::answerBytes(OMX_INDEXTYPE index, const void* record, size_t size) {
  const auto* const bytes = static_cast<const uint8_t*>(record);
  std::lock_guard<std::mutex> lock(_state->mutex);
  _state->answers[index].assign(bytes, bytes + size);
}

bool Script::copyWritten(OMX_INDEXTYPE index, void* record, size_t size) const {
  std::lock_guard<std::mutex> lock(_state->mutex);
  const auto entry = _state->records.find(index);
  if (entry == _state->records.end() || entry->second.size() < size) return false;
  std::memcpy(record, entry->second.data(), size);
  return true;
}

void Script::failStart(OMX_ERRORTYPE error) {
  std::lock_guard<std::mutex> lock(_state->mutex);
  _state->startFailure = error;
}

void Script::holdInput() {
  std::lock_guard<std::mutex> lock(_state->mutex);
  _state->inputBudget = 0;
}

void Script::releaseInput(size_t count) {
  std::lock_guard<std::mutex> lock(_state->mutex);
  if (_state->inputBudget.has_value()) *_state->inputBudget += count;
  wakeAll();
}

void Script::passInput() {
  std::lock_guard<std::mutex> lock(_state->mutex);
  _state->inputBudget.reset();
  wakeAll();
}

void Script::holdOutput() {
  std::lock_guard<std::mutex> lock(_state->mutex);
  _state->outputBudget = 0;
}

void Script::releaseOutput(size_t count) {
  std::lock_guard<std::mutex> lock(_state->mutex);
  if (_state->outputBudget.has_value()) *_state->outputBudget += count;
  wakeAll();
}

void Script::passOutput() {
  std::lock_guard<std::mutex> lock(_state->mutex);
  _state->outputBudget.reset();
  wakeAll();
}

void Script::onInput(std::function<std::vector<Packet>(const Packet&)> transform) {
  std::lock_guard<std::mutex> lock(_state->mutex);
  _state->transform = std::move(transform);
}

void Script::produce(const Packet& output) {
  std::lock_guard<std::mutex> lock(_state->mutex);
  for (ScriptedCodec* codec : _state->codecs) codec->_line.emplace_back(output);
  wakeAll();
}

void Script::setDepth(size_t outputs) {
  std::lock_guard<std::mutex> lock(_state->mutex);
  _state->depth = outputs;
  wakeAll();
}

void Script::setDelay(std::chrono::milliseconds delay) {
  std::lock_guard<std::mutex> lock(_state->mutex);
  _state->delay = delay;
  _state->changed.notify_all();
}

void Script::announce(const std::function<void(PortDefinition&)>& edit, OMX_U32 index) {
  std::lock_guard<std::mutex> lock(_state->mutex);
  for (ScriptedCodec* codec : _state->codecs) codec->_line.emplace_back(Announcement{edit, index});
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

void Script::raise(OMX_EVENTTYPE event, OMX_U32 data1, OMX_U32 data2) {
  std::lock_guard<std::mutex> lock(_state->mutex);
  for (ScriptedCodec* codec : _state->codecs) codec->_host.raise(event, data1, data2);
}

void Script::wakeAll() {
  for (ScriptedCodec* codec : _state->codecs) codec->_host.wake();
}

std::vector<Packet> Script::inputs() const {
  std::lock_guard<std::mutex> lock(_state->mutex);
  return {_state->inputs.begin(), _state->inputs.end()};
}

size_t Script::inputCount() const {
  std::lock_guard<std::mutex> lock(_state->mutex);
  return _state->inputCount;
}

bool Script::waitForInputs(size_t count, std::chrono::milliseconds limit) const {
  std::unique_lock<std::mutex> lock(_state->mutex);
  return _state->changed.wait_for(lock, limit, [&] { return _state->inputCount >= count; });
}

size_t Script::waiting() const {
  std::lock_guard<std::mutex> lock(_state->mutex);
  size_t sum = 0;
  for (const ScriptedCodec* codec : _state->codecs) sum += codec->_line.size();
  return sum;
}

std::optional<mediaserver::PortPair> Script::configured() const {
  std::lock_guard<std::mutex> lock(_state->mutex);
  return _state->configured;
}

size_t Script::liveCodecs() const {
  std::lock_guard<std::mutex> lock(_state->mutex);
  return _state->codecs.size();
}

size_t Script::starts() const {
  std::lock_guard<std::mutex> lock(_state->mutex);
  return _state->starts;
}

size_t Script::stops() const {
  std::lock_guard<std::mutex> lock(_state->mutex);
  return _state->stops;
}

size_t Script::flushes() const {
  std::lock_guard<std::mutex> lock(_state->mutex);
  return _state->flushes;
}

}  // namespace omxtest
