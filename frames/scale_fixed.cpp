#include <algorithm>
#include <cstring>
#include <memory>
#include <utility>

#include "frames/geometry.h"
#include "frames/kernels/scale.h"
#include "omxbridge/frames/scale.h"

namespace webrtc {
namespace {

using namespace detail;

// What the functions with a growing buffer ask of every source: memory, and a whole frame in it.
bool holdsFrame(const std::uint8_t* buffer, unsigned bufferSize, unsigned width, unsigned height) {
  return buffer != nullptr && addressable(width, height) &&
         bufferSize >= std::uint64_t{width} * height * 3 / 2;
}

// Enlarges planes row by row from the bottom, so that the destination may begin with the source.
class Enlarger {
 public:
  // group: samples, and rows, that get an average behind them.
  Enlarger(const ExpandRows& kernels, std::size_t group, std::size_t maxWidth)
      : _kernels(kernels),
        _group(group),
        _lineBytes(maxWidth + group),
        _lines(std::make_unique<std::uint8_t[]>((group + 1) * _lineBytes)) {}

  // Width and height are multiples of the group.
  void plane(const std::uint8_t* src, std::size_t width, std::size_t height, std::uint8_t* dst) {
    const std::size_t groups = width / _group, outWidth = groups * (_group + 1);
    // The row behind the group at hand, which is the row last taken from the group before.
    std::uint8_t* next = _lines.get() + _group * _lineBytes;
    takeRow(src + (height - 1) * width, width, next);
    for (std::size_t y = height; y > 0; y -= _group) {
      const std::size_t first = y - _group;
      for (std::size_t k = 0; k < _group; ++k) takeRow(src + (first + k) * width, width, line(k));
      std::uint8_t* to = dst + first / _group * (_group + 1) * outWidth;
      for (std::size_t k = 0; k < _group; ++k) _kernels.keep(line(k), to + k * outWidth, groups);
      _kernels.insert(line(_group - 1), next, to + _group * outWidth, groups);
      std::memcpy(next, line(0), _lineBytes);
    }
  }

 private:
  std::uint8_t* line(std::size_t k) { return _lines.get() + k * _lineBytes; }

  // The kernels look one group ahead: behind the row its last sample is repeated.
  void takeRow(const std::uint8_t* row, std::size_t width, std::uint8_t* line) const {
    std::memcpy(line, row, width);
    std::memset(line + width, row[width - 1], _group);
  }

  const ExpandRows& _kernels;
  std::size_t _group, _lineBytes;
  std::unique_ptr<std::uint8_t[]> _lines;
};

int enlarge(const ExpandRows& kernels, unsigned group, unsigned width, unsigned height, std::uint8_t*& buffer,
            unsigned bufferSize, unsigned& outWidth, unsigned& outHeight) {
  const std::uint64_t toWidth = std::uint64_t{width} / group * (group + 1);
  const std::uint64_t toHeight = std::uint64_t{height} / group * (group + 1);
  const int needed = frameBytes(toWidth, toHeight, 3, 2);
  if (needed == kRefused) return kRefused;

  Enlarger enlarger(kernels, group, width);
  std::unique_ptr<std::uint8_t[]> grown;
  const auto outBytes = static_cast<std::size_t>(needed);
  if (outBytes > bufferSize) grown.reset(new std::uint8_t[outBytes]);
  std::uint8_t* to = grown ? grown.get() : buffer;

  // Last plane first: in place, each lands behind what is still to be read.
  const std::size_t from = planeArea(width, height), toArea = static_cast<std::size_t>(toWidth * toHeight);
  enlarger.plane(buffer + from + from / 4, width / 2, height / 2, to + toArea + toArea / 4);
  enlarger.plane(buffer + from, width / 2, height / 2, to + toArea);
  enlarger.plane(buffer, width, height, to);
  if (grown) {
    delete[] buffer;
    buffer = grown.release();
  }
  outWidth = static_cast<unsigned>(toWidth);
  outHeight = static_cast<unsigned>(toHeight);
  return needed;
}

}  // namespace

int ScaleI420UpHalfFrame(unsigned int width, unsigned int height, unsigned char* buffer) {
  const int result = i420Bytes(width, height);
  if (width == 0 || height == 0 || result == kRefused) return kRefused;
  // Kept: neither rows nor planes are told apart, their edges run into each other.
  scaleKernels().doubleInPlace(buffer, planeArea(width, height) / 4 * 3);
  return result;
}

int ScaleI420DownHalfFrame(unsigned int width, unsigned int height, unsigned char* buffer) {
  const int result = frameBytes(width / 2, height, 3);
  if (width == 0 || height == 0 || result == kRefused) return kRefused;
  // Kept: input rows follow each other without the odd last byte, so each plane is one long row.
  const std::size_t luma = planeArea(width / 2, height);
  scaleKernels().halve(buffer, buffer, luma);
  scaleKernels().halve(buffer + planeArea(width, height), buffer + luma, planeArea(width / 4, height));
  return result;  // Kept: twice what was made. Callers divide by it.
}

int ScaleI420FrameQuarter(unsigned int width, unsigned int height, unsigned char* buffer) {
  const int result = frameBytes(width / 2, height, 3);
  if (width == 0 || height == 0 || result == kRefused) return kRefused;
  std::uint8_t* to = buffer;
  // Kept: the chroma planes count as one of height rows, whose middle pair may be a row of each.
  const auto plane = [&to, height](const std::uint8_t* from, std::size_t pitch, std::size_t columns) {
    if (columns == 0) return;  // or billions of rows without a byte would be walked over
    for (std::size_t pair = 0; pair < height / 2; ++pair, from += 2 * pitch, to += columns) {
      scaleKernels().quarter(from, from + pitch, to, columns);
    }
  };
  plane(buffer, width, width / 2);
  plane(buffer + planeArea(width, height), width / 2, width / 4);
  return result;
}

int ScaleI420Down1_3(unsigned int width, unsigned int height, unsigned char*& buffer, unsigned int bufferSize,
                     unsigned int& outWidth, unsigned int& outHeight) {
  if (width <= 5 || height <= 5 || width % 2 != 0 || height % 2 != 0 || height / 3 % 2 != 0) return kRefused;
  if (!holdsFrame(buffer, bufferSize, width, height)) return kRefused;
  const unsigned whole = width / 3, toWidth = whole + whole % 2, toHeight = height / 3;
  const int result = frameBytes(toWidth, toHeight, 3, 2);
  if (result == kRefused) return kRefused;

  std::uint8_t* to = buffer;  // the smaller frame always fits
  for (std::size_t row = 0; row < toHeight; ++row, to += toWidth) {
    const std::uint8_t *above = buffer + 3 * row * width, *below = above + width;
    scaleKernels().third(above, below, to, whole);
    if (whole != toWidth) to[whole] = static_cast<std::uint8_t>((above[width - 1] + below[width - 1]) / 2);
  }
  const std::size_t pitch = width / 2, columns = toWidth / 2;
  for (const std::size_t offset : {planeArea(width, height), thirdPlaneByArea(width, height)}) {
    for (std::size_t row = 0; row < toHeight / 2; ++row, to += columns) {
      const std::uint8_t* above = buffer + offset + 3 * row * pitch;
      scaleKernels().third(above, above + pitch, to, columns);
    }
  }
  outWidth = toWidth;
  outHeight = toHeight;
  return result;
}

int ScaleI420Up3_2(unsigned int width, unsigned int height, unsigned char*& buffer, unsigned int bufferSize,
                   unsigned int& outWidth, unsigned int& outHeight) {
  if (width == 0 || height == 0 || width % 4 != 0 || height % 4 != 0) return kRefused;
  if (!holdsFrame(buffer, bufferSize, width, height)) return kRefused;
  return enlarge(scaleKernels().byThreeHalves, 2, width, height, buffer, bufferSize, outWidth, outHeight);
}

int ScaleI420Up2(unsigned int width, unsigned int height, unsigned char*& buffer, unsigned int bufferSize,
                 unsigned int& outWidth, unsigned int& outHeight) {
  if (width == 0 || height == 0 || width % 2 != 0 || height % 2 != 0) return kRefused;
  if (!holdsFrame(buffer, bufferSize, width, height)) return kRefused;
  return enlarge(scaleKernels().byTwo, 1, width, height, buffer, bufferSize, outWidth, outHeight);
}

}  // namespace webrtc
