#include "tools/video/canvas.h"

#include <algorithm>
#include <cstring>

namespace tool {

namespace {

// Away from the limits, which leaves room for the noise that the scene adds.
uint8_t clampLuma(int value) {
  return static_cast<uint8_t>(std::clamp(value, 20, 230));
}

int evenUp(int value) {
  return (value + 1) & ~1;
}

}  // namespace

uint32_t scatter(uint32_t a, uint32_t b, uint32_t seed) {
  uint32_t value = a * 0x9E3779B1U ^ b * 0x85EBCA77U ^ seed * 0xC2B2AE3DU;
  value = (value ^ value >> 15) * 0x2C1B3C6DU;
  value = (value ^ value >> 12) * 0x297A2D39U;
  return value ^ value >> 15;
}

int smoothNoise(int x, int y, int cell, int amplitude, uint32_t seed) {
  const int column = x / cell;
  const int row = y / cell;
  const auto corner = [&](int right, int down) {
    const uint32_t value =
        scatter(static_cast<uint32_t>(column + right), static_cast<uint32_t>(row + down), seed);
    return static_cast<int>(value % 513) - 256;
  };
  // Smooth steps across the cell, 0 to 256.
  const auto ease = [cell](int position) {
    const int t = position * 256 / cell;
    return t * t / 256 * (768 - 2 * t) / 256;
  };
  const int across = ease(x % cell);
  const int down = ease(y % cell);
  const int upper = corner(0, 0) * (256 - across) + corner(1, 0) * across;
  const int lower = corner(0, 1) * (256 - across) + corner(1, 1) * across;
  return (upper / 256 * (256 - down) + lower / 256 * down) / 256 * amplitude / 256;
}

int swing(uint64_t step, int period, int amplitude) {
  constexpr int kHalf = 512;
  const int phase =
      static_cast<int>(step % static_cast<uint64_t>(period) * 1024 / static_cast<uint64_t>(period));
  // Two parabolas, one up and one down.
  const int height = phase < kHalf ? phase * (kHalf - phase) : -(phase - kHalf) * (2 * kHalf - phase);
  return static_cast<int>(int64_t{height} * amplitude / (kHalf * kHalf / 4));
}

Canvas::Canvas(Size size)
    : _size(size), _y(pictureBytes(size) / 3 * 2, 128), _u(_y.size() / 4, 128), _v(_y.size() / 4, 128) {}

void Canvas::plot(int x, int y, Colour colour) {
  if (x < 0 || y < 0 || x >= _size.width || y >= _size.height) return;
  _y[index(x, y, _size.width)] = clampLuma(colour.y);
  if (x % 2 != 0 || y % 2 != 0) return;
  _u[index(x / 2, y / 2, chromaWidth())] = colour.u;
  _v[index(x / 2, y / 2, chromaWidth())] = colour.v;
}

void Canvas::fill(int x, int y, int width, int height, Colour colour) {
  for (int row = y; row < y + height; ++row) {
    for (int column = x; column < x + width; ++column) plot(column, row, colour);
  }
}

void Canvas::writeText(int x, int y, int width, int height, int letterHeight, uint32_t seed) {
  constexpr int kDark = 110;
  const int stroke = std::max(1, letterHeight / 7);
  const int letterWidth = stroke * 6;
  const int lineHeight = stroke * 11;
  for (int line = 0; (line + 1) * lineHeight <= height; ++line) {
    for (int letter = 0; (letter + 1) * letterWidth <= width; ++letter) {
      const uint32_t shape = scatter(static_cast<uint32_t>(letter), static_cast<uint32_t>(line), seed);
      if (shape % 6 == 0) continue;  // between words
      for (int cell = 0; cell < 35; ++cell) {
        const int cellColumn = cell % 5;
        const int cellRow = cell / 5;
        // Two stems and a few bars make a sign that has the edges of a letter.
        const bool isStem = cellColumn == 0 || (cellColumn == 4 && (shape >> 8 & 1) != 0);
        const bool isBar = cellRow % 3 == 0 && (shape >> (9 + cellRow / 3) & 1) != 0;
        if (!isStem && !isBar) continue;
        const int left = x + letter * letterWidth + cellColumn * stroke;
        const int top = y + line * lineHeight + cellRow * stroke;
        for (int i = 0; i < stroke * stroke; ++i) {
          const int px = left + i % stroke;
          const int py = top + i / stroke;
          if (px < 0 || py < 0 || px >= _size.width || py >= _size.height) continue;
          uint8_t& sample = _y[index(px, py, _size.width)];
          sample = clampLuma(sample - kDark);
        }
      }
    }
  }
}

void Canvas::addNoise(int x, int y, int width, int height, int cell, int amplitude, uint32_t seed) {
  for (int row = std::max(0, y); row < std::min(y + height, _size.height); ++row) {
    for (int column = std::max(0, x); column < std::min(x + width, _size.width); ++column) {
      uint8_t& sample = _y[index(column, row, _size.width)];
      sample = clampLuma(sample + smoothNoise(column, row, cell, amplitude, seed));
    }
  }
}

Sprite makeEllipse(Size size) {
  Sprite sprite(size);
  const int64_t width = size.width;
  const int64_t height = size.height;
  for (int row = 0; row < size.height; row += 2) {
    // (2 dx / width)^2 + (2 dy / height)^2 <= 1, from the centre of a pair of rows.
    const int64_t dy = row + 1 - height / 2;
    int64_t half = 0;
    while (half < width / 2 &&
           4 * (half * half * height * height + dy * dy * width * width) <= width * width * height * height) {
      ++half;
    }
    const int begin = evenUp(size.width / 2 - static_cast<int>(half));
    const int end = size.width - begin;
    sprite.rows[static_cast<size_t>(row)] = {begin, end};
    sprite.rows[static_cast<size_t>(row) + 1] = {begin, end};
  }
  return sprite;
}

void paint(const Sprite& sprite, int x, int y, Picture& picture) {
  const int width = picture.size.width;
  const int height = picture.size.height;
  uint8_t* const u = picture.bytes.data() + picture.lumaBytes();
  uint8_t* const v = u + picture.lumaBytes() / 4;
  for (int row = std::max(0, -y); row < sprite.canvas.size().height && y + row < height; ++row) {
    const Sprite::Span span = sprite.rows[static_cast<size_t>(row)];
    const int begin = std::max(span.begin, -x);
    const int end = std::min(span.end, width - x);
    if (begin >= end) continue;
    const auto count = static_cast<size_t>(end - begin);
    const ptrdiff_t luma = ptrdiff_t{y + row} * width + x + begin;
    memcpy(picture.bytes.data() + luma, sprite.canvas.luma(begin, row), count);
    if (row % 2 != 0) continue;
    const ptrdiff_t chroma = ptrdiff_t{(y + row) / 2} * (width / 2) + (x + begin) / 2;
    memcpy(u + chroma, sprite.canvas.chromaU(begin / 2, row / 2), count / 2);
    memcpy(v + chroma, sprite.canvas.chromaV(begin / 2, row / 2), count / 2);
  }
}

}  // namespace tool
