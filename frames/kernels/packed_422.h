// Row kernels between packed 4:2:2 and planes, for the best instruction set that the processor has.
// Any thread; pointers may have any alignment; source and destination must not overlap, u and v may be the
// same row (v then wins).
#pragma once

#include <cstddef>
#include <cstdint>

namespace webrtc::detail {

// One byte order. pairs counts groups of four bytes, that is pairs of pixels.
struct Packed422Rows {
  void (*pack)(const std::uint8_t* y, const std::uint8_t* u, const std::uint8_t* v, std::uint8_t* dst,
               std::size_t pairs);
  void (*luma)(const std::uint8_t* src, std::uint8_t* y, std::size_t pairs);
  // The luma of two source rows averaged, rounded down.
  void (*lumaOfTwo)(const std::uint8_t* src, const std::uint8_t* other, std::uint8_t* y, std::size_t pairs);
  void (*lumaAndChroma)(const std::uint8_t* src, std::uint8_t* y, std::uint8_t* u, std::uint8_t* v,
                        std::size_t pairs);
  // Chroma is the average, rounded up, with the bytes at the same places of other.
  void (*lumaAndChromaOfTwo)(const std::uint8_t* src, const std::uint8_t* other, std::uint8_t* y,
                             std::uint8_t* u, std::uint8_t* v, std::size_t pairs);
};

struct Packed422Kernels {
  Packed422Rows yuy2, uyvy;
};

const Packed422Kernels& packed422Kernels();

}  // namespace webrtc::detail
