// Pictures of any video file that libavformat and libavcodec read, turned into I420.
#pragma once

#include <memory>
#include <optional>

#include "tools/files/byte_reader.h"
#include "tools/files/frame_source.h"

namespace tool {

// `rate` replaces the file's own.
Result<std::unique_ptr<FrameSource>> openMedia(std::unique_ptr<ByteReader> bytes,
                                               std::optional<FrameRate> rate);

}  // namespace tool
