// The beginning of a WMV stream, which has to be known before its first picture. Two kinds are understood:
// the advanced profile in byte stream format, whose headers stand in the stream, and simple and main profile,
// whose sequence header comes first, either as an RCV file has it or alone in a buffer of settings.
#pragma once

#include <cstddef>
#include <cstdint>
#include <vector>

#include "host/mediaserver/components/annex_b.h"

namespace mediaserver {

struct WmvHeader {
  bool known = false;
  bool advanced = false;
  std::vector<uint8_t> extradata;  // as libavcodec wants it
  uint32_t width = 0;              // 0: the stream itself says it
  uint32_t height = 0;
  size_t consumed = 0;  // bytes in front of the first picture that are none of the stream's
};

// `width` and `height` as the client set them: settings alone do not carry them.
WmvHeader readWmvHeader(Bytes bytes, bool config, uint32_t width, uint32_t height);

}  // namespace mediaserver
