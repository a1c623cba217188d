// One H.264 stream being made by libx264 through libavcodec: one picture in, one picture out, nothing held
// back. Parameter sets come with every key frame, profile and level as asked; there are no B pictures and no
// key frames but those that are asked for. One thread.
#pragma once

#include <cstddef>
#include <cstdint>
#include <memory>
#include <vector>

#include "host/mediaserver/components/annex_b.h"
#include "host/mediaserver/components/av.h"
#include "host/mediaserver/components/encoder_settings.h"
#include "host/mediaserver/components/picture_layout.h"
#include "host/mediaserver/components/rate_budget.h"

namespace mediaserver {

class AvcStream {
 public:
  // Whether the encoder library is there at all.
  static bool available();

  // Of pictures of that size. Null when the library refuses.
  static std::unique_ptr<AvcStream> open(uint32_t width, uint32_t height, const StreamTools& tools,
                                         const StreamPace& pace);

  // Whether a stream opened with these would be another one.
  bool differs(uint32_t width, uint32_t height, const StreamTools& tools) const {
    return width != _width || height != _height || tools != _tools;
  }

  // One picture of the stream's size at the rates of the moment, whose access unit takes the place of the one
  // before. The first picture is a key frame anyway. False when the library fails.
  bool encode(const SemiPlanarView& picture, bool key, const StreamPace& pace);

  // The access unit, in byte stream format. 0 bytes: there is none.
  size_t unitBytes() const { return _head.size() + _slices.size(); }
  void copyUnit(uint8_t* to) const;
  void dropUnit();

 private:
  AvcStream(uint32_t width, uint32_t height, const StreamTools& tools, const StreamPace& pace);
  bool prepare(const StreamPace& pace);
  void request();

  const uint32_t _width;
  const uint32_t _height;
  const StreamTools _tools;
  RateBudget _budget;
  AvContext _context;
  AvFrame _frame;
  AvPacket _packet;  // with the unit's slices, which are copied once only, to where they go
  std::vector<uint8_t> _head;
  Bytes _slices;
  int64_t _count = 0;
};

}  // namespace mediaserver
