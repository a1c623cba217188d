#include "omxbridge/frames/rotate.h"

#include <algorithm>
#include <cstring>

#include "frames/geometry.h"
#include "frames/kernels/planes.h"

namespace webrtc {
namespace {

using namespace detail;

enum class Layout { kI420, kYv12, kNv12, kNv21 };
enum class Turn { kClockwise, kAntiClockwise };

bool isSemiPlanar(Layout layout) {
  return layout == Layout::kNv12 || layout == Layout::kNv21;
}
bool startsWithV(Layout layout) {
  return layout == Layout::kYv12 || layout == Layout::kNv21;
}

// For the functions that take a type; false for the types that they refuse.
bool layoutOf(VideoType type, Layout& layout) {
  layout = type == kYV12 ? Layout::kYv12 : Layout::kI420;
  return type == kI420 || type == kYV12;
}

// The samples of a plane: step bytes apart, the first one offset bytes from data. The kernels expect data.
struct SourcePlane {
  const std::uint8_t* data;
  std::size_t step, offset;
  const Transposition* kernels;
};

// index 0: the plane, or byte of each pair, that comes first in the source.
SourcePlane chromaOf(Layout layout, const std::uint8_t* src, unsigned width, unsigned height, int index) {
  const PlaneKernels& kernels = planeKernels();
  const std::uint8_t* first = src + planeArea(width, height);
  if (isSemiPlanar(layout)) {
    return index == 0 ? SourcePlane{first, 2, 0, &kernels.transposeFirst}
                      : SourcePlane{first, 2, 1, &kernels.transposeSecond};
  }
  return {index == 0 ? first : src + thirdPlaneBySamples(width, height), 1, 0, &kernels.transpose};
}

// The tiles along an axis of n samples: side by side, the last one moved back to end with the axis.
template <class Visit>
void eachTile(std::size_t n, std::size_t tile, const Visit& visit) {
  for (std::size_t at = 0; at < n; at += tile) visit(std::min(at, n - tile));
}

void transposeTiles(TransposeTile kernel, std::size_t tileColumns, std::size_t tileRows,
                    const std::uint8_t* src, std::size_t step, std::ptrdiff_t srcPitch, std::uint8_t* dst,
                    std::ptrdiff_t dstPitch, std::size_t columns, std::size_t rows) {
  eachTile(columns, tileColumns, [&](std::size_t c) {
    eachTile(rows, tileRows, [&](std::size_t r) {
      kernel(src + static_cast<std::ptrdiff_t>(r) * srcPitch + c * step, srcPitch,
             dst + static_cast<std::ptrdiff_t>(c) * dstPitch + r, dstPitch);
    });
  });
}

// A plane of columns x rows samples becomes one of rows x columns.
void turnPlane(const SourcePlane& plane, std::size_t columns, std::size_t rows, std::uint8_t* dst,
               Turn turn) {
  if (columns == 0 || rows == 0) return;
  // Both turns are transpositions: clockwise with the source's rows from the bottom, the other way with the
  // destination's.
  const std::uint8_t* src = plane.data;
  auto srcPitch = static_cast<std::ptrdiff_t>(columns * plane.step),
       dstPitch = static_cast<std::ptrdiff_t>(rows);
  if (turn == Turn::kClockwise) {
    src += (rows - 1) * columns * plane.step;
    srcPitch = -srcPitch;
  } else {
    dst += (columns - 1) * rows;
    dstPitch = -dstPitch;
  }

  const PlaneKernels& kernels = planeKernels();
  if (columns >= kernels.largeColumns && rows >= kernels.largeRows) {
    transposeTiles(plane.kernels->large, kernels.largeColumns, kernels.largeRows, src, plane.step, srcPitch,
                   dst, dstPitch, columns, rows);
  } else if (columns >= kSmallTile && rows >= kSmallTile) {
    transposeTiles(plane.kernels->small, kSmallTile, kSmallTile, src, plane.step, srcPitch, dst, dstPitch,
                   columns, rows);
  } else {
    src += plane.offset;
    for (std::size_t r = 0; r < rows; ++r) {
      for (std::size_t c = 0; c < columns; ++c) {
        dst[static_cast<std::ptrdiff_t>(c) * dstPitch + static_cast<std::ptrdiff_t>(r)] =
            src[static_cast<std::ptrdiff_t>(r) * srcPitch + static_cast<std::ptrdiff_t>(c * plane.step)];
      }
    }
  }
}

int turnFrame(Layout layout, Turn turn, const std::uint8_t* src, unsigned width, unsigned height,
              std::uint8_t* dst) {
  const int result = i420Bytes(width, height);
  if (width == 0 || height == 0 || result == kRefused) return kRefused;
  turnPlane({src, 1, 0, &planeKernels().transpose}, width, height, dst, turn);
  const int uIndex = startsWithV(layout) ? 1 : 0;
  turnPlane(chromaOf(layout, src, width, height, uIndex), width / 2, height / 2,
            dst + planeArea(width, height), turn);
  turnPlane(chromaOf(layout, src, width, height, 1 - uIndex), width / 2, height / 2,
            dst + thirdPlaneBySamples(width, height), turn);
  return result;
}

int reverseFrame(Layout layout, const std::uint8_t* src, unsigned width, unsigned height, std::uint8_t* dst) {
  if (width == 0 || height == 0 || i420Bytes(width, height) == kRefused) return kRefused;
  const PlaneKernels& kernels = planeKernels();
  const std::size_t area = planeArea(width, height), samples = planeArea(width / 2, height / 2);
  std::uint8_t *first = dst + area, *second = first + samples;
  if (startsWithV(layout)) std::swap(first, second);
  kernels.reverse(src, dst, area);
  if (isSemiPlanar(layout)) {
    kernels.splitReversed(src + area, first, second, samples);
  } else {
    kernels.reverse(src + area, first, samples);
    kernels.reverse(src + area + samples, second, samples);
  }
  return static_cast<int>(area + 2 * samples);
}

int turnTyped(VideoType type, Turn turn, const std::uint8_t* src, unsigned srcWidth, unsigned srcHeight,
              std::uint8_t* dst, unsigned dstWidth, unsigned dstHeight) {
  Layout layout;
  if (!layoutOf(type, layout) || dstWidth != srcHeight || dstHeight != srcWidth) return kRefused;
  return turnFrame(layout, turn, src, srcWidth, srcHeight, dst);
}

// Applies plane(src, dst, columns, rows) to each plane of an I420 frame.
template <class Plane>
int mirrorFrame(const std::uint8_t* src, std::uint8_t* dst, unsigned width, unsigned height,
                const Plane& plane) {
  const int result = i420Bytes(width, height);
  if (width == 0 || height == 0 || result == kRefused) return kRefused;
  plane(src, dst, width, height);
  for (const std::size_t offset : {planeArea(width, height), thirdPlaneBySamples(width, height)}) {
    plane(src + offset, dst + offset, width / 2, height / 2);
  }
  return result;
}

}  // namespace

int ConvertToI420AndRotateClockwise(const unsigned char* src, unsigned int srcWidth, unsigned int srcHeight,
                                    unsigned char* dst, unsigned int dstWidth, unsigned int dstHeight,
                                    VideoType type) {
  return turnTyped(type, Turn::kClockwise, src, srcWidth, srcHeight, dst, dstWidth, dstHeight);
}

int ConvertToI420AndRotateAntiClockwise(const unsigned char* src, unsigned int srcWidth,
                                        unsigned int srcHeight, unsigned char* dst, unsigned int dstWidth,
                                        unsigned int dstHeight, VideoType type) {
  return turnTyped(type, Turn::kAntiClockwise, src, srcWidth, srcHeight, dst, dstWidth, dstHeight);
}

int ConvertToI420AndMirrorUpDown(const unsigned char* src, unsigned char* dst, unsigned int width,
                                 unsigned int height, VideoType type) {
  Layout layout;
  return layoutOf(type, layout) ? reverseFrame(layout, src, width, height, dst) : kRefused;
}

int ConvertNV12ToI420AndRotateClockwise(const unsigned char* src, unsigned char* dst, unsigned int width,
                                        unsigned int height) {
  return turnFrame(Layout::kNv12, Turn::kClockwise, src, width, height, dst);
}

int ConvertNV12ToI420AndRotateAntiClockwise(const unsigned char* src, unsigned char* dst, unsigned int width,
                                            unsigned int height) {
  return turnFrame(Layout::kNv12, Turn::kAntiClockwise, src, width, height, dst);
}

int ConvertNV12ToI420AndRotate180(const unsigned char* src, unsigned char* dst, unsigned int width,
                                  unsigned int height) {
  return reverseFrame(Layout::kNv12, src, width, height, dst);
}

int ConvertNV21ToI420AndRotateClockwise(const unsigned char* src, unsigned char* dst, unsigned int width,
                                        unsigned int height) {
  return turnFrame(Layout::kNv21, Turn::kClockwise, src, width, height, dst);
}

int ConvertNV21ToI420AndRotateAntiClockwise(const unsigned char* src, unsigned char* dst, unsigned int width,
                                            unsigned int height) {
  return turnFrame(Layout::kNv21, Turn::kAntiClockwise, src, width, height, dst);
}

int ConvertNV21ToI420AndRotate180(const unsigned char* src, unsigned char* dst, unsigned int width,
                                  unsigned int height) {
  return reverseFrame(Layout::kNv21, src, width, height, dst);
}

int MirrorI420UpDown(const unsigned char* src, unsigned char* dst, unsigned int width, unsigned int height) {
  const auto plane = [](const std::uint8_t* from, std::uint8_t* to, std::size_t columns, std::size_t rows) {
    for (std::size_t r = 0; r < rows; ++r) {
      std::memcpy(to + r * columns, from + (rows - 1 - r) * columns, columns);
    }
  };
  return mirrorFrame(src, dst, width, height, plane);
}

int MirrorI420LeftRight(const unsigned char* src, unsigned char* dst, unsigned int width,
                        unsigned int height) {
  const auto plane = [](const std::uint8_t* from, std::uint8_t* to, std::size_t columns, std::size_t rows) {
    for (std::size_t r = 0; r < rows; ++r) {
      planeKernels().reverse(from + r * columns, to + r * columns, columns);
    }
  };
  return mirrorFrame(src, dst, width, height, plane);
}

}  // namespace webrtc
