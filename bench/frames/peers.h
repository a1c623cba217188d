// The same operations by other libraries, one thread each. A library that was not installed contributes
// nothing: every function below returns a list that may be empty.
#pragma once

#include <functional>
#include <vector>

#include "bench/frames/measure.h"

namespace bench {

enum class Format {
  kI420,
  kYv12,
  kNv12,
  kNv21,
  kYuy2,
  kUyvy,
  kBgr24,
  kBgra,
  kRgba,
  kArgb,
  kRgb565,
  kRgb444,
  kRgb555
};

using Contenders = std::vector<Contender>;

Contenders operator+(Contenders a, const Contenders& b);

// One tightly packed frame into another. bottomUp: the destination's first row is its last in memory.
Contenders swscale(Format from, Size fromSize, Format to, Size toSize, const Buffers& buffers,
                   bool bottomUp = false);

// A chain of filters as the library's own language has it, on a frame that it allocated.
Contenders avfilter(const char* chain, Format from, Size size);

// What OpenCV calls these; the frames' planes one by one where it has no planar operation.
enum class OpencvTurn { kClockwise, kAntiClockwise, kHalf, kUpDown, kLeftRight };
Contenders opencvColour(Format from, Format to, Size size, const Buffers& buffers);
Contenders opencvTurn(OpencvTurn turn, Size size, const Buffers& buffers);
Contenders opencvResize(bool area, Size from, Size to, const Buffers& buffers);
// A smaller frame in the middle of a larger one, and the middle of a larger one.
Contenders opencvPad(Size from, Size to, const Buffers& buffers);
Contenders opencvCut(Size from, Size to, const Buffers& buffers);

}  // namespace bench
