#include "tests/mediaserver/components/reference_codec.h"

#include <gtest/gtest.h>

#include <algorithm>
#include <cstring>

extern "C" {
#include <libavutil/dict.h>
#include <libavutil/imgutils.h>
}

#include "host/mediaserver/components/av.h"

namespace componenttest {

using mediaserver::AvContext;
using mediaserver::AvFrame;
using mediaserver::AvPacket;

namespace {

Picture copyOut(const AVFrame& frame) {
  Picture picture(static_cast<uint32_t>(frame.width), static_cast<uint32_t>(frame.height));
  EXPECT_GE(av_image_copy_to_buffer(picture.bytes.data(), static_cast<int>(picture.bytes.size()), frame.data,
                                    frame.linesize, AV_PIX_FMT_YUV420P, frame.width, frame.height, 1),
            0);
  return picture;
}

}  // namespace

std::vector<Picture> scenes(uint32_t width, uint32_t height, uint32_t count) {
  std::vector<Picture> pictures;
  for (uint32_t i = 0; i < count; ++i) pictures.push_back(scene(width, height, i));
  return pictures;
}

std::vector<Unit> encode(const std::string& encoder, const std::string& options,
                         const std::vector<Picture>& pictures) {
  const AvContext context = mediaserver::makeContext(avcodec_find_encoder_by_name(encoder.c_str()));
  context->width = static_cast<int>(pictures.front().width);
  context->height = static_cast<int>(pictures.front().height);
  context->pix_fmt = AV_PIX_FMT_YUV420P;
  context->time_base = {1, 25};
  context->gop_size = 30;
  AVDictionary* wanted = nullptr;
  EXPECT_GE(av_dict_parse_string(&wanted, options.c_str(), "=", " ", 0), 0);
  EXPECT_GE(avcodec_open2(context.get(), nullptr, &wanted), 0) << encoder;
  EXPECT_EQ(wanted, nullptr) << "not understood";
  const AvFrame frame(av_frame_alloc());
  const AvPacket packet(av_packet_alloc());
  frame->format = context->pix_fmt;
  frame->width = context->width;
  frame->height = context->height;
  EXPECT_GE(av_frame_get_buffer(frame.get(), 0), 0);
  std::vector<Unit> units;
  for (size_t i = 0; i <= pictures.size(); ++i) {
    if (i < pictures.size()) {
      EXPECT_GE(av_frame_make_writable(frame.get()), 0);
      const Picture& from = pictures[i];
      const uint8_t* planes[4] = {from.plane(0), from.plane(1), from.plane(2), nullptr};
      const int chroma = static_cast<int>(from.chromaWidth());
      const int pitches[4] = {frame->width, chroma, chroma, 0};
      av_image_copy(frame->data, frame->linesize, planes, pitches, AV_PIX_FMT_YUV420P, frame->width,
                    frame->height);
      frame->pts = static_cast<int64_t>(i);
    }
    EXPECT_GE(avcodec_send_frame(context.get(), i < pictures.size() ? frame.get() : nullptr), 0);
    while (avcodec_receive_packet(context.get(), packet.get()) >= 0) {
      units.push_back({{packet->data, packet->data + packet->size}, packet->pts});
      av_packet_unref(packet.get());
    }
  }
  EXPECT_EQ(units.size(), pictures.size());
  return units;
}

std::vector<Decoded> decode(const std::string& decoder, const std::vector<Unit>& units,
                            const std::vector<uint8_t>& extradata, uint32_t width, uint32_t height) {
  const AvContext context = mediaserver::makeContext(avcodec_find_decoder_by_name(decoder.c_str()));
  context->flags |= AV_CODEC_FLAG_UNALIGNED;
  // Reorders as far as the level allows wherever a stream does not say how far it does: loses no picture.
  context->strict_std_compliance = FF_COMPLIANCE_STRICT;
  if (!extradata.empty()) {
    context->extradata = static_cast<uint8_t*>(av_mallocz(extradata.size() + AV_INPUT_BUFFER_PADDING_SIZE));
    std::memcpy(context->extradata, extradata.data(), extradata.size());
    context->extradata_size = static_cast<int>(extradata.size());
    context->width = context->coded_width = static_cast<int>(width);
    context->height = context->coded_height = static_cast<int>(height);
  }
  EXPECT_GE(avcodec_open2(context.get(), nullptr, nullptr), 0);
  const AvFrame frame(av_frame_alloc());
  const AvPacket packet(av_packet_alloc());
  std::vector<Decoded> pictures;
  for (size_t i = 0; i <= units.size(); ++i) {
    if (i < units.size()) {
      EXPECT_GE(av_new_packet(packet.get(), static_cast<int>(units[i].bytes.size())), 0);
      std::copy(units[i].bytes.begin(), units[i].bytes.end(), packet->data);
      packet->pts = units[i].timestamp;
    }
    static_cast<void>(avcodec_send_packet(context.get(), i < units.size() ? packet.get() : nullptr));
    av_packet_unref(packet.get());
    while (avcodec_receive_frame(context.get(), frame.get()) >= 0) {
      pictures.push_back({copyOut(*frame), frame->pts});
    }
  }
  return pictures;
}

std::vector<Decoded> inDecodingOrder(const std::vector<Decoded>& pictures, const std::vector<Unit>& units) {
  std::vector<Decoded> sorted;
  for (const Unit& unit : units) {
    for (const Decoded& each : pictures) {
      if (each.timestamp == unit.timestamp) sorted.push_back(each);
    }
  }
  return sorted;
}

std::vector<uint8_t> joined(const std::vector<Unit>& units) {
  std::vector<uint8_t> bytes;
  for (const Unit& unit : units) bytes.insert(bytes.end(), unit.bytes.begin(), unit.bytes.end());
  return bytes;
}

}  // namespace componenttest
