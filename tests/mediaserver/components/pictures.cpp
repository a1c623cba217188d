#include "tests/mediaserver/components/pictures.h"

#include <algorithm>
#include <cmath>
#include <utility>

namespace componenttest {

using omxhost::PictureLayout;

namespace {

size_t roundUp(size_t value, size_t multiple) {
  return (value + multiple - 1) / multiple * multiple;
}

// Smooth noise that can be followed from picture to picture.
uint8_t texture(uint32_t x, uint32_t y) {
  const auto at = [](uint32_t column, uint32_t row) {
    uint32_t h = column * 374761393U + row * 668265263U;
    h = (h ^ h >> 13) * 1274126177U;
    return (h ^ h >> 16) % 160;
  };
  const uint32_t fx = x % 8, fy = y % 8, cx = x / 8, cy = y / 8;
  const uint32_t top = at(cx, cy) * (8 - fx) + at(cx + 1, cy) * fx;
  const uint32_t bottom = at(cx, cy + 1) * (8 - fx) + at(cx + 1, cy + 1) * fx;
  return static_cast<uint8_t>(40 + (top * (8 - fy) + bottom * fy) / 64);
}

// The position of a byte in a tiled plane that begins at `start`: number of the tile, then row by row.
size_t tiled(size_t start, size_t x, size_t y, size_t tilesPerRow, size_t tileRows) {
  const size_t column = x / 64;
  const size_t row = y / 32;
  size_t number = row * tilesPerRow + column;
  if (row % 2 != 0) {
    number = (row - 1) * tilesPerRow + column + column / 4 * 4 + 2;
  } else if (row + 1 < tileRows) {
    number += (column + 2) / 4 * 4;
  }
  return start + number * 2048 + y % 32 * 64 + x % 64;
}

}  // namespace

Picture::Picture(uint32_t columns, uint32_t rows) : width(columns), height(rows) {
  bytes.resize(size_t{width} * height + 2 * size_t{chromaWidth()} * chromaHeight());
}

const uint8_t* Picture::plane(int index) const {
  const size_t luma = size_t{width} * height;
  const size_t chroma = size_t{chromaWidth()} * chromaHeight();
  return bytes.data() + (index == 0 ? 0 : index == 1 ? luma : luma + chroma);
}

uint8_t* Picture::plane(int index) {
  return const_cast<uint8_t*>(std::as_const(*this).plane(index));
}

Picture scene(uint32_t width, uint32_t height, uint32_t number) {
  Picture picture(width, height);
  uint8_t* luma = picture.plane(0);
  const uint32_t ballX = number * 5 % width;
  const uint32_t ballY = number * 3 % height;
  for (uint32_t y = 0; y < height; ++y) {
    for (uint32_t x = 0; x < width; ++x) {
      const bool ball = x - ballX < 24 && y - ballY < 24;
      *luma++ = ball ? texture(x - ballX + 500, y - ballY + 900) : texture(x + 2 * number, y + number);
    }
  }
  for (int plane = 1; plane < 3; ++plane) {
    uint8_t* chroma = picture.plane(plane);
    for (uint32_t y = 0; y < picture.chromaHeight(); ++y) {
      for (uint32_t x = 0; x < picture.chromaWidth(); ++x) {
        *chroma++ =
            static_cast<uint8_t>(60 + (x + number) * 3 % 100 + static_cast<uint32_t>(plane) * 20 + y % 30);
      }
    }
  }
  return picture;
}

double psnr(const Picture& a, const Picture& b) {
  if (a.width != b.width || a.height != b.height) return 0;
  double error = 0;
  const size_t count = size_t{a.width} * a.height;
  for (size_t i = 0; i < count; ++i) {
    const double difference = static_cast<double>(a.bytes[i]) - b.bytes[i];
    error += difference * difference;
  }
  return error == 0 ? 100 : 10 * std::log10(255.0 * 255.0 * static_cast<double>(count) / error);
}

std::vector<uint16_t> rgb565(const Picture& picture) {
  std::vector<uint16_t> pixels;
  for (uint32_t y = 0; y < picture.height; ++y) {
    for (uint32_t x = 0; x < picture.width; ++x) {
      const size_t chroma = size_t{y / 2} * picture.chromaWidth() + x / 2;
      const int luma = 298 * (picture.plane(0)[size_t{y} * picture.width + x] - 16);
      const int u = picture.plane(1)[chroma] - 128;
      const int v = picture.plane(2)[chroma] - 128;
      const int red = std::clamp((luma + 409 * v) / 256, 0, 255) >> 3;
      const int green = std::clamp((luma - 208 * v - 100 * u) / 256, 0, 255) >> 2;
      const int blue = std::clamp((luma + 517 * u) / 256, 0, 255) >> 3;
      pixels.push_back(static_cast<uint16_t>(red << 11 | green << 5 | blue));
    }
  }
  return pixels;
}

Picture turned(const Picture& picture, int quarters) {
  if (quarters == 0) return picture;
  Picture out(picture.height, picture.width);
  for (int plane = 0; plane < 3; ++plane) {
    const uint32_t width = plane == 0 ? picture.width : picture.chromaWidth();
    const uint32_t height = plane == 0 ? picture.height : picture.chromaHeight();
    for (uint32_t y = 0; y < height; ++y) {
      for (uint32_t x = 0; x < width; ++x) {
        out.plane(plane)[x * height + height - 1 - y] = picture.plane(plane)[y * width + x];
      }
    }
  }
  return turned(out, quarters - 1);
}

std::vector<uint8_t> packInput(const Picture& picture, PictureLayout layout, uint32_t pitch) {
  if (pitch == 0) pitch = picture.width;
  const bool aligned = layout == PictureLayout::SemiPlanarAligned;
  const size_t chroma = roundUp(size_t{pitch} * picture.height, aligned ? 2048 : 1);
  std::vector<uint8_t> bytes(chroma + size_t{pitch} * picture.height / 2);
  for (uint32_t y = 0; y < picture.height; ++y) {
    std::copy_n(picture.plane(0) + size_t{y} * picture.width, picture.width, &bytes[size_t{y} * pitch]);
  }
  for (uint32_t y = 0; y < picture.chromaHeight(); ++y) {
    for (uint32_t x = 0; x < picture.chromaWidth(); ++x) {
      const size_t from = size_t{y} * picture.chromaWidth() + x;
      bytes[chroma + size_t{y} * pitch + 2 * x] = picture.plane(1)[from];
      bytes[chroma + size_t{y} * pitch + 2 * x + 1] = picture.plane(2)[from];
    }
  }
  return bytes;
}

Picture unpackOutput(const std::vector<uint8_t>& bytes, PictureLayout layout, uint32_t frameWidth,
                     uint32_t frameHeight, const Rectangle& visible) {
  Picture picture(visible.width, visible.height);
  const size_t tilesPerRow = roundUp(frameWidth, 128) / 64;
  const size_t lumaRows = roundUp(frameHeight, 32) / 32;
  const size_t chromaRows = roundUp(frameHeight, 64) / 64;
  const size_t tiledChroma = roundUp(tilesPerRow * lumaRows * 2048, 8192);
  const bool tiles = layout == PictureLayout::Tiled;
  const auto luma = [&](size_t x, size_t y) {
    return bytes.at(tiles ? tiled(0, x, y, tilesPerRow, lumaRows)
                          : (visible.top + y) * frameWidth + visible.left + x);
  };
  const auto chroma = [&](size_t x, size_t y) {
    return bytes.at(tiles ? tiled(tiledChroma, x, y, tilesPerRow, chromaRows)
                          : (frameHeight + visible.top / 2 + y) * frameWidth + visible.left + x);
  };
  for (uint32_t y = 0; y < visible.height; ++y) {
    for (uint32_t x = 0; x < visible.width; ++x) picture.plane(0)[size_t{y} * visible.width + x] = luma(x, y);
  }
  for (uint32_t y = 0; y < picture.chromaHeight(); ++y) {
    for (uint32_t x = 0; x < picture.chromaWidth(); ++x) {
      picture.plane(1)[size_t{y} * picture.chromaWidth() + x] = chroma(2 * x, y);
      picture.plane(2)[size_t{y} * picture.chromaWidth() + x] = chroma(2 * x + 1, y);
    }
  }
  return picture;
}

}  // namespace componenttest
