// Row kernels of the scalers, for the best instruction set that the processor has. Averages are rounded down.
// Any thread; pointers may have any alignment. Rows must not overlap where nothing else is said.
#pragma once

#include <cstddef>
#include <cstdint>

namespace webrtc::detail {

// Enlarging by averages put behind each group of samples. n counts groups; one group more of each source row
// must be readable. insert makes the row between two.
struct ExpandRows {
  void (*keep)(const std::uint8_t* src, std::uint8_t* dst, std::size_t n);
  void (*insert)(const std::uint8_t* above, const std::uint8_t* below, std::uint8_t* dst, std::size_t n);
};

struct ScaleKernels {
  // dst[k] = average of src[2k] and src[2k + 1]. dst may be src, or anything before it.
  void (*halve)(const std::uint8_t* src, std::uint8_t* dst, std::size_t n);
  // The same of four, two in each row. dst as in halve.
  void (*quarter)(const std::uint8_t* row0, const std::uint8_t* row1, std::uint8_t* dst, std::size_t n);
  // Four samples of each 3 x 3: columns 3k and 3k + 1 of two rows. dst as in halve.
  void (*third)(const std::uint8_t* row0, const std::uint8_t* row1, std::uint8_t* dst, std::size_t n);
  // buffer[2i + 1] = buffer[i], buffer[2i] = average of buffer[i - 1] and buffer[i], for i from n - 1 down.
  // buffer[0] has no neighbour and is doubled.
  void (*doubleInPlace)(std::uint8_t* buffer, std::size_t n);

  ExpandRows byThreeHalves;  // groups of two become three
  ExpandRows byTwo;          // groups of one become two

  // dst = (row0 * (256 - fraction) + row1 * fraction) / 256, fraction 1 to 255.
  void (*blend)(const std::uint8_t* row0, const std::uint8_t* row1, unsigned fraction, std::uint8_t* dst,
                std::size_t n);
  // dst[i] = (src[at[i] + 1] * fraction[i] + src[at[i]] * (65535 - fraction[i])) / 65536. at must not fall.
  // near: at[i + 7] - at[i] is never above 14, and kBlendSlack bytes behind the last sample are readable.
  void (*resampleNear)(const std::uint8_t* src, const std::uint16_t* at, const std::uint16_t* fraction,
                       std::uint8_t* dst, std::size_t n);
  void (*resampleFar)(const std::uint8_t* src, const std::uint16_t* at, const std::uint16_t* fraction,
                      std::uint8_t* dst, std::size_t n);
};

inline constexpr std::size_t kBlendSlack = 16;

const ScaleKernels& scaleKernels();

}  // namespace webrtc::detail
