// Layouts of YUV and rotation, stated sample by sample.
#pragma once

#include <algorithm>

#include "tests/frames/reference.h"

namespace reference {

struct Order {
  unsigned luma, chroma;  // of each pair of bytes
};
inline constexpr Order kYuy2{0, 1}, kUyvy{1, 0};

enum class Turn { kClockwise, kAntiClockwise, kHalf, kUpDown, kLeftRight };
enum class Chroma { kUThenV, kVThenU, kUvPairs, kVuPairs };

// rows x columns bytes between places that lie srcPitch and dstPitch bytes apart per row.
inline void copy(const Bytes& src, std::size_t from, std::size_t srcPitch, Bytes& dst, std::size_t to,
                 std::size_t dstPitch, std::size_t columns, std::size_t rows) {
  for (std::size_t r = 0; r < rows; ++r) {
    for (std::size_t c = 0; c < columns; ++c) dst[to + r * dstPitch + c] = src[from + r * srcPitch + c];
  }
}

inline void fill(Bytes& dst, std::size_t from, std::size_t n, std::uint8_t value) {
  for (std::size_t i = 0; i < n; ++i) dst[from + i] = value;
}

inline std::size_t vByArea(Size s) {
  return s.area() + s.area() / 4;
}
inline std::size_t vByRows(Size s) {
  return std::size_t{s.width} * (s.height + s.height / 4);
}
inline std::size_t vBySamples(Size s) {
  return s.area() + std::size_t{s.width / 2} * (s.height / 2);
}

inline void exchangeChroma(const Bytes& src, Bytes& dst, Size s) {
  copy(src, 0, 0, dst, 0, 0, s.area(), 1);
  copy(src, s.area(), 0, dst, vByArea(s), 0, s.area() / 4, 1);
  copy(src, vByArea(s), 0, dst, s.area(), 0, s.area() / 4, 1);
}

inline void planesApart(const Bytes& src, Bytes& dst, Size s, unsigned stride, std::size_t u, std::size_t v) {
  copy(src, 0, s.width, dst, 0, stride, s.width, s.height);
  copy(src, s.area(), s.width / 2, dst, u, stride / 2, s.width / 2, s.height / 2);
  copy(src, vByArea(s), s.width / 2, dst, v, stride / 2, s.width / 2, s.height / 2);
}

inline void i420ToYv12(const Bytes& src, Bytes& dst, Size s, unsigned stride) {
  const std::size_t v = std::size_t{stride} * s.height, u = v + std::size_t{s.height} * (stride / 2) / 2;
  planesApart(src, dst, s, stride, u, v);
}

inline void i420ToI420(const Bytes& src, Bytes& dst, Size s, unsigned stride) {
  if (stride == s.width) return copy(src, 0, 0, dst, 0, 0, std::size_t{s.height / 2} * s.width * 3, 1);
  const std::size_t u = std::size_t{stride} * s.height, v = u + std::size_t{s.height / 2} * (stride / 2);
  planesApart(src, dst, s, stride, u, v);
}

inline void i420Centred(const Bytes& src, Size from, Bytes& dst, Size to) {
  if (from.width == to.width && from.height == to.height) return i420ToI420(src, dst, from, from.width);
  const Axis x(from.width, to.width), y(from.height, to.height);
  fill(dst, 0, to.area(), 0);
  copy(src, y.skip * from.width + x.skip, from.width, dst, y.margin * to.width + x.margin, to.width, x.count,
       y.count);
  const unsigned fromW = from.width / 2, toW = to.width / 2;
  const std::size_t columns = std::min(fromW, toW), rows = std::min(from.height / 2, to.height / 2);
  for (const bool v : {false, true}) {
    const std::size_t source = v ? vByArea(from) : from.area(), target = v ? vByArea(to) : to.area();
    fill(dst, target, std::size_t{toW} * (to.height / 2), 127);
    copy(src, source + y.skip / 2 * fromW + x.skip / 2, fromW, dst,
         target + y.margin / 2 * toW + x.margin / 2, toW, columns, rows);
  }
}

// Between planes and pairs of chroma.
inline void pairs(bool join, bool vFirst, const Bytes& src, Bytes& dst, Size s) {
  copy(src, 0, 0, dst, 0, 0, s.area(), 1);
  for (std::size_t i = 0; i < s.area() / 4 * 2; ++i) {
    const std::size_t pair = s.area() + i, plane = i % 2 == (vFirst ? 1 : 0) ? s.area() : vByArea(s);
    (join ? dst[pair] : dst[plane + i / 2]) = join ? src[plane + i / 2] : src[pair];
  }
}

inline void cropNv12(const Bytes& src, Size s, std::array<int, 4> ltrb, Bytes& dst) {
  const int left = ltrb[0], top = ltrb[1], right = ltrb[2], bottom = ltrb[3];
  const int width = static_cast<int>(s.width), height = static_cast<int>(s.height);
  std::size_t to = 0;
  const auto take = [&](int row) {
    for (int x = left; x <= right; ++x) dst[to++] = src[static_cast<std::size_t>(row * width + x)];
  };
  for (int row = top; row <= bottom; ++row) take(row);
  for (int row = top / 2; row <= bottom / 2; ++row) {
    if (height > 1) take(height + (row < height / 2 ? row : row - 1));
  }
  while (height == 1 && to < dst.size()) dst[to++] = 128;
}

inline void pack(Order order, const Bytes& src, Bytes& dst, Size s, unsigned stride) {
  for (std::size_t row = 0; row < s.height / 2 * 2; ++row) {
    for (std::size_t x = 0; x < s.width / 2 * 2; ++x) {
      const std::size_t sample = row / 2 * (s.width / 2) + x / 2, to = (row * stride + x) * 2;
      dst[to + order.luma] = src[row * s.width + x];
      dst[to + order.chroma] = src[(x % 2 == 0 ? s.area() : vByRows(s)) + sample];
    }
  }
}

inline void unpack(Order order, bool average, const Bytes& src, Bytes& dst, Size s) {
  for (std::size_t row = 0; row < s.height / 2 * 2; ++row) {
    for (std::size_t x = 0; x < s.width / 2 * 2; ++x) {
      const std::size_t from = (row * s.width + x) * 2;
      dst[row * s.width + x] = src[from + order.luma];
      if (row % 2 != 0) continue;
      const std::size_t to = (x % 2 == 0 ? s.area() : vByRows(s)) + row / 2 * (s.width / 2) + x / 2;
      const int a = src[from + order.chroma], b = average ? src[from + order.chroma + s.width] : a;
      dst[to] = static_cast<std::uint8_t>((a + b + 1) / 2);
    }
  }
}

inline void unpackCentred(Order order, bool interlaced, const Bytes& src, Size from, Bytes& dst, Size to) {
  const Axis x(from.width, to.width), y(from.height, to.height);
  const std::size_t u = to.area(), v = interlaced ? vByRows(to) : vByArea(to);
  const std::size_t width = to.width / 2, height = to.height / 2;
  fill(dst, 0, y.margin * to.width, 0);
  fill(dst, (y.margin + y.count) * to.width, (to.height - y.margin - y.count) * to.width, 0);
  for (const std::size_t plane : {u, v}) {
    const std::size_t above = y.margin / 2, end = above + y.count / 2;
    fill(dst, plane, above * width, 127);
    fill(dst, plane + end * width, (height - end) * width, 127);
  }
  if (y.count < 2) return;
  const std::size_t skip = from.width > to.width ? from.width - to.width : 0, pitch = 2 * from.width;
  const auto byteAt = [&](std::size_t row, std::size_t i) { return src[(y.skip + row) * pitch + skip + i]; };
  for (std::size_t row = 0; row < y.count; ++row) {
    const std::size_t start = (y.margin + row) * to.width, after = x.margin + x.count;
    fill(dst, start, x.margin, 0);
    fill(dst, start + after, to.width - after, 0);
    if (row >= y.count / 2 * 2) continue;
    const std::size_t pair = row / 2, last = y.count / 2 - 1;
    for (std::size_t i = 0; i < x.count / 2 * 2; ++i) {
      std::uint8_t luma = byteAt(row, 2 * i + order.luma);
      if (interlaced && row % 2 != 0) {
        const int field = byteAt(row - 1, 2 * i + order.luma);
        const int below = pair == last ? field : byteAt(row + 1, 2 * i + order.luma);
        luma = static_cast<std::uint8_t>((field + below) / 2);
      }
      dst[start + x.margin + i] = luma;
    }
    if (row % 2 != 0) continue;
    for (const bool isV : {false, true}) {
      const std::size_t to2 = (isV ? v : u) + (y.margin / 2 + pair) * width, left = x.margin / 2;
      fill(dst, to2, left, 127);
      fill(dst, to2 + left + x.count / 2, width - left - x.count / 2, 127);
      for (std::size_t i = 0; i < x.count / 2; ++i) {
        dst[to2 + left + i] = byteAt(row, 4 * i + (isV ? 2 : 0) + order.chroma);
      }
    }
  }
}

inline void turn(Turn turn, Chroma chroma, const Bytes& src, Bytes& dst, Size s) {
  // One plane of w x h samples: offset and distance in the source, place in the result.
  const auto plane = [&](std::size_t from, std::size_t step, std::size_t to, std::size_t w, std::size_t h) {
    const bool quarter = turn == Turn::kClockwise || turn == Turn::kAntiClockwise;
    const std::size_t rows = quarter ? w : h, columns = quarter ? h : w;
    for (std::size_t i = 0; i < rows; ++i) {
      for (std::size_t j = 0; j < columns; ++j) {
        std::size_t row = i, column = j;
        if (turn == Turn::kClockwise) row = h - 1 - j, column = i;
        if (turn == Turn::kAntiClockwise) row = j, column = w - 1 - i;
        if (turn == Turn::kHalf || turn == Turn::kUpDown) row = h - 1 - i;
        if (turn == Turn::kHalf || turn == Turn::kLeftRight) column = w - 1 - j;
        dst[to + i * columns + j] = src[from + (row * w + column) * step];
      }
    }
  };
  const std::size_t w = s.width / 2, h = s.height / 2, first = s.area(), second = vBySamples(s);
  plane(0, 1, 0, s.width, s.height);
  const bool pairs = chroma == Chroma::kUvPairs || chroma == Chroma::kVuPairs;
  const bool vFirst = chroma == Chroma::kVThenU || chroma == Chroma::kVuPairs;
  const std::size_t behind = pairs ? first + 1 : second, step = pairs ? 2 : 1;
  plane(vFirst ? behind : first, step, first, w, h);
  plane(vFirst ? first : behind, step, second, w, h);
}

}  // namespace reference
