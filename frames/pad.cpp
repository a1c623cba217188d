#include "omxbridge/frames/pad.h"

#include <cstring>
#include <limits>

#include "frames/borders.h"
#include "frames/geometry.h"

namespace webrtc {
namespace {

using namespace detail;

// Half of an excess; of a multiple of 16, rounded down to one.
unsigned margin(unsigned excess) {
  return excess % 16 != 0 ? excess / 2 : excess / 32 * 16;
}

int pad320x240(const std::uint8_t* src, std::uint8_t* dst) {
  const BorderedPlane y{dst, 352, 288, 16, 16, 320, 240, kFillLuma};
  const BorderedPlane u{dst + y.bytes(), 176, 144, 8, 8, 160, 120, kFillChroma};
  BorderedPlane v = u;
  v.data += u.bytes();
  y.place(src, 320);
  u.place(src + 320 * 240, 160);
  v.fillAboveAndBelow();
  for (std::size_t row = 0; row < v.rows; ++row) {
    if (row != 0) {
      v.fillLeft(row);
    } else {
      // Kept: the margin of the first V row ends four bytes early. Callers compare frames byte for byte.
      std::memset(v.row(row) - v.left, v.fill, v.left - 4);
    }
    std::memcpy(v.row(row), src + 320 * 240 / 4 * 5 + row * 160, 160);
    v.fillRight(row);
  }
  return 152064;
}

int pad160x120(const std::uint8_t* src, std::uint8_t* dst) {
  const BorderedPlane y{dst, 176, 144, 0, 16, 160, 112, kFillLuma};
  const BorderedPlane u{dst + y.bytes(), 88, 72, 0, 8, 80, 56, kFillChroma};
  BorderedPlane v = u;
  v.data += u.bytes();
  const std::uint8_t* chroma = src + 160 * 120 + 2 * 80;
  y.place(src + 4 * 160, 160);
  u.place(chroma, 80);
  v.place(chroma + 160 * 120 / 4, 80);
  return 38016;
}

}  // namespace

int PadI420Frame(unsigned int size, const unsigned char* src, unsigned char* dst, bool block) {
  if (!block) return kRefused;
  switch (size) {
    case 115200:
      return pad320x240(src, dst);
    case 28800:
      return pad160x120(src, dst);
    default:
      return kRefused;
  }
}

int PadI420Frame(const unsigned char* src, unsigned char* dst, unsigned int srcWidth, unsigned int srcHeight,
                 unsigned int dstWidth, unsigned int dstHeight) {
  if (srcWidth == 0 || srcHeight == 0 || dstWidth == 0 || dstHeight == 0) return kRefused;
  if (srcWidth == dstWidth && srcHeight == dstHeight) return i420Bytes(dstWidth, dstHeight);
  if (src == nullptr || dst == nullptr || dstWidth < srcWidth || dstHeight < srcHeight) return kRefused;
  if (i420Bytes(dstWidth, dstHeight) == kRefused) return kRefused;

  const unsigned padWidth = dstWidth - srcWidth, padHeight = dstHeight - srcHeight;
  const unsigned left = margin(padWidth), top = margin(padHeight);
  const BorderedPlane y{dst, dstWidth, dstHeight, left, top, srcWidth, srcHeight, kFillLuma};
  // Half of every quantity: two odd ones make the planes smaller than half the frame.
  const unsigned columns = srcWidth / 2, rows = srcHeight / 2;
  const BorderedPlane u{
      dst + y.bytes(), columns + padWidth / 2, rows + padHeight / 2, left / 2, top / 2, columns, rows,
      kFillChroma};
  BorderedPlane v = u;
  v.data += u.bytes();
  y.place(src, srcWidth);
  u.place(src + planeArea(srcWidth, srcHeight), columns);
  v.place(src + thirdPlaneBySamples(srcWidth, srcHeight), columns);
  return static_cast<int>(y.bytes() + 2 * u.bytes());
}

int PadI420BottomRows(unsigned char* buffer, unsigned int size, unsigned int width, unsigned int height,
                      int nrRows, unsigned int& outSize) {
  if (nrRows < 0) return kRefused;
  const std::uint64_t added = static_cast<std::uint64_t>(nrRows), newHeight = height + added;
  // Both factors are below 2^33; larger products are refused before the multiplication by three.
  constexpr std::uint64_t kMax = std::numeric_limits<std::uint32_t>::max();
  const std::uint64_t newArea = width * newHeight;
  if (newArea > kMax) return kRefused;
  const std::uint64_t newSize = newHeight * (width / 2) * 3;
  const std::uint64_t oldY = std::uint64_t{width} * height, extra = width * added, q = oldY / 4;
  // For an odd width the new size leaves a column out that is moved all the same.
  const std::uint64_t end = newArea + newArea / 4 + q + extra / 4;
  if (newSize > size || end > size) return kRefused;

  // V before U: neither lands on what has not been moved yet. All of it is within the buffer.
  const auto chroma = static_cast<std::size_t>(q), fill = static_cast<std::size_t>(extra);
  std::uint8_t *from = buffer + oldY, *u = buffer + newArea, *v = u + newArea / 4;
  std::memmove(v, from + chroma, chroma);
  std::memset(v + chroma, kFillChroma, fill / 4);
  std::memmove(u, from, chroma);
  std::memset(u + chroma, kFillChroma, fill / 4);
  std::memset(from, kFillLuma, fill);
  outSize = static_cast<unsigned>(newSize);
  return 0;
}

int CutI420Frame(unsigned char* frame, unsigned int fromWidth, unsigned int fromHeight, unsigned int toWidth,
                 unsigned int toHeight) {
  if (fromWidth == 0 || fromHeight == 0 || toWidth == 0 || toHeight == 0) return kRefused;
  if (fromWidth == toWidth && fromHeight == toHeight) return i420Bytes(toWidth, toHeight);
  if (toWidth > fromWidth || toHeight > fromHeight) return kRefused;
  const int result = frameBytes(toWidth / 2, toHeight, 3);
  if (result == kRefused || !addressable(fromWidth, fromHeight)) return kRefused;

  // Rows overlap where they come from. The destination is never behind the source, so first to last.
  const auto cut = [](std::uint8_t* to, const std::uint8_t* from, std::size_t pitch, std::size_t columns,
                      std::size_t rows) {
    for (std::size_t r = 0; r < rows; ++r) std::memmove(to + r * columns, from + r * pitch, columns);
  };
  const std::size_t x = fromWidth - toWidth, y = (fromHeight - toHeight) / 2;
  const std::size_t toArea = planeArea(toWidth, toHeight), pitch = fromWidth / 2;
  cut(frame, frame + fromWidth * y + x / 2, fromWidth, toWidth, toHeight);
  if (toHeight < 2) return result;
  // Kept: half of the bytes above the picture, not of the rows: for an odd y the middle of a chroma row.
  const std::size_t offset = x / 4 + pitch * y / 2;
  cut(frame + toArea, frame + planeArea(fromWidth, fromHeight) + offset, pitch, toWidth / 2, toHeight / 2);
  cut(frame + toArea + planeArea(toWidth / 2, toHeight / 2),
      frame + thirdPlaneBySamples(fromWidth, fromHeight) + offset, pitch, toWidth / 2, toHeight / 2);
  return result;
}

}  // namespace webrtc
