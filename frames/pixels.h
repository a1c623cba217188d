// One pixel at a time: BT.601 limited-range arithmetic in 8-bit fixed point, and the RGB layouts. What the
// kernels do for whole vectors is written here once in plain C++; they call it for what is left of a row.
#pragma once

#include <algorithm>
#include <cstddef>
#include <cstdint>

namespace webrtc::detail {

struct Rgb {
  int r, g, b;
};

inline int clampByte(int value) {
  return std::clamp(value, 0, 255);
}
inline std::uint8_t byteOf(int value) {
  return static_cast<std::uint8_t>(value & 0xFF);
}

inline Rgb rgbOf(int y, int u, int v) {
  const int luma = 298 * (y - 16) + 128;
  return {clampByte((luma + 409 * (v - 128)) >> 8),
          clampByte((luma - 100 * (u - 128) - 208 * (v - 128)) >> 8),
          clampByte((luma + 516 * (u - 128)) >> 8)};
}

inline std::uint8_t lumaOf(Rgb p) {
  return byteOf(((66 * p.r + 129 * p.g + 25 * p.b + 128) >> 8) + 16);
}
inline std::uint8_t cbOf(Rgb p) {
  return byteOf(((-38 * p.r - 74 * p.g + 112 * p.b + 128) >> 8) + 128);
}
inline std::uint8_t crOf(Rgb p) {
  return byteOf(((112 * p.r - 94 * p.g - 18 * p.b + 128) >> 8) + 128);
}

// Layouts, as tags of the kernels' templates. store takes components of 0 to 255.

struct Bgr24 {
  static constexpr std::size_t kBytes = 3;
  static void store(std::uint8_t* to, Rgb p) {
    to[0] = byteOf(p.b);
    to[1] = byteOf(p.g);
    to[2] = byteOf(p.r);
  }
  static Rgb load(const std::uint8_t* from) { return {from[2], from[1], from[0]}; }
};

// Four bytes; the parameters are the components' places, the fourth holds 255 when stored.
template <std::size_t kR, std::size_t kG, std::size_t kB>
struct FourBytes {
  static constexpr std::size_t kBytes = 4;
  static constexpr std::size_t kRed = kR, kGreen = kG, kBlue = kB, kAlpha = 6 - kR - kG - kB;
  static void store(std::uint8_t* to, Rgb p) {
    to[kR] = byteOf(p.r);
    to[kG] = byteOf(p.g);
    to[kB] = byteOf(p.b);
    to[kAlpha] = 255;
  }
  static Rgb load(const std::uint8_t* from) { return {from[kR], from[kG], from[kB]}; }
};
using Bgra = FourBytes<2, 1, 0>;
using Rgba = FourBytes<0, 1, 2>;
using Argb = FourBytes<1, 2, 3>;

// 16-bit words are handled as a low and a high byte: they may stand at odd addresses.
struct Rgb565 {
  static constexpr std::size_t kBytes = 2;
  static void store(std::uint8_t* to, Rgb p) {
    to[0] = byteOf((p.g & 0x1C) << 3 | p.b >> 3);
    to[1] = byteOf((p.r & 0xF8) | p.g >> 5);
  }
  static Rgb load(const std::uint8_t* from) {
    return {from[1] & 0xF8, (from[1] << 5 | from[0] >> 3) & 0xFC, from[0] << 3 & 0xF8};
  }
};

struct Argb4444 {
  static constexpr std::size_t kBytes = 2;
  static void store(std::uint8_t* to, Rgb p) {
    to[0] = byteOf((p.g & 0xF0) | p.b >> 4);
    to[1] = byteOf(0xF0 | p.r >> 4);
  }
};

struct Argb1555 {
  static constexpr std::size_t kBytes = 2;
  static void store(std::uint8_t* to, Rgb p) {
    // Kept: only three bits of red survive, at the top and with the highest inverted. The applications'
    // 1555 surfaces were made for these words.
    to[0] = byteOf((p.g & 0x18) << 3 | p.b >> 3);
    to[1] = byteOf((((p.r & 0x38) << 2) ^ 0x80) | p.g >> 5);
  }
};

}  // namespace webrtc::detail
