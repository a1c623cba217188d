// Sizes and plane offsets of frames, in arithmetic that cannot wrap. Pure functions, internal to frames/.
#pragma once

#include <cstddef>
#include <cstdint>
#include <limits>

namespace webrtc::detail {

inline constexpr int kRefused = -1;
inline constexpr std::uint8_t kFillLuma = 0;
inline constexpr std::uint8_t kFillChroma = 127;

// width * height * numerator / denominator as a result, or kRefused where it does not fit. numerator is at
// least the denominator, both are below 8.
inline int frameBytes(std::uint64_t width, std::uint64_t height, unsigned numerator,
                      unsigned denominator = 1) {
  constexpr std::uint64_t kMax = std::numeric_limits<std::int32_t>::max();
  const std::uint64_t area = width * height;  // both are 32-bit quantities
  if (area > kMax) return kRefused;
  const std::uint64_t bytes = area * numerator / denominator;
  return bytes > kMax ? kRefused : static_cast<int>(bytes);
}

inline int i420Bytes(unsigned width, unsigned height) {
  return frameBytes(width, height, 3, 2);
}

// Whether a source frame of up to four bytes per pixel can exist: offsets into it then fit ptrdiff_t.
inline bool addressable(unsigned width, unsigned height) {
  return std::uint64_t{width} * height <= std::uint64_t{std::numeric_limits<std::ptrdiff_t>::max()} / 8;
}

// The three places where a third plane can start (yuv.h names them); the second always starts at the area.
inline std::size_t planeArea(unsigned width, unsigned height) {
  return std::size_t{width} * height;
}
inline std::size_t thirdPlaneByArea(unsigned width, unsigned height) {
  return planeArea(width, height) + planeArea(width, height) / 4;
}
inline std::size_t thirdPlaneByRows(unsigned width, unsigned height) {
  return std::size_t{width} * (std::size_t{height} + height / 4);
}
inline std::size_t thirdPlaneBySamples(unsigned width, unsigned height) {
  return planeArea(width, height) + planeArea(width / 2, height / 2);
}

// A stride argument: 0 stands for the width. False if it is refused.
inline bool resolveStride(unsigned width, unsigned& stride) {
  if (stride == 0) stride = width;
  return stride >= width;
}

}  // namespace webrtc::detail
