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

// --- In place, with the function's result ---

inline std::size_t upHalf(const Bytes&, Bytes& buffer, Size s, Size, unsigned) {
  const Bytes in = buffer;
  for (std::size_t i = 0; i < s.area() / 4 * 3; ++i) {
    buffer[2 * i + 1] = in[i];
    buffer[2 * i] = i == 0 ? in[0] : average(in[i - 1], in[i]);
  }
  return s.i420();
}

inline std::size_t downHalf(const Bytes&, Bytes& buffer, Size s, Size, unsigned) {
  const Bytes in = buffer;
  const std::size_t luma = std::size_t{s.width / 2} * s.height, chroma = std::size_t{s.width / 4} * s.height;
  for (std::size_t k = 0; k < luma + chroma; ++k) {
    const std::size_t from = k < luma ? 2 * k : s.area() + 2 * (k - luma);
    buffer[k] = average(in[from], in[from + 1]);
  }
  return luma * 3;
}

inline std::size_t quarter(const Bytes&, Bytes& buffer, Size s, Size, unsigned) {
  const Bytes in = buffer;
  std::size_t to = 0;
  for (const unsigned pitch : {s.width, s.width / 2}) {
    const std::size_t start = to == 0 ? 0 : s.area();
    forEach({pitch / 2, s.height / 2}, [&](std::size_t x, std::size_t y) {
      const std::size_t a = start + 2 * y * pitch + 2 * x, b = a + pitch;
      buffer[to++] = average(in[a], in[a + 1], in[b], in[b + 1]);
    });
  }
  return std::size_t{s.width / 2} * s.height * 3;
}

// --- Into a buffer that may grow ---

inline Bytes third(const Bytes& src, Size s, Size& out) {
  out = {s.width / 3 + s.width / 3 % 2, s.height / 3};
  Bytes result(out.i420());
  std::size_t to = 0;
  for (const std::size_t start : {std::size_t{0}, s.area(), s.area() * 5 / 4}) {
    const std::size_t pitch = start == 0 ? s.width : s.width / 2;
    forEach(start == 0 ? out : out.half(), [&](std::size_t x, std::size_t y) {
      const std::size_t a = start + 3 * y * pitch + 3 * x, b = a + pitch;
      const bool extra = start == 0 && x >= s.width / 3;
      result[to++] = extra ? average(src[a], src[b]) : average(src[a], src[a + 1], src[b], src[b + 1]);
    });
  }
  return result;
}

// Position kGroup of each kGroup + 1 is inserted between its neighbours.
template <unsigned kGroup>
Bytes enlarged(const Bytes& src, Size s, Size& out) {
  out = {s.width / kGroup * (kGroup + 1), s.height / kGroup * (kGroup + 1)};
  Bytes result(out.i420());
  std::size_t to = 0;
  for (const std::size_t start : {std::size_t{0}, s.area(), s.area() * 5 / 4}) {
    const Size plane = start == 0 ? s : s.half();
    forEach(start == 0 ? out : out.half(), [&](std::size_t column, std::size_t row) {
      const bool newRow = row % (kGroup + 1) == kGroup, newColumn = column % (kGroup + 1) == kGroup;
      const std::size_t y = row / (kGroup + 1) * kGroup + row % (kGroup + 1) - (newRow ? 1 : 0);
      const std::size_t x = column / (kGroup + 1) * kGroup + column % (kGroup + 1) - (newColumn ? 1 : 0);
      const std::size_t below = newRow ? std::min<std::size_t>(y + 1, plane.height - 1) : y;
      const std::size_t right = newColumn ? std::min<std::size_t>(x + 1, plane.width - 1) : x;
      const auto at = [&](std::size_t r, std::size_t c) { return src[start + r * plane.width + c]; };
      result[to++] = average(at(y, x), at(y, right), at(below, x), at(below, right));
    });
  }
  return result;
}

// --- Any size ---

// -1 where a value depends on bytes that nobody has written.
inline std::vector<int> bilinear(const Bytes& src, Size from, Size to) {
  // The memory that the scaler walks over: the frame itself, or for most widths a padded copy. -1: not
  // written.
  const bool inPlace = from.width % 32 == 0;
  const auto up16 = [](unsigned n) { return std::size_t{(n + 15) / 16 * 16}; };
  const unsigned chromaWidth = (from.width + 1) / 2, chromaRows = from.height / 2;
  const std::size_t lumaPitch = up16(from.width), chromaPitch = up16(static_cast<unsigned>(lumaPitch / 2));
  const std::size_t u = lumaPitch * from.height, v = u + chromaPitch * chromaRows;
  std::vector<int> memory(v + chromaPitch * (chromaRows + 1) + lumaPitch, -1);
  const auto put = [&](std::size_t at, std::size_t sourceAt) {
    memory.at(at) = src[std::min(sourceAt, src.size() - 1)];
  };
  forEach(from, [&](std::size_t x, std::size_t y) { put(y * lumaPitch + x, y * from.width + x); });
  // An odd height leaves half a row behind V.
  forEach({chromaWidth, inPlace ? from.height : 2 * chromaRows}, [&](std::size_t x, std::size_t y) {
    put(u + y * chromaPitch + x, from.area() + y * chromaWidth + x);
  });

  std::vector<int> out(to.i420(), -1);
  const auto plane = [&](std::size_t start, std::size_t pitch, Size s, std::size_t target, Size t,
                         bool lastRowBehind) {
    if (t.area() == 0) return;
    const std::size_t xStep = std::size_t{s.width} * 65536 / t.width;
    const std::size_t yStep = std::size_t{s.height} * 65536 / t.height;
    for (std::size_t j = 0; j < t.height; ++j) {
      const std::size_t y = j * yStep + (yStep > 0x1FFFF ? 32768 : 0), r = y / 65536, f = y / 256 % 256;
      std::vector<int> row(s.width + 1);
      for (std::size_t x = 0; x < s.width; ++x) {
        int below = memory.at(start + (r + 1) * pitch + x);
        // Nothing of the source lies there: the last row counts.
        if (r + 1 == s.height && (lastRowBehind || chromaRows == 0) && below < 0)
          below = memory.at(start + (s.height - 1) * pitch + x);
        const int here = memory.at(start + r * pitch + x);
        const bool copied = f == 0 || yStep == 65536 || r + 1 >= s.height;
        row[x] = copied ? below : (below * static_cast<int>(f) + here * static_cast<int>(256 - f)) / 256;
      }
      if (xStep == 65536 && s.width > 1) row[s.width - 1] = row[s.width - 2];
      row[s.width] = row[s.width - 1];
      for (std::size_t i = 0; i < t.width; ++i) {
        const std::size_t x = i * xStep / 65536;
        const auto g = static_cast<std::int64_t>(i * xStep % 65536);
        const bool unknown = row[x] < 0 || (g != 0 && row[x + 1] < 0);
        const auto mixed = static_cast<int>((row[x + 1] * g + row[x] * (65535 - g)) / 65536);
        out.at(target + j * t.width + i) = unknown ? -1 : xStep == 65536 ? row[x] : mixed;
      }
    }
  };
  const Size chroma{chromaWidth, chromaRows};
  plane(0, lumaPitch, from, 0, to, false);
  if (chromaRows == 0) {
    std::fill_n(out.begin() + static_cast<std::ptrdiff_t>(to.area()), 2 * to.half().area(), 128);
    return out;
  }
  plane(u, chromaPitch, chroma, to.area(), to.half(), false);
  plane(v, chromaPitch, chroma, vBySamples(to), to.half(), true);
  return out;
}

inline std::size_t pad(const Bytes& src, Bytes& dst, Size from, Size to, unsigned) {
  if (from == to) return to.i420();
  const auto margin = [](unsigned excess) { return excess % 16 == 0 ? excess / 2 / 16 * 16 : excess / 2; };
  const Size excess{to.width - from.width, to.height - from.height}, half = from.half();
  const std::size_t left = margin(excess.width), top = margin(excess.height);
  const Size chroma{half.width + excess.width / 2, half.height + excess.height / 2};
  place(src, 0, from.width, from, dst, 0, to, left, top, 0);
  place(src, from.area(), half.width, half, dst, to.area(), chroma, left / 2, top / 2, 127);
  const std::size_t v = to.area() + chroma.area();
  place(src, vBySamples(from), half.width, half, dst, v, chroma, left / 2, top / 2, 127);
  return v + chroma.area();
}

inline std::size_t cut(Bytes& frame, Size from, Size to) {
  const Bytes in = frame;
  const std::size_t x = from.width - to.width, y = (from.height - to.height) / 2, pitch = from.width / 2;
  std::size_t at = 0;
  const auto take = [&](std::size_t start, std::size_t rowBytes, Size s) {
    forEach(s,
            [&](std::size_t column, std::size_t row) { frame[at++] = in[start + row * rowBytes + column]; });
  };
  take(from.width * y + x / 2, from.width, to);
  for (const std::size_t plane : {from.area(), vBySamples(from)}) {
    take(plane + x / 4 + pitch * y / 2, pitch, to.half());
  }
  return std::size_t{to.width / 2} * to.height * 3;
}

}  // namespace reference
