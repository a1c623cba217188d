// libavcodec called directly, with the settings that the media server's components give it.
#pragma once

#include <stdint.h>

#include <memory>
#include <span>
#include <vector>

#include "tools/base/units.h"

struct AVCodecContext;
struct AVFrame;
struct AVPacket;

namespace bench {

// Semi-planar 4:2:0 without padding.
using Frame = std::vector<uint8_t>;
using Unit = std::vector<uint8_t>;

struct AvDeleter {
  void operator()(AVCodecContext* context) const;
  void operator()(AVFrame* frame) const;
  void operator()(AVPacket* packet) const;
};

class DirectEncoder {
 public:
  DirectEncoder(tool::Size size, int framesPerSecond, int64_t bitRate);

  // Encodes a frame where it lies. The unit is valid until the next call.
  std::span<const uint8_t> encode(const Frame& frame, bool key);
  // Puts it into memory of this object first, as a client of a device has to.
  std::span<const uint8_t> encodeCopied(const Frame& frame, bool key);

 private:
  const std::unique_ptr<AVCodecContext, AvDeleter> _context;
  const std::unique_ptr<AVFrame, AvDeleter> _frame;
  const std::unique_ptr<AVPacket, AvDeleter> _packet;
  Frame _copied;
  int64_t _count = 0;
};

class DirectDecoder {
 public:
  DirectDecoder();

  // Decodes one unit to one picture, which stays in the decoder's own memory.
  void decode(const Unit& unit);
  // And writes it into memory of this object, in the layout in which the posed device delivers.
  void decodeForDevice(const Unit& unit);

 private:
  const std::unique_ptr<AVCodecContext, AvDeleter> _context;
  const std::unique_ptr<AVFrame, AvDeleter> _frame;
  const std::unique_ptr<AVPacket, AvDeleter> _packet;
  Frame _laidOut;
};

}  // namespace bench
