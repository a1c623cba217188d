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
struct RgbLayout {
  Pixel pixel;
  unsigned bytes;
  Rows rows;
  bool strideMovesRows = true, exchangedChroma = false, semiPlanar = false;
};

enum class Rgb { k24, kMac, k565 };

inline unsigned clamped(int v) {
  return v < 0 ? 0u : v > 255 ? 255u : static_cast<unsigned>(v);
}
inline std::uint8_t low(int v) {
  return static_cast<std::uint8_t>(v);
}

inline void word(unsigned value, std::uint8_t* to) {
  to[0] = static_cast<std::uint8_t>(value);
  to[1] = static_cast<std::uint8_t>(value >> 8);
}

inline Components load(Rgb layout, const Bytes& src, std::size_t at) {
  if (layout == Rgb::k24) return {src[at + 2], src[at + 1], src[at]};
  if (layout == Rgb::kMac) return {src[at + 1], src[at + 2], src[at + 3]};
  const int w = src[at] + 256 * src[at + 1];
  return {w / 2048 * 8, w / 32 % 64 * 4, w % 32 * 8};
}

inline unsigned bytesOf(Rgb layout) {
  return layout == Rgb::k24 ? 3 : layout == Rgb::kMac ? 4 : 2;
}

inline std::uint8_t yOf(Components c) {
  return low(((66 * c.r + 129 * c.g + 25 * c.b + 128) >> 8) + 16);
}
inline std::uint8_t uOf(Components c) {
  return low(((-38 * c.r - 74 * c.g + 112 * c.b + 128) >> 8) + 128);
}
inline std::uint8_t vOf(Components c) {
  return low(((112 * c.r - 94 * c.g - 18 * c.b + 128) >> 8) + 128);
}

inline Components sumsOf(int y, int u, int v) {
  const int luma = 298 * (y - 16);
  return {(luma + 409 * (v - 128) + 128) >> 8, (luma - 100 * (u - 128) + 128 - 208 * (v - 128)) >> 8,
          (luma + 516 * (u - 128) + 128) >> 8};
}

inline void pixelBgra(const Components& s, std::uint8_t* to) {
  const unsigned bgra[] = {clamped(s.b), clamped(s.g), clamped(s.r), 255};
  std::copy_n(bgra, 4, to);
}
inline void pixelBgr(const Components& s, std::uint8_t* to) {
  pixelBgra(s, to);
}
inline void pixelArgb(const Components& s, std::uint8_t* to) {
  pixelBgra(s, to);
  std::reverse(to, to + 4);
}
inline void pixelRgba(const Components& s, std::uint8_t* to) {
  pixelBgra(s, to);
  std::swap(to[0], to[2]);
}

inline void pixel565(const Components& s, std::uint8_t* to) {
  word((clamped(s.r) & 0xF8) << 8 | (clamped(s.g) & 0xFC) << 3 | clamped(s.b) >> 3, to);
}

inline void pixel4444(const Components& s, std::uint8_t* to) {
  word(0xF000 | (clamped(s.r) >> 4) << 8 | (clamped(s.g) >> 4) << 4 | clamped(s.b) >> 4, to);
}

inline void pixel1555(const Components& s, std::uint8_t* to) {
  const unsigned red = s.r < 0     ? 0x8000
                       : s.r > 255 ? 0x6000
                                   : (((static_cast<unsigned>(s.r) & 0xF8) << 10) - 0x8000) & 0xFFFF;
  const unsigned green = s.g > 255 ? 0x7C0 : (clamped(s.g) & 0xF8) << 3;
  const unsigned blue = s.b > 255 ? 0x1F : clamped(s.b) >> 3;
  word(red + green + blue, to);
}

inline void toRgb(const RgbLayout& layout, const Bytes& src, Bytes& dst, Size s, unsigned stride) {
  const std::size_t pitch = layout.strideMovesRows ? stride : s.width;
  for (std::size_t row = 0; row < s.height / 2 * 2; ++row) {
    const std::size_t pair = row / 2;
    std::size_t start = row * pitch;
    if (layout.rows == Rows::kBottomUp) start = (s.height - 1 - row) * pitch;
    if (layout.rows == Rows::kHalfStride) start = pair * (s.width + stride) + row % 2 * stride;
    for (std::size_t x = 0; x < s.width / 2 * 2; ++x) {
      const std::size_t y = pair * (s.width / 2 * 2 + s.width) + row % 2 * s.width + x;
      const std::size_t sample = pair * (s.width / 2) + x / 2;
      std::size_t u = s.area() + sample, v = s.area() + s.area() / 4 + sample;
      if (layout.exchangedChroma) std::swap(u, v);
      if (layout.semiPlanar) {
        u = s.area() + 2 * sample;
        v = u + 1;
      }
      std::uint8_t pixel[4];
      layout.pixel(sumsOf(src[y], src[u], src[v]), pixel);
      for (std::size_t k = 0; k < layout.bytes; ++k) dst[(start + x) * layout.bytes + k] = pixel[k];
    }
  }
}

inline void rgb24ToArgb(const Bytes& src, Bytes& dst, Size s, unsigned stride) {
  for (std::size_t i = 0; i < s.height; ++i) {
    for (std::size_t x = 0; x < s.width; ++x) {
      const std::size_t to = ((s.height - 1) * std::size_t{stride} - i * (stride - s.width) + x) * 4;
      for (std::size_t k = 0; k < 3; ++k) dst[to + k] = src[(i * s.width + x) * 3 + k];
      dst[to + 3] = 255;
    }
  }
}

inline void fromRgb(Rgb layout, const Bytes& src, Bytes& dst, Size s) {
  for (std::size_t row = 0; row < s.height / 2 * 2; ++row) {
    for (std::size_t x = 0; x < s.width / 2 * 2; ++x) {
      const Components c = load(layout, src, (row * s.width + x) * bytesOf(layout));
      dst[row * s.width + x] = yOf(c);
      if (row % 2 == 0 && x % 2 == 0) {
        const std::size_t sample = row / 2 * (s.width / 2) + x / 2;
        dst[s.area() + sample] = uOf(c);
        dst[s.area() + s.area() / 4 + sample] = vOf(c);
      }
    }
  }
}

inline void fromRgbCentred(const Bytes& src, Size from, Bytes& dst, Size to) {
  const Axis x(from.width, to.width), y(from.height, to.height);
  const std::size_t columns = x.count / 2 * 2, rows = y.count / 2 * 2;
  const std::size_t samples = std::size_t{to.width / 2} * (to.height / 2);
  const std::size_t u = to.area(), v = to.area() + to.area() / 4;
  for (std::size_t i = 0; i < to.area(); ++i) dst[i] = 0;
  for (std::size_t i = 0; i < samples; ++i) dst[u + i] = dst[v + i] = 127;
  for (std::size_t i = 0; i < rows; ++i) {
    // Bottom-up: the first source rows are the last of the picture.
    const std::size_t row = y.margin + y.count - 1 - i;
    const std::size_t chromaRow = y.margin / 2 + rows / 2 - 1 - i / 2;
    for (std::size_t column = 0; column < columns; ++column) {
      const Components c = load(Rgb::k24, src, ((y.skip + i) * from.width + x.skip + column) * 3);
      dst[row * to.width + x.margin + column] = yOf(c);
      if (i % 2 == 1 && column % 2 == 0) {
        const std::size_t sample = chromaRow * (to.width / 2) + x.margin / 2 + column / 2;
        dst[u + sample] = uOf(c);
        dst[v + sample] = vOf(c);
      }
    }
  }
}

}  // namespace reference
