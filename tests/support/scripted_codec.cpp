#include "tests/support/scripted_codec.h"

#include <algorithm>
#include <cstring>
#include <map>
#include <utility>

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
constexpr size_t kDepth = 16;  // outputs that it keeps before it takes no more inputs

// What a component understands whose clients are our wrappers, and the sizes of the records; port records
// are the node's.
const std::map<uint32_t, size_t> kParameters = {
    {OMX_IndexParamVideoBitrate, sizeof(OMX_VIDEO_PARAM_BITRATETYPE)},
    {OMX_IndexParamVideoAvc, sizeof(OMX_VIDEO_PARAM_AVCTYPE)},
    {OMX_IndexParamVideoProfileLevelCurrent, sizeof(OMX_VIDEO_PARAM_PROFILELEVELTYPE)},
    {0x7F000002, 24},  // input packing
    {0x7F000010, 16},  // picture order
    {kMetaData, 16},
};
const std::map<uint32_t, size_t> kConfigs = {
    {OMX_IndexConfigVideoBitrate, sizeof(OMX_VIDEO_CONFIG_BITRATETYPE)},
    {OMX_IndexConfigVideoFramerate, sizeof(OMX_CONFIG_FRAMERATETYPE)},
    {OMX_IndexConfigVideoIntraVOPRefresh, sizeof(OMX_CONFIG_INTRAREFRESHVOPTYPE)},
    {OMX_IndexConfigVideoAVCIntraPeriod, sizeof(OMX_VIDEO_CONFIG_AVCINTRAPERIOD)},
    {OMX_IndexConfigCommonRotate, sizeof(OMX_CONFIG_ROTATIONTYPE)},
    {OMX_IndexConfigCommonOutputCrop, sizeof(OMX_CONFIG_RECTTYPE)},
    {0x7F000007, 24},  // intra period
};

// The size of a known record; 0 for others.
size_t knownSize(Access access, OMX_INDEXTYPE index) {
  const bool parameter = access == Access::GetParameter || access == Access::SetParameter;
  const auto& known = parameter ? kParameters : kConfigs;
  const auto found = known.find(static_cast<uint32_t>(index));
  return found == known.end() ? 0 : found->second;
}

// The word behind the header, which names the port, or one further on.
OMX_U32 wordAt(const void* record, size_t size, size_t index) {
  OMX_U32 word = 0xFFFFFFFF;
  const size_t offset = kHeaderBytes + index * sizeof(word);
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

}  // namespace

ScriptedCodec::ScriptedCodec(Script& script, mediaserver::CodecHost& host) : _script(script), _host(host) {
  const Lock lock(_script._mutex);
  _script._codecs.insert(this);
}

ScriptedCodec::~ScriptedCodec() {
  const Lock lock(_script._mutex);
  _script._codecs.erase(this);
}

PortPair ScriptedCodec::ports() const {
  const Lock lock(_script._mutex);
  return _script._ports;
}

std::vector<mediaserver::VideoFormat> ScriptedCodec::formats(OMX_U32 port) const {
  const Lock lock(_script._mutex);
  return _script._formats.at(port);
}

OMX_ERRORTYPE ScriptedCodec::definePort(OMX_U32 port, const PortDefinition& wanted, PortPair& ports) {
  const Lock lock(_script._mutex);
  const auto& before = ports[port].format.video;
  const auto& after = wanted.format.video;
  const bool resized = before.nFrameWidth != after.nFrameWidth || before.nFrameHeight != after.nFrameHeight;
  ports[port] = wanted;
  if (resized && port == kInputPort && !_script._portsAreSeparate) {
    auto& output = ports[kOutputPort].format.video;
    output.nFrameWidth = after.nFrameWidth;
    output.nFrameHeight = after.nFrameHeight;
    fitPicture(&ports[kOutputPort]);
  }
  fitPicture(&ports[port]);
  return OMX_ErrorNone;
}

mediaserver::Codec::Answer ScriptedCodec::get(Access access, OMX_INDEXTYPE index, void* record,
                                              size_t size) const {
  const Lock lock(_script._mutex);
  const auto refused = _script._refused.find({access, index});
  if (refused != _script._refused.end()) return refused->second;
  const std::vector<uint8_t>* source = nullptr;
  const auto answer = _script._answers.find(index);
  if (answer != _script._answers.end()) {
    const bool otherPort = index == OMX_IndexParamPortDefinition &&
                           wordAt(answer->second.data(), answer->second.size(), 0) != wordAt(record, size, 0);
    if (!otherPort) source = &answer->second;
  }
  const size_t known = knownSize(access, index);
  if (source == nullptr && known == 0) return {};
  if (size < known) return OMX_ErrorBadParameter;
  if (source == nullptr) {
    const auto written = _script._records.find(index);
    if (written != _script._records.end()) source = &written->second;
  }
  auto* const bytes = static_cast<uint8_t*>(record);
  // Unanswered and unwritten: zeros behind the port, which is the client's.
  const size_t from = source != nullptr ? kHeaderBytes : kHeaderBytes + sizeof(OMX_U32);
  for (size_t i = from; i < size; ++i) bytes[i] = source != nullptr && i < source->size() ? (*source)[i] : 0;
  return OMX_ErrorNone;
}

mediaserver::Codec::Answer ScriptedCodec::set(Access access, OMX_INDEXTYPE index, const void* record,
                                              size_t size) {
  const Lock lock(_script._mutex);
  const auto refused = _script._refused.find({access, index});
  if (refused != _script._refused.end()) return refused->second;
  const size_t known = knownSize(access, index);
  if (size < known) return OMX_ErrorBadParameter;
  if (index == kMetaData && wordAt(record, size, 1) != OMX_FALSE) return OMX_ErrorUnsupportedSetting;
  if (known == 0) return {};
  const auto* const bytes = static_cast<const uint8_t*>(record);
  _script._records[index].assign(bytes, bytes + size);
  return OMX_ErrorNone;
}

void ScriptedCodec::configure(const PortPair& ports) {
  const Lock lock(_script._mutex);
  _script._configured = ports;
}

OMX_ERRORTYPE ScriptedCodec::start() {
  const Lock lock(_script._mutex);
  if (_script._startFailure != OMX_ErrorNone) return _script._startFailure;
  ++_script._starts;
  return OMX_ErrorNone;
}

void ScriptedCodec::stop() {
  const Lock lock(_script._mutex);
  ++_script._stops;
  _line.clear();
  _draining = false;
}

void ScriptedCodec::flush(OMX_U32 port) {
  const Lock lock(_script._mutex);
  if (port == kInputPort) {
    _draining = false;
  } else {
    std::erase_if(_line, [](const Item& item) { return std::holds_alternative<Packet>(item); });
  }
}

void ScriptedCodec::takeTime(Lock& lock) {
  if (_script._delay.count() == 0) return;
  _script._changed.wait_for(lock, _script._delay, [this] { return _script._delay.count() == 0; });
}

Sent ScriptedCodec::send(const InputView& input) {
  Lock lock(_script._mutex);
  takeTime(lock);
  if (_script._inputBudget == std::optional<size_t>(0) || _line.size() >= kDepth) return Sent::Busy;
  if (_script._inputBudget.has_value()) --*_script._inputBudget;
  Packet packet;
  packet.bytes.assign(input.data, input.data + input.length);
  packet.timestamp = input.timestamp;
  packet.flags = input.flags;
  _draining = false;
  std::vector<Packet> outputs;
  if (_script._transform) {
    const auto transform = _script._transform;
    lock.unlock();
    outputs = transform(packet);
    lock.lock();
  } else {
    outputs.push_back(packet);
  }
  for (Packet& output : outputs) _line.emplace_back(std::move(output));
  _script._inputs.push_back(std::move(packet));
  _script._changed.notify_all();
  return Sent::Taken;
}

void ScriptedCodec::drain(OMX_TICKS) {
  const Lock lock(_script._mutex);
  _draining = true;
}

Received ScriptedCodec::receive(OutputSpace& output) {
  Lock lock(_script._mutex);
  if (_script._outputHeld) return Received::Nothing;
  if (_line.empty()) return std::exchange(_draining, false) ? Received::Drained : Received::Nothing;
  takeTime(lock);
  if (_line.empty()) return Received::Nothing;
  if (std::holds_alternative<Announcement>(_line.front())) return Received::NewGeometry;
  const Packet packet = std::get<Packet>(std::move(_line.front()));
  _line.pop_front();
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
  Lock lock(_script._mutex);
  const Announcement announcement = std::get<Announcement>(std::move(_line.front()));
  _line.pop_front();
  lock.unlock();
  announcement.edit(output);
  return announcement.index;
}

}  // namespace omxtest
