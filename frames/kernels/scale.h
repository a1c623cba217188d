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

// Columns of a resampled row, each of them
//   (closer * (65535 - weight) + other * weight) / 65536
// with a weight below 32768. closer and other lie pick's low and high byte behind window.
struct ResamplePlan {
  const std::uint16_t *window, *pick, *weight;
};

using ResampleRow = void (*)(const std::uint8_t* src, const ResamplePlan& plan, std::uint8_t* dst,
                             std::size_t n);

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
  // dst[i] from the two samples that plan has for it.
  // near: the columns 8 * k to 8 * k + 7 share a window of kWindow bytes, all of which must be readable.
  ResampleRow resampleNear, resampleFar;
  // The same without looking at the plan, where n is half or twice the width of the row.
  ResampleRow resampleToHalf, resampleToTwice;
};

inline constexpr std::size_t kWindow = 16;

const ScaleKernels& scaleKernels();

}  // namespace webrtc::detail
