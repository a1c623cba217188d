// Copying rectangles. Internal to frames/; any thread.
#pragma once

#include <cstddef>
#include <cstdint>
#include <cstring>

namespace webrtc::detail {

// In one piece where the rows of both lie end to end.
inline void copyRows(const std::uint8_t* src, std::size_t srcPitch, std::uint8_t* dst, std::size_t dstPitch,
                     std::size_t columns, std::size_t rows) {
  if (srcPitch == columns && dstPitch == columns) {
    std::memcpy(dst, src, columns * rows);
    return;
  }
  for (std::size_t r = 0; r < rows; ++r) std::memcpy(dst + r * dstPitch, src + r * srcPitch, columns);
}

}  // namespace webrtc::detail
