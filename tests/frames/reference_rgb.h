// Conversions to and from RGB, stated sample by sample.
#pragma once

#include <algorithm>

#include "tests/frames/reference.h"

namespace reference {

struct Components {
  int r, g, b;  // on the way to RGB: before clamping
};

using Pixel = void (*)(const Components& c, std::uint8_t* to);

enum class Rows { kTopDown, kBottomUp, kHalfStride };

enum class Rgb { k24, kMac, k565 };

inline unsigned clamped(int v) {
  return static_cast<unsigned>(std::clamp(v, 0, 255));
}

inline void word(unsigned value, std::uint8_t* to) {
  to[0] = static_cast<std::uint8_t>(value);
  to[1] = static_cast<std::uint8_t>(value >> 8);
}

inline Components load(Rgb layout, const Bytes& src, std::size_t pixel) {
  const std::size_t at = pixel * (layout == Rgb::k24 ? 3 : layout == Rgb::kMac ? 4 : 2);
  if (layout == Rgb::k24) return {src[at + 2], src[at + 1], src[at]};
  if (layout == Rgb::kMac) return {src[at + 1], src[at + 2], src[at + 3]};
  const int w = src[at] + 256 * src[at + 1];
  return {w / 2048 * 8, w / 32 % 64 * 4, w % 32 * 8};
}

inline std::uint8_t yOf(Components c) {
  return static_cast<std::uint8_t>(((66 * c.r + 129 * c.g + 25 * c.b + 128) >> 8) + 16);
}
inline std::uint8_t uOf(Components c) {
  return static_cast<std::uint8_t>(((-38 * c.r - 74 * c.g + 112 * c.b + 128) >> 8) + 128);
}
inline std::uint8_t vOf(Components c) {
  return static_cast<std::uint8_t>(((112 * c.r - 94 * c.g - 18 * c.b + 128) >> 8) + 128);
}

inline Components sumsOf(int y, int u, int v) {
  const int luma = 298 * (y - 16);
  return {(luma + 409 * (v - 128) + 128) >> 8, (luma - 100 * (u - 128) + 128 - 208 * (v - 128)) >> 8,
          (luma + 516 * (u - 128) + 128) >> 8};
}

inline void bgra(const Components& s, std::uint8_t* to) {
  const unsigned bytes[] = {clamped(s.b), clamped(s.g), clamped(s.r), 255};
  std::copy_n(bytes, 4, to);
}
inline void argb(const Components& s, std::uint8_t* to) {
  bgra(s, to);
  std::reverse(to, to + 4);
}
inline void rgba(const Components& s, std::uint8_t* to) {
  bgra(s, to);
  std::swap(to[0], to[2]);
}

inline void word565(const Components& s, std::uint8_t* to) {
  word((clamped(s.r) & 0xF8) << 8 | (clamped(s.g) & 0xFC) << 3 | clamped(s.b) >> 3, to);
}

inline void word4444(const Components& s, std::uint8_t* to) {
  word(0xF000 | (clamped(s.r) >> 4) << 8 | (clamped(s.g) >> 4) << 4 | clamped(s.b) >> 4, to);
}

inline void word1555(const Components& s, std::uint8_t* to) {
  const unsigned red = s.r < 0     ? 0x8000
                       : s.r > 255 ? 0x6000
                                   : (((static_cast<unsigned>(s.r) & 0xF8) << 10) - 0x8000) & 0xFFFF;
  word(red + ((clamped(s.g) & 0xF8) << 3) + (clamped(s.b) >> 3), to);
}

template <Pixel kPixel, unsigned kBytes, Rows kRows, Chroma kChroma = Chroma::kUThenV,
          bool kStrideMovesRows = true>
std::size_t toRgb(const Bytes& src, Bytes& dst, Size s, Size, unsigned stride) {
  const std::size_t pitch = kStrideMovesRows ? stride : s.width;
  forEach(s.even(), [&](std::size_t x, std::size_t row) {
    const std::size_t pair = row / 2;
    std::size_t start = row * pitch;
    if (kRows == Rows::kBottomUp) start = (s.height - 1 - row) * pitch;
    if (kRows == Rows::kHalfStride) start = pair * (s.width + stride) + row % 2 * stride;
    const std::size_t y = pair * (s.even().width + s.width) + row % 2 * s.width + x;
    const std::size_t sample = pair * (s.width / 2) + x / 2;
    std::size_t u = s.area() + sample, v = s.area() + s.area() / 4 + sample;
    if (kChroma == Chroma::kVThenU) std::swap(u, v);
    if (kChroma == Chroma::kUvPairs) u = s.area() + 2 * sample, v = u + 1;
    std::uint8_t pixel[4];
    kPixel(sumsOf(src[y], src[u], src[v]), pixel);
    for (std::size_t k = 0; k < kBytes; ++k) dst[(start + x) * kBytes + k] = pixel[k];
  });
  return std::size_t{stride} * s.height * kBytes;
}

inline std::size_t rgb24ToArgb(const Bytes& src, Bytes& dst, Size s, Size, unsigned stride) {
  const std::size_t last = std::size_t{s.height - 1} * stride;
  forEach(s, [&](std::size_t x, std::size_t y) {
    const std::size_t at = (last - y * (stride - s.width) + x) * 4;
    for (std::size_t k = 0; k < 3; ++k) dst[at + k] = src[(y * s.width + x) * 3 + k];
    dst[at + 3] = 255;
  });
  return std::size_t{stride} * s.height * 4;
}

template <Rgb kLayout>
std::size_t fromRgb(const Bytes& src, Bytes& dst, Size s, Size, unsigned) {
  forEach(s.even(), [&](std::size_t x, std::size_t y) {
    const Components c = load(kLayout, src, y * s.width + x);
    dst[y * s.width + x] = yOf(c);
    if (y % 2 != 0 || x % 2 != 0) return;
    const std::size_t sample = y / 2 * (s.width / 2) + x / 2;
    dst[s.area() + sample] = uOf(c);
    dst[vByArea(s) + sample] = vOf(c);
  });
  return s.i420();
}

inline std::size_t rgb24Centred(const Bytes& src, Bytes& dst, Size from, Size to, unsigned) {
  const Axis x(from.width, to.width), y(from.height, to.height);
  fill(dst, 0, to.area(), 0);
  for (const std::size_t plane : {to.area(), vByArea(to)}) fill(dst, plane, to.half().area(), 127);
  forEach(Size{x.count, y.count}.even(), [&](std::size_t column, std::size_t i) {
    // Bottom-up: the first source rows are the last of the picture.
    const std::size_t row = y.margin + y.count - 1 - i;
    const Components c = load(Rgb::k24, src, (y.skip + i) * from.width + x.skip + column);
    dst[row * to.width + x.margin + column] = yOf(c);
    if (i % 2 == 0 || column % 2 != 0) return;
    const std::size_t chromaRow = y.margin / 2 + y.count / 2 - 1 - i / 2;
    const std::size_t sample = chromaRow * (to.width / 2) + x.margin / 2 + column / 2;
    dst[to.area() + sample] = uOf(c);
    dst[vByArea(to) + sample] = vOf(c);
  });
  return std::size_t{to.width / 2} * to.height * 3;
}

}  // namespace reference
