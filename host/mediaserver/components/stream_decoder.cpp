#include "host/mediaserver/components/stream_decoder.h"

#include <algorithm>
#include <cstring>
#include <utility>

#include <android/log.h>

#include "host/mediaserver/components/avc_level.h"
#include "host/mediaserver/components/sequence_set.h"
#include "host/mediaserver/components/wmv_header.h"

namespace mediaserver {

namespace {

constexpr size_t kMostBegun = 32;  // pictures in one unit; beyond all reason

AVCodecID codecOf(OMX_VIDEO_CODINGTYPE coding) {
  switch (coding) {
    case OMX_VIDEO_CodingAVC:
      return AV_CODEC_ID_H264;
    case OMX_VIDEO_CodingMPEG4:
      return AV_CODEC_ID_MPEG4;
    case OMX_VIDEO_CodingH263:
      return AV_CODEC_ID_H263;
    default:
      return AV_CODEC_ID_NONE;
  }
}

bool isPlanar420(const AVFrame& frame) {
  return frame.format == AV_PIX_FMT_YUV420P || frame.format == AV_PIX_FMT_YUVJ420P;
}

}  // namespace

StreamDecoder::StreamDecoder(const DecoderOptions& options)
    : _options(options),
      _fromRows(options.order == PictureOrder::Decoding && options.coding == OMX_VIDEO_CodingAVC),
      _packet(av_packet_alloc()) {
  _begun.reserve(kMostBegun);
}

StreamDecoder::~StreamDecoder() = default;

// Opens at the first bytes: some streams say there what they are.
bool StreamDecoder::open(Bytes* bytes, bool config) {
  if (_context != nullptr) return true;
  AVCodecID codec = codecOf(_options.coding);
  WmvHeader header;
  if (_options.coding == OMX_VIDEO_CodingWMV) {
    header = readWmvHeader(*bytes, config, _options.width, _options.height);
    if (!header.known) return false;
    codec = header.advanced ? AV_CODEC_ID_VC1 : AV_CODEC_ID_WMV3;
    *bytes = bytes->subspan(header.consumed);
  }
  AvContext context = makeContext(avcodec_find_decoder(codec));
  if (context == nullptr || _packet == nullptr) return false;
  if (!header.extradata.empty()) {
    const size_t size = header.extradata.size();
    context->extradata = static_cast<uint8_t*>(av_mallocz(size + AV_INPUT_BUFFER_PADDING_SIZE));
    if (context->extradata == nullptr) return false;
    std::memcpy(context->extradata, header.extradata.data(), size);
    context->extradata_size = static_cast<int>(size);
    context->width = context->coded_width = static_cast<int>(header.width);
    context->height = context->coded_height = static_cast<int>(header.height);
  }
  context->flags |= AV_CODEC_FLAG_UNALIGNED;  // crops exactly
  // Damage can make a picture of any size. What is a little too large is decoded, and skipped with a word.
  context->max_pixels = int64_t{4} * 16 * 16 * _options.largestPicture;
  context->opaque = this;
  if (_fromRows) {
    context->draw_horiz_band = onRows;
    context->slice_flags = SLICE_FLAG_CODED_ORDER;
  } else if (_options.order == PictureOrder::Decoding) {
    context->flags |= AV_CODEC_FLAG_LOW_DELAY;
  }
  if (avcodec_open2(context.get(), nullptr, nullptr) < 0) return false;
  _context = std::move(context);
  if (_options.packing != Packing::Unit) _parser.reset(av_parser_init(codec));
  return true;
}

void StreamDecoder::push(Bytes bytes, int64_t timestamp, bool config) {
  if (bytes.empty() || !open(&bytes, config) || bytes.empty()) return;
  if (_parser == nullptr || config) {
    decode(bytes, timestamp);
    return;
  }
  parse(bytes, timestamp);
  // What ends with the buffer need not wait for the beginning of the next. A parser does not go on after
  // that.
  if (_options.packing == Packing::Units) {
    parse({}, timestamp);
    _parser.reset(av_parser_init(_context->codec_id));
  }
}

// Nothing to parse stands for the end.
void StreamDecoder::parse(Bytes bytes, int64_t timestamp) {
  // The parser reads a little further than it is told.
  std::vector<uint8_t> padded(bytes.size() + AV_INPUT_BUFFER_PADDING_SIZE);
  std::copy(bytes.begin(), bytes.end(), padded.begin());
  size_t position = 0;
  bool again = true;
  while (again) {
    uint8_t* unit = nullptr;
    int size = 0;
    const int used =
        av_parser_parse2(_parser.get(), _context.get(), &unit, &size, padded.data() + position,
                         static_cast<int>(bytes.size() - position), timestamp, AV_NOPTS_VALUE, 0);
    if (used < 0) return;
    position += static_cast<size_t>(used);
    if (size > 0) {
      if (_parser->pts != AV_NOPTS_VALUE) _lastTimestamp = _parser->pts;
      decode({unit, static_cast<size_t>(size)}, _lastTimestamp);
    }
    again = bytes.empty() ? size > 0 : position < bytes.size() && (used > 0 || size > 0);
  }
}

void StreamDecoder::decode(Bytes unit, int64_t timestamp) {
  if (av_new_packet(_packet.get(), static_cast<int>(unit.size())) < 0) return;
  std::copy(unit.begin(), unit.end(), _packet->data);
  // The copy is what is looked at: the client may still write into its own.
  if (_options.coding == OMX_VIDEO_CodingAVC) lookInside({_packet->data, unit.size()});
  _packet->pts = timestamp;
  // A refusal means damage, and there may be pictures all the same.
  static_cast<void>(avcodec_send_packet(_context.get(), _packet.get()));
  av_packet_unref(_packet.get());
  receive();
}

void StreamDecoder::receive() {
  std::vector<AvFrame> returned;
  for (;;) {
    AvFrame frame(av_frame_alloc());
    if (frame == nullptr || avcodec_receive_frame(_context.get(), frame.get()) < 0) break;
    returned.push_back(std::move(frame));
  }
  _synchronised = _synchronised || !returned.empty();
  takeBegun();
  for (AvFrame& frame : returned) {
    const bool key = frame->key_frame != 0;
    if (_inside.erase(frame->buf[0]->data) == 0) take(std::move(frame), key);
  }
}

// What libavcodec returns of H.264 is in display order. Where pictures are wanted as they are decoded, they
// are taken when their rows are: it tells of these in order of decoding, and when it is through with a unit
// the unit's pictures are complete, concealment included. They are not taken again when it returns them;
// those whose rows it never mentioned, all of them having been concealed, are.
void StreamDecoder::takeBegun() {
  for (AvFrame& frame : _begun) {
    _synchronised = _synchronised || frame->pict_type == AV_PICTURE_TYPE_I;
    if (!_synchronised) continue;
    _inside.insert(frame->buf[0]->data);
    if (av_frame_apply_cropping(frame.get(), AV_FRAME_CROP_UNALIGNED) >= 0)
      take(std::move(frame), _unitIsKey);
  }
  _begun.clear();
}

void StreamDecoder::onRows(AVCodecContext* context, const AVFrame* frame, int* /*offsets*/, int /*y*/,
                           int /*type*/, int /*height*/) {
  auto& begun = static_cast<StreamDecoder*>(context->opaque)->_begun;
  if (frame == nullptr || frame->buf[0] == nullptr || begun.size() == kMostBegun) return;
  if (!begun.empty() && begun.back()->buf[0]->data == frame->buf[0]->data) return;
  AvFrame reference(av_frame_clone(frame));
  if (reference != nullptr) begun.push_back(std::move(reference));
}

// Finds out before the library does how far back pictures of this stream may be reordered. It guesses low and
// corrects itself by dropping pictures.
void StreamDecoder::lookInside(Bytes unit) {
  _unitIsKey = false;
  for (Bytes nal = takeNal(&unit); !nal.empty(); nal = takeNal(&unit)) {
    const unsigned type = nalType(nal);
    if (type == kNalIdrSlice) _unitIsKey = true;
    if (type >= kNalSlice && type <= kNalIdrSlice) return;
    if (type != kNalSequenceSet || _options.order == PictureOrder::Decoding) continue;
    const std::optional<SequenceSet> set = readSequenceSet(nal);
    if (!set) continue;
    const auto depth = static_cast<int>(reorderDepth(*set));
    _context->has_b_frames = std::max(_context->has_b_frames, depth);
  }
}

void StreamDecoder::take(AvFrame frame, bool key) {
  const uint32_t size =
      macroblocks(static_cast<uint32_t>(frame->width), static_cast<uint32_t>(frame->height));
  if (isPlanar420(*frame) && size > 0 && size <= _options.largestPicture) {
    _pictures.push_back({std::move(frame), key});
  } else if (!std::exchange(_complained, true)) {
    __android_log_print(
        ANDROID_LOG_WARN, "omxmediaserver",
        "decoder: pictures of %dx%d (format %d) are skipped: too large, or not 4:2:0 with 8 bits",
        frame->width, frame->height, frame->format);
  }
}

void StreamDecoder::drain() {
  if (_context == nullptr) return;
  if (_parser != nullptr) parse({}, _lastTimestamp);
  static_cast<void>(avcodec_send_packet(_context.get(), nullptr));
  receive();
  std::deque<Picture> pictures = std::move(_pictures);
  flush();
  _pictures = std::move(pictures);
}

void StreamDecoder::flush() {
  _pictures.clear();
  _begun.clear();
  _inside.clear();
  _synchronised = false;
  if (_context == nullptr) return;
  avcodec_flush_buffers(_context.get());
  if (_parser != nullptr) _parser.reset(av_parser_init(_context->codec_id));
}

PlanarView StreamDecoder::front() const {
  const AVFrame& frame = *_pictures.front().frame;
  return {{frame.data[0], frame.data[1], frame.data[2]},
          {frame.linesize[0], frame.linesize[1], frame.linesize[2]},
          static_cast<uint32_t>(frame.width),
          static_cast<uint32_t>(frame.height)};
}

uint32_t StreamDecoder::depth() const {
  if (_context == nullptr || _options.order == PictureOrder::Decoding) return 0;
  return static_cast<uint32_t>(std::max(_context->has_b_frames, 0));
}

}  // namespace mediaserver
