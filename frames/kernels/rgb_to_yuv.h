// Row kernels from RGB to YUV, for the best instruction set that the processor has.
// Any thread; pointers may have any alignment, rows must not overlap.
#pragma once

#include <cstddef>
#include <cstdint>

namespace webrtc::detail {

// pairs counts pairs of pixels. lumaAndChroma takes chroma from the left pixel of each pair.
struct RgbToYuvRows {
  void (*luma)(const std::uint8_t* src, std::uint8_t* y, std::size_t pairs);
  void (*lumaAndChroma)(const std::uint8_t* src, std::uint8_t* y, std::uint8_t* u, std::uint8_t* v,
                        std::size_t pairs);
  std::size_t bytesPerPixel;
};

struct RgbToYuvKernels {
  RgbToYuvRows bgr24, argb, rgb565;
};

const RgbToYuvKernels& rgbToYuvKernels();

}  // namespace webrtc::detail
