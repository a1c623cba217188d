#include "tests/support/script.h"

#include <algorithm>
#include <cstring>
#include <deque>

namespace omxtest {

using namespace mediaserver;

namespace {

constexpr OMX_U32 kWidth = 176;
constexpr OMX_U32 kHeight = 144;
constexpr OMX_U32 kCompressedBytes = 65536;

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

constexpr auto kMetaData = static_cast<OMX_INDEXTYPE>(0x7F000F01);
constexpr size_t kHeaderBytes = 2 * sizeof(OMX_U32);
constexpr size_t kRecordBytes = kHeaderBytes + sizeof(OMX_U32);  // with the port
constexpr size_t kDepth = 16;  // outputs that a codec keeps before it takes no more inputs

// Records that are the node's, unless a test answers for it. All others are the codec's.
bool isStandard(OMX_INDEXTYPE index) {
  return index == OMX_IndexParamPortDefinition || index == OMX_IndexParamVideoPortFormat ||
         index == OMX_IndexParamStandardComponentRole || index == OMX_IndexParamCompBufferSupplier;
}

OMX_U32 portOf(const uint8_t* record) {
  OMX_U32 port = 0;
  std::memcpy(&port, record + kHeaderBytes, sizeof(port));
  return port;
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

// The codec of a script, which has the lock for both.
class ScriptedCodec final : public Codec {
 public:
  ScriptedCodec(Script& script, CodecHost& host) : _script(script), _host(host) {
    const Lock lock(_script._mutex);
    _script._codecs.insert(this);
  }
  ~ScriptedCodec() override {
    const Lock lock(_script._mutex);
    _script._codecs.erase(this);
  }

  PortPair ports() const override { return _script.read(_script._ports); }
  std::vector<VideoFormat> formats(OMX_U32 port) const override {
    return _script.read(_script._formats).at(port);
  }
  // What storeMetaDataInBuffers needs.
  std::vector<Extension> extensions() const override {
    return {{"OMX.google.android.index.storeMetaDataInBuffers", kMetaData}};
  }
  OMX_ERRORTYPE definePort(OMX_U32 port, const PortDefinition& wanted, PortPair& ports) override {
    ports[port] = wanted;
    fitPicture(&ports[port]);
    return OMX_ErrorNone;
  }
  Answer getParameter(OMX_INDEXTYPE index, void* record, size_t size) override {
    const Lock lock(_script._mutex);
    if (size < kRecordBytes) return isStandard(index) ? Answer() : OMX_ErrorBadParameter;
    auto* const bytes = static_cast<uint8_t*>(record);
    const auto found = _script._answers.find(index);
    const bool answered = found != _script._answers.end() && (index != OMX_IndexParamPortDefinition ||
                                                              portOf(found->second.data()) == portOf(bytes));
    if (!answered && isStandard(index)) return {};
    if (answered) {
      const size_t given = std::min(size, found->second.size());
      std::memcpy(bytes + kHeaderBytes, found->second.data() + kHeaderBytes, given - kHeaderBytes);
    } else {
      std::fill(bytes + kRecordBytes, bytes + size, uint8_t{0});  // behind the port, which is the client's
    }
    return OMX_ErrorNone;
  }
  Answer setParameter(OMX_INDEXTYPE index, const void* /*record*/, size_t size) override {
    if (isStandard(index)) return {};
    return size < kRecordBytes ? OMX_ErrorBadParameter : OMX_ErrorNone;
  }
  Answer getConfig(OMX_INDEXTYPE index, void* record, size_t size) override {
    return getParameter(index, record, size);
  }
  Answer setConfig(OMX_INDEXTYPE index, const void* record, size_t size) override {
    return setParameter(index, record, size);
  }

  void configure(const PortPair& /*ports*/) override {}
  OMX_ERRORTYPE start() override {
    const Lock lock(_script._mutex);
    if (_script._startFailure == OMX_ErrorNone) ++_script._starts;
    return _script._startFailure;
  }
  void stop() override {
    const Lock lock(_script._mutex);
    ++_script._stops;
    _line.clear();
    _draining = false;
  }
  void flush(OMX_U32 port) override {
    const Lock lock(_script._mutex);
    if (port == kInputPort) {
      _draining = false;
    } else {
      std::erase_if(_line, [](const Item& item) { return !item.edit; });
    }
  }
  Sent send(const InputView& input) override {
    Lock lock(_script._mutex);
    if (_script._inputBudget == std::optional<size_t>(0) || _line.size() >= kDepth) return Sent::Busy;
    if (_script._inputBudget.has_value()) --*_script._inputBudget;
    Packet packet;
    packet.bytes.assign(input.data, input.data + input.length);
    packet.timestamp = input.timestamp;
    packet.flags = input.flags;
    _draining = false;
    const Script::Transform transform = _script._transform;
    lock.unlock();
    const std::vector<Packet> outputs = transform ? transform(packet) : std::vector<Packet>{packet};
    lock.lock();
    for (const Packet& output : outputs) _line.push_back({output});
    _script._inputs.add(packet);
    return Sent::Taken;
  }
  void drain(OMX_TICKS /*timestamp*/) override {
    const Lock lock(_script._mutex);
    _draining = true;
  }
  Received receive(OutputSpace& output) override {
    const Lock lock(_script._mutex);
    if (_line.empty()) return std::exchange(_draining, false) ? Received::Drained : Received::Nothing;
    if (_line.front().edit) return Received::NewGeometry;
    const Packet packet = std::move(_line.front().packet);
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
  OMX_U32 geometry(PortDefinition& output) override {
    Lock lock(_script._mutex);
    const Item announcement = std::move(_line.front());
    _line.pop_front();
    lock.unlock();
    announcement.edit(output);
    return announcement.index;
  }

 private:
  friend class Script;
  using Lock = Script::Lock;
  struct Item {
    Packet packet;
    Script::PortEdit edit = nullptr;  // not null: new output settings instead, as they are to be told
    OMX_U32 index = 0;
  };

  Script& _script;
  CodecHost& _host;
  std::deque<Item> _line;  // outputs and announcements, in order
  bool _draining = false;
};

Script::Script(Kind kind) : _kind(kind) {
  const bool decoder = kind == Kind::Decoder;
  _ports = {defaultPort(decoder, 4), defaultPort(!decoder, decoder ? 8 : 6)};
  for (const auto coding :
       {OMX_VIDEO_CodingAVC, OMX_VIDEO_CodingMPEG4, OMX_VIDEO_CodingH263, OMX_VIDEO_CodingWMV}) {
    _formats[decoder ? kInputPort : kOutputPort].push_back({coding, OMX_COLOR_FormatUnused});
  }
  constexpr auto kTiPackedSemiPlanar = static_cast<OMX_COLOR_FORMATTYPE>(0x7F000100);
  for (const auto color : {OMX_COLOR_FormatYUV420SemiPlanar, kTiPackedSemiPlanar}) {
    _formats[decoder ? kOutputPort : kInputPort].push_back({OMX_VIDEO_CodingUnused, color});
  }
}

Component Script::component(const std::string& name) {
  const char* const role = _kind == Kind::Decoder ? "video_decoder.avc" : "video_encoder.avc";
  return {name, {role}, [this](CodecHost& host) { return std::make_unique<ScriptedCodec>(*this, host); }};
}

void Script::produce(const Packet& output) {
  change([&] {
    for (ScriptedCodec* codec : _codecs) codec->_line.push_back({output});
  });
}

void Script::announce(const PortEdit& edit, OMX_U32 index) {
  change([&] {
    for (ScriptedCodec* codec : _codecs) codec->_line.push_back({{}, edit, index});
  });
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

}  // namespace omxtest
