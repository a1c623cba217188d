// Row kernels from YUV to RGB, for the best instruction set that the processor has.
// Any thread; pointers may have any alignment, rows must not overlap.
#pragma once

#include <cstddef>
#include <cstdint>

namespace webrtc::detail {

// Two luma rows that share a chroma row; pairs counts blocks of 2 x 2 pixels. For semi-planar chroma u points
// to the interleaved pairs and v to the byte behind.
using RowPairToRgb = void (*)(const std::uint8_t* y0, const std::uint8_t* y1, const std::uint8_t* u,
                              const std::uint8_t* v, std::uint8_t* dst0, std::uint8_t* dst1,
                              std::size_t pairs);

struct YuvToRgbKernels {
  RowPairToRgb bgr24, bgra, rgba, argb, rgb565, argb4444, argb1555;
  RowPairToRgb semiPlanarRgb565;
  // Appends 255 to each three bytes.
  void (*bgr24ToBgra)(const std::uint8_t* src, std::uint8_t* dst, std::size_t pixels);
};

const YuvToRgbKernels& yuvToRgbKernels();

}  // namespace webrtc::detail
