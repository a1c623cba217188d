#include "tools/media/media_reader.h"

#include <inttypes.h>

#include "tools/base/text.h"
#include "tools/media/demuxer.h"

namespace tool {

namespace {

class MediaReader : public FrameSource {
 public:
  MediaReader(std::unique_ptr<Demuxer> demuxer, std::optional<FrameRate> rate)
      : _demuxer(std::move(demuxer)), _packet(av_packet_alloc()), _frame(av_frame_alloc()) {
    _traits.rate = rate.value_or(_demuxer->frameRate());
    const AVRational aspect = _demuxer->track().codecpar->sample_aspect_ratio;
    if (aspect.num > 0) _traits.pixelAspect = formatted("%d:%d", aspect.num, aspect.den);
  }

  Outcome start();
  Size size() const override { return _size; }
  const VideoTraits& traits() const override { return _traits; }
  std::optional<uint64_t> frameCount() const override { return _demuxer->pictureCount(); }
  Result<bool> next(Picture& picture) override;

 private:
  Result<bool> decodeNext();
  Outcome convert(Picture& picture);

  const std::unique_ptr<Demuxer> _demuxer;
  const AvPacket _packet;
  const AvFrame _frame;
  AvCodecContext _decoder;
  AvScaler _scaler;
  VideoTraits _traits;
  Size _size;
  bool _draining = false;
  uint64_t _damaged = 0;  // packets that the decoder refused
  Outcome _inputFailure;  // told once all that came before it is out
};

Outcome MediaReader::start() {
  const AVCodecParameters& parameters = *_demuxer->track().codecpar;
  const AVCodec* const codec = avcodec_find_decoder(parameters.codec_id);
  if (codec == nullptr) {
    return _demuxer->failure(
        formatted("holds %s, which cannot be decoded here", avcodec_get_name(parameters.codec_id)));
  }
  _decoder.reset(avcodec_alloc_context3(codec));
  if (_packet == nullptr || _frame == nullptr || _decoder == nullptr ||
      avcodec_parameters_to_context(_decoder.get(), &parameters) < 0 ||
      avcodec_open2(_decoder.get(), codec, nullptr) < 0) {
    return _demuxer->failure(formatted("its %s decoder cannot be opened", codec->name));
  }
  _size = {parameters.width, parameters.height};
  if (_size.width < 2 || _size.height < 2 || _size.width > kMaxSide || _size.height > kMaxSide) {
    return _demuxer->failure(
        formatted("has pictures of %dx%d; sides go from 2 to %d", _size.width, _size.height, kMaxSide));
  }
  return {};
}

// The next decoded picture into _frame; false at the end.
Result<bool> MediaReader::decodeNext() {
  for (;;) {
    const int received = avcodec_receive_frame(_decoder.get(), _frame.get());
    if (received >= 0) return true;
    if (received == AVERROR_EOF) return false;
    if (_demuxer->stopped()) return false;
    if (_draining) return false;
    const auto more = _demuxer->next(*_packet);
    if (!more.ok()) _inputFailure = more.failure();
    _draining = !more.ok() || !more.value();
    const int sent = avcodec_send_packet(_decoder.get(), _draining ? nullptr : _packet.get());
    if (sent < 0 && sent != AVERROR_EOF) ++_damaged;
  }
}

Result<bool> MediaReader::next(Picture& picture) {
  const auto decoded = decodeNext();
  if (!decoded.ok()) return decoded;
  if (decoded.value()) {
    if (auto failure = convert(picture)) return *failure;
    return true;
  }
  if (_demuxer->stopped()) return false;
  if (_inputFailure) return *std::exchange(_inputFailure, std::nullopt);
  const uint64_t damaged = std::exchange(_damaged, 0);
  if (damaged > 0) return _demuxer->failure(formatted("%" PRIu64 " of its pictures are damaged", damaged));
  return false;
}

// Every picture gets the size that the track announced.
Outcome MediaReader::convert(Picture& picture) {
  _scaler.reset(sws_getCachedContext(_scaler.release(), _frame->width, _frame->height,
                                     static_cast<AVPixelFormat>(_frame->format), _size.width, _size.height,
                                     AV_PIX_FMT_YUV420P, SWS_BICUBIC | SWS_ACCURATE_RND, nullptr, nullptr,
                                     nullptr));
  picture.resize(_size);
  uint8_t* planes[4] = {};
  int strides[4] = {};
  if (_scaler == nullptr || av_image_fill_arrays(planes, strides, picture.bytes.data(), AV_PIX_FMT_YUV420P,
                                                 _size.width, _size.height, 1) < 0) {
    return _demuxer->failure("has pictures that cannot be turned into I420");
  }
  sws_scale(_scaler.get(), _frame->data, _frame->linesize, 0, _frame->height, planes, strides);
  return {};
}

}  // namespace

Result<std::unique_ptr<FrameSource>> openMedia(std::unique_ptr<ByteReader> bytes,
                                               std::optional<FrameRate> rate) {
  auto demuxer = Demuxer::open(std::move(bytes));
  if (!demuxer.ok()) return demuxer.failure();
  auto reader = std::make_unique<MediaReader>(std::move(demuxer.value()), rate);
  if (auto failure = reader->start()) return *failure;
  return std::unique_ptr<FrameSource>(std::move(reader));
}

}  // namespace tool
