#include "tests/mediaserver/components/reference.h"

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
using omxhost::PictureLayout;

namespace {

size_t roundUp(size_t value, size_t multiple) {
  return (value + multiple - 1) / multiple * multiple;
}

// Noise that can be followed from picture to picture: squares of 8 pixels.
uint8_t texture(uint32_t x, uint32_t y) {
  uint32_t hash = x / 8 * 374761393U + y / 8 * 668265263U;
  hash = (hash ^ hash >> 13) * 1274126177U;
  return static_cast<uint8_t>(40 + (hash ^ hash >> 16) % 160);
}

// The position of a byte in a tiled plane that begins at `start`: number of the tile, then row by row.
size_t tiled(size_t start, size_t x, size_t y, size_t tilesPerRow, size_t tileRows) {
  const size_t column = x / 64;
  const size_t row = y / 32;
  size_t number = row * tilesPerRow + column;
  if (row % 2 != 0) {
    number = (row - 1) * tilesPerRow + column + column / 4 * 4 + 2;
  } else if (row + 1 < tileRows) {
    number += (column + 2) / 4 * 4;
  }
  return start + number * 2048 + y % 32 * 64 + x % 64;
}

Picture copyOut(const AVFrame& frame) {
  Picture picture(static_cast<uint32_t>(frame.width), static_cast<uint32_t>(frame.height));
  EXPECT_GE(av_image_copy_to_buffer(picture.bytes.data(), static_cast<int>(picture.bytes.size()), frame.data,
                                    frame.linesize, AV_PIX_FMT_YUV420P, frame.width, frame.height, 1),
            0);
  return picture;
}

}  // namespace

Picture::Picture(uint32_t columns, uint32_t rows) : width(columns), height(rows) {
  bytes.resize(size_t{width} * height + 2 * size_t{chromaWidth()} * chromaHeight());
}

uint8_t* Picture::plane(int index) {
  const size_t luma = size_t{width} * height;
  const size_t chroma = size_t{chromaWidth()} * chromaHeight();
  return bytes.data() + (index == 0 ? 0 : index == 1 ? luma : luma + chroma);
}

Picture scene(uint32_t width, uint32_t height, uint32_t number) {
  Picture picture(width, height);
  for (uint32_t i = 0; i < width * height; ++i)
    picture.bytes[i] = texture(i % width + 2 * number, i / width + number);
  const uint32_t columns = picture.chromaWidth(), samples = columns * picture.chromaHeight();
  for (uint32_t i = 0; i < 2 * samples; ++i) {
    const uint32_t x = i % columns, y = i % samples / columns, plane = i / samples;
    picture.plane(1)[i] = static_cast<uint8_t>(80 + (x + number) * 3 % 100 + plane * 20 + y % 30);
  }
  return picture;
}

std::vector<uint8_t> packInput(const Picture& picture, PictureLayout layout) {
  const size_t samples = picture.luma().size() / 4;
  const size_t chroma = roundUp(4 * samples, layout == PictureLayout::SemiPlanarAligned ? 2048 : 1);
  std::vector<uint8_t> bytes(chroma + 2 * samples);
  std::copy_n(picture.plane(0), 4 * samples, bytes.begin());
  for (size_t i = 0; i < 2 * samples; ++i) bytes[chroma + i] = picture.plane(i % 2 == 0 ? 1 : 2)[i / 2];
  return bytes;
}

Picture unpackOutput(const std::vector<uint8_t>& bytes, PictureLayout layout, uint32_t frameWidth,
                     uint32_t frameHeight, const OMX_CONFIG_RECTTYPE& crop) {
  Picture picture(crop.nWidth, crop.nHeight);
  const size_t tilesPerRow = roundUp(frameWidth, 128) / 64;
  const size_t lumaRows = roundUp(frameHeight, 32) / 32;
  const size_t chromaRows = roundUp(frameHeight, 64) / 64;
  const size_t tiledChroma = roundUp(tilesPerRow * lumaRows * 2048, 8192);
  const auto left = static_cast<size_t>(crop.nLeft);
  const auto top = static_cast<size_t>(crop.nTop);
  // Chroma rows follow those of luma.
  const auto at = [&](size_t x, size_t y, bool isLuma) {
    if (layout != PictureLayout::Tiled) {
      return bytes.at((isLuma ? top + y : frameHeight + top / 2 + y) * frameWidth + left + x);
    }
    return bytes.at(isLuma ? tiled(0, x, y, tilesPerRow, lumaRows)
                           : tiled(tiledChroma, x, y, tilesPerRow, chromaRows));
  };
  uint8_t* to = picture.plane(0);
  for (uint32_t y = 0; y < picture.height; ++y) {
    for (uint32_t x = 0; x < picture.width; ++x) *to++ = at(x, y, true);
  }
  for (const uint32_t plane : {0U, 1U}) {
    for (uint32_t y = 0; y < picture.chromaHeight(); ++y) {
      for (uint32_t x = 0; x < picture.chromaWidth(); ++x) *to++ = at(2 * x + plane, y, false);
    }
  }
  return picture;
}

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
