#include "host/mediaserver/components/avc_stream.h"

#include <algorithm>
#include <cmath>
#include <string>

extern "C" {
#include <libavutil/opt.h>
}

#include "host/mediaserver/components/avc_level.h"
#include "host/mediaserver/components/sequence_set.h"

namespace mediaserver {

namespace {

constexpr double kQ16 = 65536.0;

const AVCodec* library() {
  return avcodec_find_encoder_by_name("libx264");
}

void keep(void* /*opaque*/, uint8_t* /*data*/) {}

std::string describe(const StreamTools& tools) {
  const auto option = [](const char* name, uint32_t value) {
    return ":" + (name + ("=" + std::to_string(value)));
  };
  // No psychovisual tools: the components that these stand for have none, and are judged by their error.
  std::string text = "keyint=infinite:scenecut=0:psy=0:aq-mode=0";
  text += option("cabac", tools.cabac ? 1 : 0);
  text += option("8x8dct", tools.transform8x8 ? 1 : 0);
  text += option("weightp", tools.weightedPrediction ? 1 : 0);
  text += option("constrained-intra", tools.constrainedIntra ? 1 : 0);
  text += option("no-deblock", tools.deblocking ? 0 : 1);
  text += option("ref", tools.activeReferences);
  text += option("dpb-size", tools.referenceFrames);
  text += option("cabac-idc", tools.cabacInit);
  if (tools.sliceMacroblocks != 0) text += option("slice-max-mbs", tools.sliceMacroblocks);
  if (tools.constantQuantizer) {
    // Six steps of the quantizer double its size.
    const double steps = static_cast<double>(tools.quantizerP) - static_cast<double>(tools.quantizerI);
    text += ":ipratio=" + std::to_string(std::exp2(steps / 6));
  }
  return text;
}

}  // namespace

bool AvcStream::available() {
  return library() != nullptr;
}

AvcStream::AvcStream(uint32_t width, uint32_t height, const StreamTools& tools, const StreamPace& pace)
    : _width(width),
      _height(height),
      _tools(tools),
      _budget(pace.frameRate / kQ16, tools.bufferedSeconds),
      _context(makeContext(library())),
      _frame(av_frame_alloc()),
      _packet(av_packet_alloc()) {}

std::unique_ptr<AvcStream> AvcStream::open(uint32_t width, uint32_t height, const StreamTools& tools,
                                           const StreamPace& pace) {
  std::unique_ptr<AvcStream> stream(new AvcStream(width, height, tools, pace));
  return stream->prepare(pace) ? std::move(stream) : nullptr;
}

bool AvcStream::prepare(const StreamPace& pace) {
  if (_context == nullptr || _frame == nullptr || _packet == nullptr) return false;
  AVCodecContext& context = *_context;
  context.width = static_cast<int>(_width);
  context.height = static_cast<int>(_height);
  context.pix_fmt = AV_PIX_FMT_NV12;
  // The timing that the stream tells is that of its beginning: a new frame rate takes no new key frame.
  constexpr int kLongestFraction = 1 << 20;
  av_reduce(&context.time_base.num, &context.time_base.den, 1 << 16, pace.frameRate, kLongestFraction);
  context.max_b_frames = 0;
  // Clients always ask for level 3.1. Larger pictures and more bits than that holds get the lowest level that
  // holds them, as a decoder may refuse a stream that breaks its own promise.
  context.level = levelFor({.width = _width,
                            .height = _height,
                            .framesPerSecond = pace.frameRate / kQ16,
                            .bitRate = _tools.constantQuantizer ? 0 : pace.bitRate,
                            .referenceFrames = _tools.referenceFrames,
                            .high = _tools.profileIdc == kProfileHigh},
                           _tools.leastLevelIdc);
  _budget.set(pace.bitRate, pace.frameRate / kQ16);
  request();
  const bool set =
      av_opt_set(context.priv_data, "preset", "veryfast", 0) >= 0 &&
      av_opt_set(context.priv_data, "tune", "zerolatency", 0) >= 0 &&
      av_opt_set(context.priv_data, "forced-idr", "1", 0) >= 0 &&
      av_opt_set(context.priv_data, "x264-params", describe(_tools).c_str(), 0) >= 0 &&
      (!_tools.constantQuantizer || av_opt_set_int(context.priv_data, "qp", _tools.quantizerP, 0) >= 0);
  _frame->format = context.pix_fmt;
  _frame->width = context.width;
  _frame->height = context.height;
  // With a reference to count, the library takes a picture as it lies instead of a copy. It stands for all of
  // them: each belongs to the caller and is done with when its call returns.
  static uint8_t nobodys = 0;
  _frame->buf[0] = av_buffer_create(&nobodys, 1, keep, nullptr, AV_BUFFER_FLAG_READONLY);
  return set && _frame->buf[0] != nullptr && avcodec_open2(&context, nullptr, nullptr) >= 0;
}

// The library follows the bit rate while it runs only if it began with a constant one: with the buffer's rate
// the same as the stream's.
void AvcStream::request() {
  if (_tools.constantQuantizer) return;
  const RateBudget::Request wanted = _budget.next();
  constexpr int64_t kUnit = 1000;  // as it counts
  const int64_t rate = std::llround(wanted.bitsPerSecond / kUnit) * kUnit;
  _context->bit_rate = rate;
  _context->rc_max_rate = rate;
  _context->rc_buffer_size = static_cast<int>(std::llround(wanted.bufferBits));
}

bool AvcStream::encode(const SemiPlanarView& picture, bool key, const StreamPace& pace) {
  dropUnit();
  _budget.set(pace.bitRate, pace.frameRate / kQ16);
  request();

  AVFrame& frame = *_frame;
  frame.data[0] = const_cast<uint8_t*>(picture.luma);
  frame.data[1] = const_cast<uint8_t*>(picture.chroma);
  frame.linesize[0] = frame.linesize[1] = static_cast<int>(picture.pitch);
  frame.pts = _count++;
  frame.pict_type = key || frame.pts == 0 ? AV_PICTURE_TYPE_I : AV_PICTURE_TYPE_NONE;
  const bool encoded = avcodec_send_frame(_context.get(), &frame) >= 0 &&
                       avcodec_receive_packet(_context.get(), _packet.get()) >= 0;
  if (!encoded) return false;

  // Parameter sets and slices, and nothing that the encoder library has to say besides. The slices come last;
  // they are not walked over, since the client waits.
  Bytes stream(_packet->data, static_cast<size_t>(_packet->size));
  for (Bytes rest = findNal(stream); !rest.empty(); rest = findNal(stream)) {
    const unsigned type = nalType(rest);
    if (type == kNalSlice || type == kNalIdrSlice) {
      appendNal(rest[0], {}, &_head);
      _slices = rest.subspan(1);
      break;
    }
    const Bytes nal = takeNal(&stream);
    if (type == kNalSequenceSet) appendSequenceSet(nal, _tools.profileIdc, &_head);
    if (type == kNalPictureSet) appendNal(nal[0], unescape(nal), &_head);
  }
  _budget.spent(static_cast<double>(unitBytes()) * 8);
  return true;
}

void AvcStream::copyUnit(uint8_t* to) const {
  to = std::copy(_head.begin(), _head.end(), to);
  std::copy(_slices.begin(), _slices.end(), to);
}

void AvcStream::dropUnit() {
  _head.clear();
  _slices = {};
  av_packet_unref(_packet.get());
}

}  // namespace mediaserver
