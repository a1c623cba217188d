// Layouts of YUV and rotation, stated sample by sample.
#pragma once

#include <algorithm>
#include <array>

#include "tests/frames/reference.h"

namespace reference {

struct Order {
  unsigned luma, chroma;  // of each pair of bytes
};
inline constexpr Order kYuy2{0, 1}, kUyvy{1, 0};

enum class Turn { kClockwise, kAntiClockwise, kHalf, kUpDown, kLeftRight };

// Between places whose rows lie srcPitch and dstPitch bytes apart.
inline void copy(const Bytes& src, std::size_t from, std::size_t srcPitch, Bytes& dst, std::size_t to,
                 std::size_t dstPitch, Size s) {
  forEach(s,
          [&](std::size_t x, std::size_t y) { dst[to + y * dstPitch + x] = src[from + y * srcPitch + x]; });
}

inline std::size_t sameFrame(const Bytes& src, Bytes& dst, Size s, Size, unsigned) {
  for (std::size_t i = 0; i < s.i420(); ++i) dst[i] = src[i];
  return s.i420();
}

inline std::size_t exchangeChroma(const Bytes& src, Bytes& dst, Size s, Size, unsigned) {
  const std::size_t u = s.area(), v = vByArea(s);
  copy(src, 0, s.width, dst, 0, s.width, s);
  for (std::size_t i = 0; i < u / 4; ++i) dst[u + i] = src[v + i], dst[v + i] = src[u + i];
  return s.i420();
}

inline std::size_t planesApart(const Bytes& src, Bytes& dst, Size s, unsigned stride, std::size_t u,
                               std::size_t v) {
  copy(src, 0, s.width, dst, 0, stride, s);
  copy(src, s.area(), s.width / 2, dst, u, stride / 2, s.half());
  copy(src, vByArea(s), s.width / 2, dst, v, stride / 2, s.half());
  return std::size_t{stride} * s.height * 3 / 2;
}

inline std::size_t i420ToYv12(const Bytes& src, Bytes& dst, Size s, Size, unsigned stride) {
  const std::size_t v = std::size_t{stride} * s.height;
  return planesApart(src, dst, s, stride, v + std::size_t{s.height} * (stride / 2) / 2, v);
}

inline std::size_t i420ToI420(const Bytes& src, Bytes& dst, Size s, Size, unsigned stride) {
  const std::size_t result = std::size_t{s.height / 2} * stride * 3, u = std::size_t{stride} * s.height;
  if (stride == s.width) {
    for (std::size_t i = 0; i < result; ++i) dst[i] = src[i];
  } else {
    planesApart(src, dst, s, stride, u, u + std::size_t{s.height / 2} * (stride / 2));
  }
  return result;
}

inline std::size_t i420Centred(const Bytes& src, Bytes& dst, Size from, Size to, unsigned) {
  if (from == to) return i420ToI420(src, dst, from, to, to.width);
  const Axis x(from.width, to.width), y(from.height, to.height);
  const Size picture{x.count, y.count};
  const std::size_t half = from.width / 2, skip = y.skip / 2 * half + x.skip / 2;
  place(src, y.skip * from.width + x.skip, from.width, picture, dst, 0, to, x.margin, y.margin, 0);
  for (const auto& [source, target] : {std::pair{from.area(), to.area()}, {vByArea(from), vByArea(to)}}) {
    place(src, source + skip, half, picture.half(), dst, target, to.half(), x.margin / 2, y.margin / 2, 127);
  }
  return std::size_t{to.height / 2} * to.width * 3;
}

// Between planes and pairs of chroma.
template <bool kJoin, bool kVFirst>
std::size_t pairs(const Bytes& src, Bytes& dst, Size s, Size, unsigned) {
  copy(src, 0, s.width, dst, 0, s.width, s);
  for (std::size_t i = 0; i < s.area() / 4 * 2; ++i) {
    const std::size_t pair = s.area() + i, plane = i % 2 == (kVFirst ? 1 : 0) ? s.area() : vByArea(s);
    (kJoin ? dst[pair] : dst[plane + i / 2]) = kJoin ? src[plane + i / 2] : src[pair];
  }
  return s.i420();
}

inline void cropNv12(const Bytes& src, Size s, std::array<int, 4> ltrb, Bytes& dst) {
  const auto& [left, top, right, bottom] = ltrb;
  const int width = static_cast<int>(s.width), height = static_cast<int>(s.height);
  std::size_t to = 0;
  const auto take = [&, first = left, last = right](int row) {
    for (int x = first; x <= last; ++x) dst[to++] = src[static_cast<std::size_t>(row * width + x)];
  };
  for (int row = top; row <= bottom; ++row) take(row);
  for (int row = top / 2; row <= bottom / 2; ++row) {
    if (height > 1) take(height + (row < height / 2 ? row : row - 1));
  }
  while (height == 1 && to < dst.size()) dst[to++] = 128;
}

template <Order kOrder>
std::size_t pack(const Bytes& src, Bytes& dst, Size s, Size, unsigned stride) {
  forEach(s.even(), [&](std::size_t x, std::size_t y) {
    const std::size_t sample = y / 2 * (s.width / 2) + x / 2, to = (y * stride + x) * 2;
    dst[to + kOrder.luma] = src[y * s.width + x];
    dst[to + kOrder.chroma] = src[(x % 2 == 0 ? s.area() : vByRows(s)) + sample];
  });
  return std::size_t{stride} * s.height * 2;
}

template <Order kOrder, bool kAverage>
std::size_t unpack(const Bytes& src, Bytes& dst, Size s, Size, unsigned) {
  forEach(s.even(), [&](std::size_t x, std::size_t y) {
    const std::size_t from = (y * s.width + x) * 2;
    dst[y * s.width + x] = src[from + kOrder.luma];
    if (y % 2 != 0) return;
    const std::size_t to = (x % 2 == 0 ? s.area() : vByRows(s)) + y / 2 * (s.width / 2) + x / 2;
    const int a = src[from + kOrder.chroma], b = kAverage ? src[from + kOrder.chroma + s.width] : a;
    dst[to] = static_cast<std::uint8_t>((a + b + 1) / 2);
  });
  return std::size_t{s.height / 2} * s.width * 3;
}

template <Order kOrder, bool kInterlaced>
std::size_t unpackCentred(const Bytes& src, Bytes& dst, Size from, Size to, unsigned) {
  const Size half = to.half();
  const Axis x(from.width, to.width), y(from.height, to.height);
  const std::size_t skip = from.width > to.width ? from.width - to.width : 0, pairs = y.count / 2;
  const auto byteAt = [&](std::size_t row, std::size_t i) {
    return src[(y.skip + row) * 2 * from.width + skip + i];
  };
  // Places in the picture; outside of it they are beyond all counts.
  forEach(to, [&](std::size_t column, std::size_t line) {
    const std::size_t i = column - x.margin, row = line - y.margin;
    const bool alone = row < y.count && (pairs == 0 || (row / 2 == pairs && i < x.count));
    if (alone || (row < y.count && i < x.count && i / 2 == x.count / 2)) return;
    std::uint8_t luma = 0;
    if (row < y.count && i < x.count) {
      const bool between = kInterlaced && row % 2 != 0;
      const int field = byteAt(between ? row - 1 : row, 2 * i + kOrder.luma);
      const bool blended = between && row / 2 + 1 < pairs;
      luma =
          static_cast<std::uint8_t>((field + (blended ? byteAt(row + 1, 2 * i + kOrder.luma) : field)) / 2);
    }
    dst[line * to.width + column] = luma;
  });
  // Margins first, then pairs of rows downwards: where the planes overlap the last one wins.
  const std::size_t planes[] = {to.area(), kInterlaced ? vByRows(to) : vByArea(to)};
  for (const bool picture : {false, true}) {
    forEach({2 * half.width, half.height}, [&](std::size_t at, std::size_t line) {
      const std::size_t plane = at / half.width, column = at % half.width;
      const std::size_t i = column - x.margin / 2, pair = line - y.margin / 2;
      if (picture != (pair < pairs)) return;
      dst[planes[plane] + line * half.width + column] =
          picture && i < x.count / 2 ? byteAt(2 * pair, 4 * i + 2 * plane + kOrder.chroma) : 127;
    });
  }
  return to.i420();
}

inline Conversion turn(Turn turn, Chroma chroma) {
  return [=](const Bytes& src, Bytes& dst, Size whole, Size, unsigned) {
    // One plane: offset and distance in the source, place in the result.
    const auto plane = [&](std::size_t from, std::size_t step, std::size_t to, Size s) {
      const bool quarter = turn == Turn::kClockwise || turn == Turn::kAntiClockwise;
      const Size turned = quarter ? Size{s.height, s.width} : s;
      forEach(turned, [&](std::size_t x, std::size_t y) {
        std::size_t row = y, column = x;
        if (turn == Turn::kClockwise) row = s.height - 1 - x, column = y;
        if (turn == Turn::kAntiClockwise) row = x, column = s.width - 1 - y;
        if (turn == Turn::kHalf || turn == Turn::kUpDown) row = s.height - 1 - y;
        if (turn == Turn::kHalf || turn == Turn::kLeftRight) column = s.width - 1 - x;
        dst[to + y * turned.width + x] = src[from + (row * s.width + column) * step];
      });
    };
    const std::size_t first = whole.area(), second = vBySamples(whole);
    const bool pairs = chroma == Chroma::kUvPairs || chroma == Chroma::kVuPairs;
    const bool vFirst = chroma == Chroma::kVThenU || chroma == Chroma::kVuPairs;
    const std::size_t behind = pairs ? first + 1 : second, step = pairs ? 2 : 1;
    plane(0, 1, 0, whole);
    plane(vFirst ? behind : first, step, first, whole.half());
    plane(vFirst ? first : behind, step, second, whole.half());
    return turn == Turn::kHalf ? second + whole.half().area() : whole.i420();
  };
}

}  // namespace reference
