// Y4M streams (YUV4MPEG2), 4:2:0 with 8 bits.
#pragma once

#include <memory>
#include <optional>
#include <span>

#include "tools/files/byte_reader.h"
#include "tools/files/frame_source.h"

namespace tool {

// Whether a stream that begins like this is Y4M.
bool isY4m(std::span<const uint8_t> firstBytes);

// `rate` replaces the stream's own.
Result<std::unique_ptr<FrameSource>> openY4m(std::unique_ptr<ByteReader> bytes,
                                             std::optional<FrameRate> rate);

}  // namespace tool
