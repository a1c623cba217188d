#include "host/mediaserver/components/avc_encoder.h"

#include <algorithm>
#include <utility>

#include "host/mediaserver/components/avc_level.h"
#include "host/mediaserver/components/port_definitions.h"
#include "host/mediaserver/components/vendor_records.h"

namespace mediaserver {

namespace {

// The standard allows a macroblock 400 bytes; the rest is for parameter sets and headers.
uint32_t largestUnit(uint32_t width, uint32_t height) {
  return macroblocks(width, height) * 400 + 16 * 1024;
}

}  // namespace

AvcEncoder::AvcEncoder(const omxhost::ComponentTraits& traits, CodecHost& host)
    : _traits(traits), _host(host), _settings(traits) {}

PortPair AvcEncoder::ports() const {
  PortPair ports{};
  for (PortDefinition& port : ports) {
    port.nBufferCountMin = 1;
    port.format.video.nFrameWidth = kFirstWidth;
    port.format.video.nFrameHeight = kFirstHeight;
    port.format.video.xFramerate = EncoderSettings::kFirstFrameRate;
  }
  PortDefinition& input = ports[kInputPort];
  const InputGeometry geometry = inputGeometry(_traits.encoderInput, kFirstWidth, kFirstHeight, 0, 0);
  input.nBufferCountActual = _traits.encoderBuffers.input;
  input.nBufferSize = inputBytes(geometry);
  input.format.video.nStride = static_cast<OMX_S32>(geometry.pitch);
  input.format.video.nSliceHeight = geometry.sliceHeight;
  input.format.video.eColorFormat = colourFormat(_traits.encoderInput);
  PortDefinition& output = ports[kOutputPort];
  output.nBufferCountActual = _traits.encoderBuffers.output;
  output.nBufferSize = largestUnit(kFirstWidth, kFirstHeight);
  output.format.video.nBitrate = EncoderSettings::kFirstBitRate;
  output.format.video.eCompressionFormat = OMX_VIDEO_CodingAVC;
  return ports;
}

std::vector<VideoFormat> AvcEncoder::formats(OMX_U32 port) const {
  if (port == kInputPort) return {{OMX_VIDEO_CodingUnused, colourFormat(_traits.encoderInput)}};
  return {{OMX_VIDEO_CodingAVC, OMX_COLOR_FormatUnused}};
}

std::vector<Extension> AvcEncoder::extensions() const {
  return {{kStoreMetaDataName, kStoreMetaDataIndex}};
}

// There is no scaling, so both ports have one picture size; a client may set it on either. A picture that is
// turned on its side shows on the output port alone.
OMX_ERRORTYPE AvcEncoder::definePort(OMX_U32 port, const PortDefinition& wanted, PortPair& ports) {
  auto& input = ports[kInputPort].format.video;
  auto& output = ports[kOutputPort].format.video;
  const bool turned = input.nFrameWidth != input.nFrameHeight && input.nFrameWidth == output.nFrameHeight &&
                      input.nFrameHeight == output.nFrameWidth;
  const auto& video = wanted.format.video;
  const PictureSize shown{video.nFrameWidth, video.nFrameHeight};
  const PictureSize size = port == kOutputPort && turned ? shown.turned() : shown;
  // 4:2:0 has no half chroma samples, and the stream no half crops.
  if (size.width % 2 != 0 || size.height % 2 != 0) return OMX_ErrorUnsupportedSetting;
  if (!fits(size, _traits.largestPicture)) return OMX_ErrorUnsupportedSetting;
  if (wanted.nBufferCountActual > kMostBuffers) return OMX_ErrorUnsupportedSetting;

  ports[port].nBufferCountActual = wanted.nBufferCountActual;
  if (port == kInputPort) {
    if (video.xFramerate != input.xFramerate) _settings.setFrameRate(video.xFramerate);
    if (video.xFramerate != 0) input.xFramerate = output.xFramerate = video.xFramerate;
  } else {
    if (video.nBitrate != output.nBitrate) _settings.setBitRate(video.nBitrate);
    if (video.nBitrate != 0) output.nBitrate = video.nBitrate;
  }

  const auto& layout = port == kInputPort ? video : input;
  const InputGeometry geometry =
      inputGeometry(_traits.encoderInput, size.width, size.height, layout.nStride, layout.nSliceHeight);
  const uint32_t inputSize = inputBytes(geometry);
  const uint32_t outputSize = largestUnit(size.width, size.height);
  input.nFrameWidth = size.width;
  input.nFrameHeight = size.height;
  input.nStride = static_cast<OMX_S32>(geometry.pitch);
  input.nSliceHeight = geometry.sliceHeight;
  const PictureSize out = turned ? size.turned() : size;
  output.nFrameWidth = out.width;
  output.nFrameHeight = out.height;
  // A client that asks for larger buffers gets them; one that writes back what it read means nothing by it.
  const bool asks = wanted.nBufferSize != ports[port].nBufferSize;
  ports[kInputPort].nBufferSize = inputSize;
  ports[kOutputPort].nBufferSize = outputSize;
  if (asks) ports[port].nBufferSize = grantBufferSize(wanted.nBufferSize, ports[port].nBufferSize);
  return OMX_ErrorNone;
}

Codec::Answer AvcEncoder::getParameter(OMX_INDEXTYPE index, void* record, size_t size) {
  return _settings.getParameter(index, record, size);
}

Codec::Answer AvcEncoder::setParameter(OMX_INDEXTYPE index, const void* record, size_t size) {
  return _settings.setParameter(index, record, size);
}

Codec::Answer AvcEncoder::getConfig(OMX_INDEXTYPE index, void* record, size_t size) {
  return _settings.getConfig(index, record, size);
}

Codec::Answer AvcEncoder::setConfig(OMX_INDEXTYPE index, const void* record, size_t size) {
  return _settings.setConfig(index, record, size);
}

void AvcEncoder::configure(const PortPair& ports) {
  const auto& input = ports[kInputPort].format.video;
  _input = inputGeometry(_traits.encoderInput, input.nFrameWidth, input.nFrameHeight, input.nStride,
                         input.nSliceHeight);
  const auto& output = ports[kOutputPort].format.video;
  _shownWidth = output.nFrameWidth;
  _shownHeight = output.nFrameHeight;
}

OMX_ERRORTYPE AvcEncoder::start() {
  const StreamPace pace = _settings.pace();
  const bool turned = pace.degrees % 180 != 0;
  const bool opened =
      openStream(turned ? _input.height : _input.width, turned ? _input.width : _input.height, pace);
  return opened ? OMX_ErrorNone : OMX_ErrorInsufficientResources;
}

void AvcEncoder::stop() {
  _stream.reset();
  _draining = false;
}

void AvcEncoder::flush(OMX_U32 port) {
  if (port == kInputPort) {
    _draining = false;
    return;
  }
  // Pictures behind one that nobody got could not be decoded.
  if (!hasUnit()) return;
  _stream->dropUnit();
  _sinceKey = 0;
}

bool AvcEncoder::openStream(uint32_t width, uint32_t height, const StreamPace& pace) {
  _stream.reset();
  _stream = AvcStream::open(width, height, _settings.tools(), pace);
  _sinceKey = 0;
  return _stream != nullptr;
}

Sent AvcEncoder::send(const InputView& input) {
  if (hasUnit()) return Sent::Busy;
  if (input.length == 0) return Sent::Taken;
  const std::optional<SemiPlanarView> picture = viewInput(_input, input.data, input.length);
  if (picture) {
    encode(*picture, input.timestamp);
  } else {
    _host.raise(OMX_EventError, static_cast<OMX_U32>(OMX_ErrorStreamCorrupt), 0);
  }
  return Sent::Taken;
}

void AvcEncoder::encode(const SemiPlanarView& untouched, OMX_TICKS timestamp) {
  const StreamPace pace = _settings.pace();
  const SemiPlanarView picture = rotate(untouched, pace.degrees, &_turned);
  const bool requested = _settings.takeKeyRequest();
  if (_stream == nullptr || _stream->differs(picture.width, picture.height, _settings.tools())) {
    openStream(picture.width, picture.height, pace);
  }
  const bool key = requested || _sinceKey == 0 || (pace.keyPeriod != 0 && _sinceKey >= pace.keyPeriod);
  if (_stream == nullptr || !_stream->encode(picture, key, pace)) {
    _sinceKey = 0;
    _host.raise(OMX_EventError, static_cast<OMX_U32>(OMX_ErrorHardware), 0);
    return;
  }
  _sinceKey = key ? 1 : _sinceKey + 1;
  _unit.key = key;
  _unit.timestamp = timestamp;
  _unit.width = picture.width;
  _unit.height = picture.height;
}

void AvcEncoder::drain(OMX_TICKS /*timestamp*/) {
  _draining = true;
}

Received AvcEncoder::receive(OutputSpace& output) {
  if (!hasUnit()) {
    if (!std::exchange(_draining, false)) return Received::Nothing;
    _sinceKey = 0;  // what follows is a stream of its own
    return Received::Drained;
  }
  if (_unit.width != _shownWidth || _unit.height != _shownHeight) return Received::NewGeometry;
  if (_stream->unitBytes() > output.capacity) {
    _stream->dropUnit();
    _sinceKey = 0;
    _host.raise(OMX_EventError, static_cast<OMX_U32>(OMX_ErrorOverflow), 0);
    return Received::Nothing;
  }
  _stream->copyUnit(output.data);
  output.length = static_cast<OMX_U32>(_stream->unitBytes());
  output.timestamp = _unit.timestamp;
  output.flags = OMX_BUFFERFLAG_ENDOFFRAME;
  if (_unit.key) output.flags |= OMX_BUFFERFLAG_SYNCFRAME;
  _stream->dropUnit();
  if (std::exchange(_draining, false)) {
    output.flags |= OMX_BUFFERFLAG_EOS;
    _sinceKey = 0;
  }
  return Received::Filled;
}

// A picture turned on its side needs no other buffers, so clients hear of it and need not do anything. A
// larger one comes when a client has redefined the input port of a running encoder.
OMX_U32 AvcEncoder::geometry(PortDefinition& output) {
  output.format.video.nFrameWidth = _shownWidth = _unit.width;
  output.format.video.nFrameHeight = _shownHeight = _unit.height;
  const uint32_t needed = largestUnit(_unit.width, _unit.height);
  if (needed <= output.nBufferSize) return OMX_IndexConfigCommonRotate;
  output.nBufferSize = needed;
  return OMX_IndexParamPortDefinition;
}

}  // namespace mediaserver
