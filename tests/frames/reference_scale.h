// Scaling, padding and cutting, stated sample by sample.
#pragma once

#include <algorithm>

#include "tests/frames/reference.h"

namespace reference {

inline std::uint8_t average(int a, int b) {
  return static_cast<std::uint8_t>((a + b) / 2);
}
inline std::uint8_t average(int a, int b, int c, int d) {
  return static_cast<std::uint8_t>((a + b + c + d) / 4);
}

inline void upHalf(Bytes& buffer, Size s) {
  const Bytes in = buffer;
  const std::size_t n = s.area() / 4 * 3;
  for (std::size_t i = 0; i < n; ++i) {
    buffer[2 * i + 1] = in[i];
    buffer[2 * i] = i == 0 ? in[0] : average(in[i - 1], in[i]);
  }
}

inline void downHalf(Bytes& buffer, Size s) {
  const Bytes in = buffer;
  std::size_t to = 0;
  for (const bool chroma : {false, true}) {
    const std::size_t start = chroma ? s.area() : 0, samples = chroma ? s.width / 4 : s.width / 2;
    for (std::size_t k = 0; k < s.height * samples; ++k) {
      buffer[to++] = average(in[start + 2 * k], in[start + 2 * k + 1]);
    }
  }
}

inline void quarter(Bytes& buffer, Size s) {
  const Bytes in = buffer;
  std::size_t to = 0;
  for (const bool chroma : {false, true}) {
    const std::size_t start = chroma ? s.area() : 0, pitch = chroma ? s.width / 2 : s.width;
    for (std::size_t row = 0; row < s.height / 2 * 2; row += 2) {
      for (std::size_t k = 0; k < pitch / 2; ++k) {
        const std::size_t a = start + row * pitch + 2 * k, b = a + pitch;
        buffer[to++] = average(in[a], in[a + 1], in[b], in[b + 1]);
      }
    }
  }
}

inline Bytes third(const Bytes& src, Size s, Size& out) {
  out = {s.width / 3 + s.width / 3 % 2, s.height / 3};
  Bytes result(i420Bytes(out));
  std::size_t to = 0;
  for (const std::size_t start : {std::size_t{0}, s.area(), s.area() * 5 / 4}) {
    const bool luma = start == 0;
    const std::size_t pitch = luma ? s.width : s.width / 2;
    for (std::size_t row = 0; row < (luma ? out.height : out.height / 2); ++row) {
      for (std::size_t k = 0; k < (luma ? out.width : out.width / 2); ++k) {
        const std::size_t a = start + 3 * row * pitch + 3 * k, b = a + pitch;
        const bool extra = luma && k >= s.width / 3;
        result[to++] = extra ? average(src[a], src[b]) : average(src[a], src[a + 1], src[b], src[b + 1]);
      }
    }
  }
  return result;
}

inline Bytes enlarge(unsigned group, const Bytes& src, Size s) {
  const Size out{s.width / group * (group + 1), s.height / group * (group + 1)};
  Bytes result(i420Bytes(out));
  std::size_t to = 0;
  for (const std::size_t start : {std::size_t{0}, s.area(), s.area() * 5 / 4}) {
    const std::size_t unit = start == 0 ? 1 : 2, w = s.width / unit, h = s.height / unit;
    for (std::size_t row = 0; row < out.height / unit; ++row) {
      for (std::size_t column = 0; column < out.width / unit; ++column) {
        // Position group of each group + 1 is inserted between its neighbours.
        const bool newRow = row % (group + 1) == group, newColumn = column % (group + 1) == group;
        const std::size_t y = row / (group + 1) * group + row % (group + 1) - (newRow ? 1 : 0);
        const std::size_t x = column / (group + 1) * group + column % (group + 1) - (newColumn ? 1 : 0);
        const std::size_t below = newRow ? std::min(y + 1, h - 1) : y;
        const std::size_t right = newColumn ? std::min(x + 1, w - 1) : x;
        const auto at = [&](std::size_t r, std::size_t c) { return src[start + r * w + c]; };
        result[to++] = average(at(y, x), at(y, right), at(below, x), at(below, right));
      }
    }
  }
  return result;
}

// -1 where a value depends on bytes that nobody has written.
inline std::vector<int> bilinear(const Bytes& src, Size from, Size to) {
  // The memory that the scaler walks over: the frame itself, or for most widths a padded copy. -1: not
  // written.
  const bool inPlace = from.width % 32 == 0;
  const auto up16 = [](std::size_t n) { return (n + 15) / 16 * 16; };
  const std::size_t chromaWidth = (from.width + 1) / 2, chromaRows = from.height / 2;
  const std::size_t lumaPitch = up16(from.width), chromaPitch = up16(lumaPitch / 2);
  const std::size_t u = lumaPitch * from.height, v = u + chromaPitch * chromaRows;
  std::vector<int> memory(v + chromaPitch * (chromaRows + 1) + lumaPitch, -1);
  const auto put = [&](std::size_t at, std::size_t sourceAt) {
    memory.at(at) = src[std::min(sourceAt, src.size() - 1)];
  };
  if (inPlace) {
    for (std::size_t i = 0; i < src.size(); ++i) put(i, i);
  } else {
    for (std::size_t r = 0; r < from.height; ++r) {
      for (std::size_t x = 0; x < from.width; ++x) put(r * lumaPitch + x, r * from.width + x);
    }
    for (std::size_t r = 0; r < 2 * chromaRows; ++r) {
      for (std::size_t x = 0; x < chromaWidth; ++x)
        put(u + r * chromaPitch + x, from.area() + r * chromaWidth + x);
    }
  }

  std::vector<int> out(i420Bytes(to), -1);
  const auto plane = [&](std::size_t start, std::size_t pitch, std::size_t w, std::size_t h,
                         std::size_t target, std::size_t tw, std::size_t th, bool lastRowBehind) {
    if (tw == 0 || th == 0) return;
    const std::uint64_t xStep = w * 65536 / tw, yStep = h * 65536 / th;
    for (std::size_t j = 0; j < th; ++j) {
      const std::uint64_t y = j * yStep + (yStep > 0x1FFFF ? 32768 : 0);
      const auto r = static_cast<std::size_t>(y / 65536), f = static_cast<std::size_t>(y / 256 % 256);
      std::vector<int> row(w + 1);
      for (std::size_t x = 0; x < w; ++x) {
        int below = memory.at(start + (r + 1) * pitch + x);
        // Nothing of the source lies there: the last row counts.
        if (r + 1 == h && (lastRowBehind || chromaRows == 0) && below < 0)
          below = memory.at(start + (h - 1) * pitch + x);
        const int here = memory.at(start + r * pitch + x);
        const bool copied = f == 0 || yStep == 65536 || r + 1 >= h;
        row[x] = copied ? below : (below * static_cast<int>(f) + here * static_cast<int>(256 - f)) / 256;
      }
      if (xStep == 65536 && w > 1) row[w - 1] = row[w - 2];
      row[w] = row[w - 1];
      for (std::size_t i = 0; i < tw; ++i) {
        const auto x = static_cast<std::size_t>(i * xStep / 65536);
        const std::int64_t g = static_cast<std::int64_t>(i * xStep % 65536);
        const bool unknown = row[x] < 0 || (g != 0 && row[x + 1] < 0);
        const auto mixed = static_cast<int>((row[x + 1] * g + row[x] * (65535 - g)) / 65536);
        out.at(target + j * tw + i) = unknown ? -1 : xStep == 65536 ? row[x] : mixed;
      }
    }
  };
  const std::size_t uTo = to.area(), vTo = uTo + std::size_t{to.width / 2} * (to.height / 2);
  plane(0, lumaPitch, from.width, from.height, 0, to.width, to.height, false);
  if (chromaRows == 0) {
    for (std::size_t i = 0; i < 2 * (vTo - uTo); ++i) out.at(uTo + i) = 128;
    return out;
  }
  plane(u, chromaPitch, chromaWidth, chromaRows, uTo, to.width / 2, to.height / 2, false);
  plane(v, chromaPitch, chromaWidth, chromaRows, vTo, to.width / 2, to.height / 2, true);
  return out;
}

inline void padPlane(const Bytes& src, std::size_t from, Size s, unsigned padW, unsigned left, unsigned padH,
                     unsigned top, std::uint8_t fill, Bytes& dst, std::size_t& to) {
  for (std::size_t row = 0; row < s.height + padH; ++row) {
    for (std::size_t x = 0; x < s.width + padW; ++x) {
      const bool inside = row >= top && row - top < s.height && x >= left && x - left < s.width;
      dst[to++] = inside ? src[from + (row - top) * s.width + x - left] : fill;
    }
  }
}

inline void pad(const Bytes& src, Size from, Bytes& dst, Size to) {
  const auto margin = [](unsigned excess) { return excess % 16 == 0 ? excess / 2 / 16 * 16 : excess / 2; };
  const unsigned padW = to.width - from.width, padH = to.height - from.height;
  const unsigned left = margin(padW), top = margin(padH);
  const Size half{from.width / 2, from.height / 2};
  std::size_t at = 0;
  padPlane(src, 0, from, padW, left, padH, top, 0, dst, at);
  for (const std::size_t plane : {from.area(), from.area() + half.area()}) {
    padPlane(src, plane, half, padW / 2, left / 2, padH / 2, top / 2, 127, dst, at);
  }
}

inline void cut(Bytes& frame, Size from, Size to) {
  const Bytes in = frame;
  const std::size_t x = from.width - to.width, y = (from.height - to.height) / 2;
  const std::size_t half = from.width / 2, samples = half * (from.height / 2);
  for (std::size_t i = 0; i < to.area(); ++i) {
    frame[i] = in[from.width * y + x / 2 + i / to.width * from.width + i % to.width];
  }
  const std::size_t columns = to.width / 2, rows = to.height / 2;
  for (std::size_t plane = 0; plane < 2; ++plane) {
    for (std::size_t i = 0; i < columns * rows; ++i) {
      frame[to.area() + plane * columns * rows + i] =
          in[from.area() + plane * samples + x / 4 + half * y / 2 + i / columns * half + i % columns];
    }
  }
}

}  // namespace reference
