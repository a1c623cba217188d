#include "host/mediaserver/components/video_decoder.h"

#include <algorithm>
#include <utility>

#include "host/mediaserver/components/port_definitions.h"
#include "host/mediaserver/components/records.h"
#include "host/mediaserver/components/vendor_records.h"

namespace mediaserver {

namespace {

constexpr uint32_t kFirstFrameRate = 30U << 16;

// Whatever a sane encoder makes of a picture; it may even be larger than the picture itself.
uint32_t inputBytes(const PictureSize& size) {
  return std::max(size.width * size.height * 3 / 2, 128U * 1024U);
}

// No client needs to take these further apart.
std::optional<Packing> packingOf(OMX_U32 word) {
  switch (static_cast<QcomPacking>(word)) {
    case QcomPacking::Unspecified:
    case QcomPacking::OneCompleteFrame:
      return Packing::Unit;
    case QcomPacking::CompleteFrames:
      return Packing::Units;
    case QcomPacking::Arbitrary:
    case QcomPacking::OneCompleteSubFrame:
      return Packing::Pieces;
  }
  return std::nullopt;
}

}  // namespace

VideoDecoder::VideoDecoder(const omxhost::ComponentTraits& traits, CodecHost& /*host*/)
    : _traits(traits), _crop(geometryOf(kFirstWidth, kFirstHeight)) {}

PortPair VideoDecoder::ports() const {
  PortPair ports{};
  PortDefinition& input = ports[kInputPort];
  input.nBufferCountMin = 1;
  input.nBufferCountActual = _traits.decoderBuffers.input;
  input.nBufferSize = inputBytes({kFirstWidth, kFirstHeight});
  input.format.video.nFrameWidth = kFirstWidth;
  input.format.video.nFrameHeight = kFirstHeight;
  input.format.video.xFramerate = kFirstFrameRate;
  input.format.video.eCompressionFormat = OMX_VIDEO_CodingAVC;
  PortDefinition& output = ports[kOutputPort];
  output.nBufferCountMin = 2;
  output.nBufferCountActual = _traits.decoderBuffers.output;
  output.format.video.xFramerate = kFirstFrameRate;
  output.format.video.eColorFormat = colourFormat(_traits.decoderOutput);
  describe(geometryOf(kFirstWidth, kFirstHeight), &output);
  return ports;
}

void VideoDecoder::describe(const OutputGeometry& geometry, PortDefinition* output) const {
  output->nBufferSize = geometry.bytes;
  output->format.video.nFrameWidth = geometry.frameWidth;
  output->format.video.nFrameHeight = geometry.frameHeight;
  output->format.video.nStride = static_cast<OMX_S32>(geometry.pitch);
  output->format.video.nSliceHeight = geometry.frameHeight;
}

std::vector<VideoFormat> VideoDecoder::formats(OMX_U32 port) const {
  if (port == kOutputPort) return {{OMX_VIDEO_CodingUnused, colourFormat(_traits.decoderOutput)}};
  return {{OMX_VIDEO_CodingAVC, OMX_COLOR_FormatUnused},
          {OMX_VIDEO_CodingMPEG4, OMX_COLOR_FormatUnused},
          {OMX_VIDEO_CodingH263, OMX_COLOR_FormatUnused},
          {OMX_VIDEO_CodingWMV, OMX_COLOR_FormatUnused}};
}

// A picture size on the input port is a forecast, for both ports: the stream has the last word. On the output
// port the stream alone says it, and what a client writes there is ignored.
OMX_ERRORTYPE VideoDecoder::definePort(OMX_U32 port, const PortDefinition& wanted, PortPair& ports) {
  if (wanted.nBufferCountActual > kMostBuffers) return OMX_ErrorUnsupportedSetting;
  PortDefinition& own = ports[port];
  const auto& video = wanted.format.video;
  uint32_t needed = own.nBufferSize;
  if (port == kInputPort) {
    const PictureSize size{video.nFrameWidth, video.nFrameHeight};
    if (!fits(size, _traits.largestPicture)) return OMX_ErrorUnsupportedSetting;
    if (size.width != own.format.video.nFrameWidth || size.height != own.format.video.nFrameHeight) {
      describe(geometryOf(size.width, size.height), &ports[kOutputPort]);
      own.format.video.nFrameWidth = size.width;
      own.format.video.nFrameHeight = size.height;
    }
    own.format.video.eCompressionFormat = video.eCompressionFormat;
    own.format.video.nBitrate = video.nBitrate;
    needed = inputBytes(size);
  }
  if (video.xFramerate != 0) own.format.video.xFramerate = video.xFramerate;
  const bool asks = wanted.nBufferSize != own.nBufferSize;
  own.nBufferSize = asks ? grantBufferSize(wanted.nBufferSize, needed) : needed;
  own.nBufferCountActual = wanted.nBufferCountActual;
  return OMX_ErrorNone;
}

Codec::Answer VideoDecoder::getParameter(OMX_INDEXTYPE /*index*/, void* /*record*/, size_t /*size*/) {
  return std::nullopt;
}

Codec::Answer VideoDecoder::setParameter(OMX_INDEXTYPE index, const void* record, size_t size) {
  if (_traits.vendor != omxhost::Vendor::Qualcomm) return std::nullopt;
  switch (static_cast<OMX_U32>(index)) {
    case kQcomPictureOrderIndex:
      return accept<QcomPictureOrder>(record, size, [this](const QcomPictureOrder& order) {
        if (order.nPortIndex >= kPortCount) return OMX_ErrorBadPortIndex;
        std::lock_guard<std::mutex> lock(_mutex);
        switch (static_cast<QcomOrder>(order.eOutputPictureOrder)) {
          case QcomOrder::NothingAsked:
            return OMX_ErrorNone;
          case QcomOrder::Display:
            _order = PictureOrder::Display;
            return OMX_ErrorNone;
          case QcomOrder::Decode:
            _order = PictureOrder::Decoding;
            return OMX_ErrorNone;
        }
        return OMX_ErrorUnsupportedSetting;
      });
    case kQcomPortDefinitionIndex:
      // Memory region and cache are a matter of the device's memory, of which there is one kind here.
      return accept<QcomPortDefinition>(record, size, [this](const QcomPortDefinition& definition) {
        if (definition.nPortIndex != kInputPort) return OMX_ErrorBadPortIndex;
        const std::optional<Packing> packing = packingOf(definition.nFramePackingFormat);
        if (!packing) return OMX_ErrorUnsupportedSetting;
        std::lock_guard<std::mutex> lock(_mutex);
        _packing = *packing;
        return OMX_ErrorNone;
      });
    default:
      return std::nullopt;
  }
}

Codec::Answer VideoDecoder::getConfig(OMX_INDEXTYPE index, void* record, size_t size) {
  if (index != OMX_IndexConfigCommonOutputCrop) return std::nullopt;
  return answer<OMX_CONFIG_RECTTYPE>(record, size, [this](OMX_CONFIG_RECTTYPE* rectangle) {
    if (rectangle->nPortIndex != kOutputPort) return OMX_ErrorBadPortIndex;
    std::lock_guard<std::mutex> lock(_mutex);
    rectangle->nLeft = static_cast<OMX_S32>(_crop.left);
    rectangle->nTop = static_cast<OMX_S32>(_crop.top);
    rectangle->nWidth = _crop.visibleWidth;
    rectangle->nHeight = _crop.visibleHeight;
    return OMX_ErrorNone;
  });
}

Codec::Answer VideoDecoder::setConfig(OMX_INDEXTYPE /*index*/, const void* /*record*/, size_t /*size*/) {
  return std::nullopt;
}

// The buffers are made for the size that was told last, or for the forecast, whichever the port still shows.
void VideoDecoder::configure(const PortPair& ports) {
  const auto& input = ports[kInputPort].format.video;
  const auto& output = ports[kOutputPort].format.video;
  const auto shows = [&](const OutputGeometry& geometry) {
    return output.nFrameWidth == geometry.frameWidth && output.nFrameHeight == geometry.frameHeight &&
           ports[kOutputPort].nBufferSize >= geometry.bytes;
  };
  const OutputGeometry forecast = geometryOf(input.nFrameWidth, input.nFrameHeight);
  _agreed.reset();
  if (_announced && shows(*_announced)) {
    _agreed = _announced;
  } else if (shows(forecast)) {
    _agreed = forecast;
  }
  _buffers = ports[kOutputPort].nBufferCountActual;
  const DecoderOptions before = _options;
  {
    std::lock_guard<std::mutex> lock(_mutex);
    if (_agreed) _crop = *_agreed;
    _options = {.coding = input.eCompressionFormat,
                .order = _order,
                .packing = _packing,
                .width = input.nFrameWidth,
                .height = input.nFrameHeight,
                .largestPicture = _traits.largestPicture};
  }
  // The input port has come back with other settings while the component runs.
  if (_decoder != nullptr && _options != before) _decoder = std::make_unique<StreamDecoder>(_options);
}

OMX_ERRORTYPE VideoDecoder::start() {
  _decoder = std::make_unique<StreamDecoder>(_options);
  _draining = false;
  return OMX_ErrorNone;
}

void VideoDecoder::stop() {
  _decoder.reset();
}

void VideoDecoder::flush(OMX_U32 port) {
  if (port == kInputPort) {
    _decoder->flush();
    _draining = false;
  } else {
    _decoder->dropPictures();
  }
}

void VideoDecoder::releaseWritten() {
  std::vector<std::shared_ptr<const AVFrame>> pictures;
  const std::lock_guard<std::mutex> lock(_written->mutex);
  pictures.swap(_written->pictures);
}

Sent VideoDecoder::send(const InputView& input) {
  // One in, one out: nothing piles up while the client has no buffer for it.
  if (_decoder->waiting() > 0) return Sent::Busy;
  releaseWritten();
  const bool config = (input.flags & OMX_BUFFERFLAG_CODECCONFIG) != 0;
  _decoder->push({input.data, input.length}, input.timestamp, config);
  return Sent::Taken;
}

void VideoDecoder::drain(OMX_TICKS /*timestamp*/) {
  _decoder->drain();
  _draining = true;
}

// Pictures that are held back for their order come out at the end of the stream, when clients no longer give
// buffers back. So there have to be enough for all of them, and some for those on their way.
uint32_t VideoDecoder::neededBuffers() const {
  constexpr uint32_t kOnTheirWay = 4;
  const uint32_t depth = _decoder->depth();
  return depth > 0 ? depth + kOnTheirWay : 0;
}

Received VideoDecoder::receive(OutputSpace& output) {
  if (_decoder->waiting() == 0) {
    return std::exchange(_draining, false) ? Received::Drained : Received::Nothing;
  }
  const PlanarView picture = _decoder->front();
  const OutputGeometry geometry = geometryOf(picture.width, picture.height);
  if (_agreed != geometry || _buffers < neededBuffers() || output.capacity < geometry.bytes) {
    return Received::NewGeometry;
  }
  // Off this thread, which decodes the next picture meanwhile.
  output.complete = [geometry, picture, memory = _decoder->frontMemory(), data = output.data,
                     written = _written]() mutable {
    writePicture(geometry, picture, data);
    const std::lock_guard<std::mutex> lock(written->mutex);
    written->pictures.push_back(std::move(memory));
  };
  output.length = geometry.bytes;
  output.timestamp = _decoder->frontTimestamp();
  output.flags = OMX_BUFFERFLAG_ENDOFFRAME;
  if (_decoder->frontIsKey()) output.flags |= OMX_BUFFERFLAG_SYNCFRAME;
  _decoder->pop();
  if (_draining && _decoder->waiting() == 0) {
    _draining = false;
    output.flags |= OMX_BUFFERFLAG_EOS;
  }
  return Received::Filled;
}

OMX_U32 VideoDecoder::geometry(PortDefinition& output) {
  const PlanarView picture = _decoder->front();
  const OutputGeometry geometry = geometryOf(picture.width, picture.height);
  const bool inPlace = _agreed && geometry.frameWidth == _agreed->frameWidth &&
                       geometry.frameHeight == _agreed->frameHeight && _buffers >= neededBuffers();
  describe(geometry, &output);
  output.nBufferCountActual = std::max(output.nBufferCountActual, neededBuffers());
  _announced = geometry;
  if (inPlace) _agreed = geometry;
  std::lock_guard<std::mutex> lock(_mutex);
  _crop = geometry;
  return inPlace ? OMX_IndexConfigCommonOutputCrop : OMX_IndexParamPortDefinition;
}

}  // namespace mediaserver
