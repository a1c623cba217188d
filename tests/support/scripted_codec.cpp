#include <algorithm>
#include <cstring>
#include <utility>

#include "tests/support/script_state.h"

namespace omxtest {

using mediaserver::InputView;
using mediaserver::kInputPort;
using mediaserver::kOutputPort;
using mediaserver::OutputSpace;
using mediaserver::PortDefinition;
using mediaserver::PortPair;
using mediaserver::Received;
using mediaserver::Sent;

namespace {

constexpr size_t kHeaderBytes = 2 * sizeof(OMX_U32);
constexpr size_t kInputsKept = 1024;

enum class Use { Parameter, Config };

struct KnownIndex {
  Use use;
  uint32_t index;
  size_t size;  // of its record, bytes
};

// What a component understands whose clients are our wrappers; port records are the node's.
constexpr KnownIndex kKnown[] = {
    {Use::Parameter, OMX_IndexParamVideoBitrate, sizeof(OMX_VIDEO_PARAM_BITRATETYPE)},
    {Use::Parameter, OMX_IndexParamVideoAvc, sizeof(OMX_VIDEO_PARAM_AVCTYPE)},
    {Use::Parameter, OMX_IndexParamVideoProfileLevelCurrent, sizeof(OMX_VIDEO_PARAM_PROFILELEVELTYPE)},
    {Use::Parameter, 0x7F000002, 24},  // input packing
    {Use::Parameter, 0x7F000010, 16},  // picture order
    {Use::Config, OMX_IndexConfigVideoBitrate, sizeof(OMX_VIDEO_CONFIG_BITRATETYPE)},
    {Use::Config, OMX_IndexConfigVideoFramerate, sizeof(OMX_CONFIG_FRAMERATETYPE)},
    {Use::Config, OMX_IndexConfigVideoIntraVOPRefresh, sizeof(OMX_CONFIG_INTRAREFRESHVOPTYPE)},
    {Use::Config, OMX_IndexConfigVideoAVCIntraPeriod, sizeof(OMX_VIDEO_CONFIG_AVCINTRAPERIOD)},
    {Use::Config, OMX_IndexConfigCommonRotate, sizeof(OMX_CONFIG_ROTATIONTYPE)},
    {Use::Config, OMX_IndexConfigCommonOutputCrop, sizeof(OMX_CONFIG_RECTTYPE)},
    {Use::Config, 0x7F000007, 24},  // intra period
};

const KnownIndex* known(Access access, OMX_INDEXTYPE index) {
  const Use use =
      access == Access::GetParameter || access == Access::SetParameter ? Use::Parameter : Use::Config;
  const auto* const found = std::find_if(std::begin(kKnown), std::end(kKnown), [&](const KnownIndex& entry) {
    return entry.use == use && entry.index == static_cast<uint32_t>(index);
  });
  return found == std::end(kKnown) ? nullptr : found;
}

OMX_U32 wordAt(const void* record, size_t size, size_t offset) {
  OMX_U32 word = 0xFFFFFFFF;
  if (size >= offset + sizeof(word))
    std::memcpy(&word, static_cast<const uint8_t*>(record) + offset, sizeof(word));
  return word;
}

// A picture's size decides the size of buffers that hold one.
void fitPicture(PortDefinition* port) {
  auto& video = port->format.video;
  if (video.eCompressionFormat != OMX_VIDEO_CodingUnused) return;
  const OMX_U32 stride = std::max(video.nFrameWidth, static_cast<OMX_U32>(std::max(video.nStride, 0)));
  video.nStride = static_cast<OMX_S32>(stride);
  video.nSliceHeight = std::max(video.nSliceHeight, video.nFrameHeight);
  port->nBufferSize = std::max(port->nBufferSize, stride * video.nSliceHeight * 3 / 2);
}

void takeOne(Budget* budget) {
  if (budget->has_value()) --**budget;
}

}  // namespace

ScriptedCodec::ScriptedCodec(std::shared_ptr<State> state, mediaserver::CodecHost& host)
    : _state(std::move(state)), _host(host) {
  std::lock_guard<std::mutex> lock(_state->mutex);
  _state->codecs.insert(this);
}

ScriptedCodec::~ScriptedCodec() {
  std::lock_guard<std::mutex> lock(_state->mutex);
  _state->codecs.erase(this);
}

PortPair ScriptedCodec::ports() const {
  std::lock_guard<std::mutex> lock(_state->mutex);
  return _state->ports;
}

std::vector<mediaserver::VideoFormat> ScriptedCodec::formats(OMX_U32 port) const {
  std::lock_guard<std::mutex> lock(_state->mutex);
  return _state->formats.at(port);
}

std::vector<mediaserver::Extension> ScriptedCodec::extensions() const {
  std::lock_guard<std::mutex> lock(_state->mutex);
  return _state->extensions;
}

OMX_ERRORTYPE ScriptedCodec::definePort(OMX_U32 port, const PortDefinition& wanted, PortPair& ports) {
  const auto& before = ports[port].format.video;
  const auto& after = wanted.format.video;
  const bool resized = before.nFrameWidth != after.nFrameWidth || before.nFrameHeight != after.nFrameHeight;
  ports[port] = wanted;
  if (resized && port == kInputPort) {
    auto& output = ports[kOutputPort].format.video;
    output.nFrameWidth = after.nFrameWidth;
    output.nFrameHeight = after.nFrameHeight;
    fitPicture(&ports[kOutputPort]);
  }
  fitPicture(&ports[port]);
  return OMX_ErrorNone;
}

mediaserver::Codec::Answer ScriptedCodec::refusal(Access access, OMX_INDEXTYPE index, const void* record,
                                                  size_t size) const {
  const auto entry = _state->refused.find({access, index});
  if (entry == _state->refused.end()) return {};
  const std::optional<OMX_U32> port = entry->second.port;
  if (port.has_value() && *port != wordAt(record, size, kHeaderBytes)) return {};
  return entry->second.error;
}

mediaserver::Codec::Answer ScriptedCodec::get(Access access, OMX_INDEXTYPE index, void* record,
                                              size_t size) const {
  std::lock_guard<std::mutex> lock(_state->mutex);
  if (const Answer refused = refusal(access, index, record, size)) return refused;
  const std::vector<uint8_t>* source = nullptr;
  const auto answer = _state->answers.find(index);
  if (answer != _state->answers.end()) {
    const bool otherPort = index == OMX_IndexParamPortDefinition &&
                           wordAt(answer->second.data(), answer->second.size(), kHeaderBytes) !=
                               wordAt(record, size, kHeaderBytes);
    if (!otherPort) source = &answer->second;
  }
  const KnownIndex* const entry = known(access, index);
  if (source == nullptr && entry == nullptr && !_state->accepted.contains({access, index})) return {};
  if (entry != nullptr && size < entry->size) return OMX_ErrorBadParameter;
  if (source == nullptr) {
    const auto written = _state->records.find(index);
    if (written != _state->records.end()) source = &written->second;
  }
  auto* const bytes = static_cast<uint8_t*>(record);
  // Unanswered and unwritten: zeros behind the port, which is the client's.
  const size_t from = source != nullptr ? kHeaderBytes : kHeaderBytes + sizeof(OMX_U32);
  for (size_t i = from; i < size; ++i) bytes[i] = source != nullptr && i < source->size() ? (*source)[i] : 0;
  return OMX_ErrorNone;
}

mediaserver::Codec::Answer ScriptedCodec::set(Access access, OMX_INDEXTYPE index, const void* record,
                                              size_t size) {
  std::lock_guard<std::mutex> lock(_state->mutex);
  if (const Answer refused = refusal(access, index, record, size)) return refused;
  const KnownIndex* const entry = known(access, index);
  const bool extension = std::any_of(_state->extensions.begin(), _state->extensions.end(),
                                     [&](const mediaserver::Extension& e) { return e.index == index; });
  if (entry != nullptr && size < entry->size) return OMX_ErrorBadParameter;
  if (extension && wordAt(record, size, kHeaderBytes + sizeof(OMX_U32)) != OMX_FALSE) {
    return OMX_ErrorUnsupportedSetting;
  }
  const auto* const bytes = static_cast<const uint8_t*>(record);
  _state->records[index].assign(bytes, bytes + size);
  if (entry == nullptr && !extension && !_state->accepted.contains({access, index})) return {};
  return OMX_ErrorNone;
}

mediaserver::Codec::Answer ScriptedCodec::getParameter(OMX_INDEXTYPE index, void* record, size_t size) {
  return get(Access::GetParameter, index, record, size);
}

mediaserver::Codec::Answer ScriptedCodec::setParameter(OMX_INDEXTYPE index, const void* record, size_t size) {
  return set(Access::SetParameter, index, record, size);
}

mediaserver::Codec::Answer ScriptedCodec::getConfig(OMX_INDEXTYPE index, void* record, size_t size) {
  return get(Access::GetConfig, index, record, size);
}

mediaserver::Codec::Answer ScriptedCodec::setConfig(OMX_INDEXTYPE index, const void* record, size_t size) {
  return set(Access::SetConfig, index, record, size);
}

void ScriptedCodec::configure(const PortPair& ports) {
  std::lock_guard<std::mutex> lock(_state->mutex);
  _state->configured = ports;
}

OMX_ERRORTYPE ScriptedCodec::start() {
  std::lock_guard<std::mutex> lock(_state->mutex);
  if (_state->startFailure != OMX_ErrorNone) return _state->startFailure;
  ++_state->starts;
  return OMX_ErrorNone;
}

void ScriptedCodec::stop() {
  std::lock_guard<std::mutex> lock(_state->mutex);
  ++_state->stops;
  _line.clear();
  _draining = false;
}

void ScriptedCodec::flush(OMX_U32 port) {
  std::lock_guard<std::mutex> lock(_state->mutex);
  ++_state->flushes;
  if (port == kInputPort) {
    _draining = false;
  } else {
    std::erase_if(_line, [](const Item& item) { return std::holds_alternative<Packet>(item); });
  }
}

void ScriptedCodec::takeTime(Lock& lock) {
  if (_state->delay.count() == 0) return;
  _state->changed.wait_for(lock, _state->delay, [this] { return _state->delay.count() == 0; });
}

Sent ScriptedCodec::send(const InputView& input) {
  Lock lock(_state->mutex);
  takeTime(lock);
  if (_state->inputBudget == Budget(0) || _line.size() >= _state->depth) return Sent::Busy;
  takeOne(&_state->inputBudget);
  Packet packet;
  packet.bytes.assign(input.data, input.data + input.length);
  packet.timestamp = input.timestamp;
  packet.flags = input.flags;
  _draining = false;
  std::vector<Packet> outputs;
  if (_state->transform) {
    const auto transform = _state->transform;
    lock.unlock();
    outputs = transform(packet);
    lock.lock();
  } else {
    outputs.push_back(packet);
  }
  for (Packet& output : outputs) _line.emplace_back(std::move(output));
  _state->inputs.push_back(std::move(packet));
  if (_state->inputs.size() > kInputsKept) _state->inputs.pop_front();
  ++_state->inputCount;
  _state->changed.notify_all();
  return Sent::Taken;
}

void ScriptedCodec::drain(OMX_TICKS) {
  std::lock_guard<std::mutex> lock(_state->mutex);
  _draining = true;
}

Received ScriptedCodec::receive(OutputSpace& output) {
  Lock lock(_state->mutex);
  if (_state->outputBudget == Budget(0)) return Received::Nothing;
  if (_line.empty()) return std::exchange(_draining, false) ? Received::Drained : Received::Nothing;
  takeTime(lock);
  if (_line.empty()) return Received::Nothing;
  if (std::holds_alternative<Announcement>(_line.front())) return Received::NewGeometry;
  const Packet packet = std::get<Packet>(std::move(_line.front()));
  _line.pop_front();
  takeOne(&_state->outputBudget);
  const size_t offset = std::min<size_t>(packet.offset, output.capacity);
  const size_t length = std::min(packet.bytes.size(), output.capacity - offset);
  if (length > 0) std::memcpy(output.data + offset, packet.bytes.data(), length);
  output.offset = packet.offset;
  output.length = packet.lengthToTell.value_or(static_cast<OMX_U32>(length));
  output.flags = packet.flags;
  output.timestamp = packet.timestamp;
  if ((packet.flags & OMX_BUFFERFLAG_EOS) != 0) _draining = false;
  return Received::Filled;
}

OMX_U32 ScriptedCodec::geometry(PortDefinition& output) {
  std::unique_lock<std::mutex> lock(_state->mutex);
  const Announcement announcement = std::get<Announcement>(std::move(_line.front()));
  _line.pop_front();
  lock.unlock();
  announcement.edit(output);
  return announcement.index;
}

}  // namespace omxtest
