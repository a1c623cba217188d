// Raw pictures of any layout, one behind the other, nothing else.
#pragma once

#include <memory>

#include "tools/files/byte_reader.h"
#include "tools/files/frame_source.h"
#include "tools/video/layout.h"

namespace tool {

Result<std::unique_ptr<FrameSource>> openRaw(std::unique_ptr<ByteReader> bytes, Size size, FrameRate rate,
                                             const Layout& layout);

// Reads one whole I420 picture; false at the end of the input. `number` is for the message about a
// picture cut short. Shared by the formats that hold plain pictures.
Result<bool> readPicture(ByteReader& bytes, Size size, uint64_t number, Picture& picture);

}  // namespace tool
