#include "bench/bridge/direct_codec.h"

#include <stdexcept>

#include <omxhost/device.h>

#include "bench/bridge/codec_time.h"
#include "host/mediaserver/components/picture_layout.h"

extern "C" {
#include <libavcodec/avcodec.h>
#include <libavutil/opt.h>
}

namespace bench {

namespace {

void require(bool done, const char* what) {
  if (!done) throw std::runtime_error(what);
}

void keep(void* /*opaque*/, uint8_t* /*data*/) {}

}  // namespace

void AvDeleter::operator()(AVCodecContext* context) const {
  avcodec_free_context(&context);
}

void AvDeleter::operator()(AVFrame* frame) const {
  av_frame_free(&frame);
}

void AvDeleter::operator()(AVPacket* packet) const {
  av_packet_free(&packet);
}

DirectEncoder::DirectEncoder(tool::Size size, int framesPerSecond, int64_t bitRate)
    : _context(avcodec_alloc_context3(avcodec_find_encoder_by_name("libx264"))),
      _frame(av_frame_alloc()),
      _packet(av_packet_alloc()) {
  av_log_set_level(AV_LOG_WARNING);
  require(_context != nullptr && _frame != nullptr && _packet != nullptr, "libavcodec has no libx264");
  AVCodecContext& context = *_context;
  context.width = size.width;
  context.height = size.height;
  context.pix_fmt = AV_PIX_FMT_NV12;
  context.time_base = {1, framesPerSecond};
  context.max_b_frames = 0;
  context.thread_count = 1;
  context.level = 31;
  context.bit_rate = context.rc_max_rate = bitRate;
  context.rc_buffer_size = static_cast<int>(bitRate / 2);
  require(
      av_opt_set(context.priv_data, "preset", "veryfast", 0) >= 0 &&
          av_opt_set(context.priv_data, "tune", "zerolatency", 0) >= 0 &&
          av_opt_set(context.priv_data, "forced-idr", "1", 0) >= 0 &&
          av_opt_set(context.priv_data, "x264-params",
                     "keyint=infinite:scenecut=0:psy=0:aq-mode=0:cabac=0:8x8dct=0:weightp=0:ref=1", 0) >= 0 &&
          avcodec_open2(&context, nullptr, nullptr) >= 0,
      "libx264 cannot be opened");
  _frame->format = context.pix_fmt;
  _frame->width = context.width;
  _frame->height = context.height;
  // Stands for each picture's own reference, with which the library takes it as it lies instead of a copy.
  static uint8_t nobodys = 0;
  _frame->buf[0] = av_buffer_create(&nobodys, 1, keep, nullptr, AV_BUFFER_FLAG_READONLY);
  require(_frame->buf[0] != nullptr, "no memory");
}

std::span<const uint8_t> DirectEncoder::encode(const Frame& frame, bool key) {
  AVFrame& picture = *_frame;
  auto* const luma = const_cast<uint8_t*>(frame.data());
  picture.data[0] = luma;
  picture.data[1] = luma + static_cast<ptrdiff_t>(_context->width) * _context->height;
  picture.linesize[0] = picture.linesize[1] = _context->width;
  picture.pts = _count++;
  picture.pict_type = key ? AV_PICTURE_TYPE_I : AV_PICTURE_TYPE_NONE;
  av_packet_unref(_packet.get());
  const bool encoded = avcodec_send_frame(_context.get(), &picture) >= 0 &&
                       avcodec_receive_packet(_context.get(), _packet.get()) >= 0;
  require(encoded, "libx264 gave no unit for a frame");
  return {_packet->data, static_cast<size_t>(_packet->size)};
}

std::span<const uint8_t> DirectEncoder::encodeCopied(const Frame& frame, bool key) {
  _copied.resize(frame.size());
  copyInput(frame, _copied.data());
  return encode(_copied, key);
}

DirectDecoder::DirectDecoder()
    : _context(avcodec_alloc_context3(avcodec_find_decoder(AV_CODEC_ID_H264))),
      _frame(av_frame_alloc()),
      _packet(av_packet_alloc()) {
  require(_context != nullptr && _frame != nullptr && _packet != nullptr, "libavcodec has no H.264 decoder");
  _context->thread_count = 1;
  _context->flags |= AV_CODEC_FLAG_LOW_DELAY | AV_CODEC_FLAG_UNALIGNED;
  require(avcodec_open2(_context.get(), nullptr, nullptr) >= 0, "the H.264 decoder cannot be opened");
}

void DirectDecoder::decode(const Unit& unit) {
  require(av_new_packet(_packet.get(), static_cast<int>(unit.size())) >= 0, "no memory");
  copyInput(unit, _packet->data);
  const bool sent = avcodec_send_packet(_context.get(), _packet.get()) >= 0;
  av_packet_unref(_packet.get());
  require(sent && avcodec_receive_frame(_context.get(), _frame.get()) >= 0, "no picture for a unit");
}

void DirectDecoder::decodeForDevice(const Unit& unit) {
  decode(unit);
  const AVFrame& picture = *_frame;
  const mediaserver::PlanarView view{{picture.data[0], picture.data[1], picture.data[2]},
                                     {picture.linesize[0], picture.linesize[1], picture.linesize[2]},
                                     static_cast<uint32_t>(picture.width),
                                     static_cast<uint32_t>(picture.height)};
  const mediaserver::OutputGeometry geometry =
      mediaserver::outputGeometry(omxhost::posedDevice().components.decoderOutput, view.width, view.height);
  _laidOut.resize(geometry.bytes);
  mediaserver::writePicture(geometry, view, _laidOut.data());
}

}  // namespace bench
