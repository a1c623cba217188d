// Kernels that move samples about: interleaving, splitting, reversing, transposing. For the best instruction
// set that the processor has. Any thread; pointers may have any alignment, source and destination must not
// overlap.
#pragma once

#include <cstddef>
#include <cstdint>

namespace webrtc::detail {

// A tile of columns x rows samples: dst[c * dstPitch + r] = sample c of the row at src + r * srcPitch.
// Pitches are in bytes and may be negative.
using TransposeTile = void (*)(const std::uint8_t* src, std::ptrdiff_t srcPitch, std::uint8_t* dst,
                               std::ptrdiff_t dstPitch);

// The same at two sizes, for planes that the larger one does not fit into.
struct Transposition {
  TransposeTile large, small;
};

struct PlaneKernels {
  // n pairs.
  void (*interleave)(const std::uint8_t* first, const std::uint8_t* second, std::uint8_t* dst, std::size_t n);
  void (*split)(const std::uint8_t* src, std::uint8_t* first, std::uint8_t* second, std::size_t n);
  // Last byte, or pair, first.
  void (*reverse)(const std::uint8_t* src, std::uint8_t* dst, std::size_t n);
  void (*splitReversed)(const std::uint8_t* src, std::uint8_t* first, std::uint8_t* second, std::size_t n);

  // Samples one byte apart, and the first or second ones of pairs.
  Transposition transpose, transposeFirst, transposeSecond;
  std::size_t largeRows, largeColumns;
};

inline constexpr std::size_t kSmallTile = 16;

const PlaneKernels& planeKernels();

}  // namespace webrtc::detail
