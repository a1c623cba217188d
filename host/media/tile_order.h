// Where the tiles of a 64x32-tiled plane lie. Pure arithmetic.
//
// A plane is cut into tiles of 64 bytes by 32 rows, each stored row by row. Tiles are taken in groups
// of two by two along a pair of tile rows; every other group is walked from the other side, so that
// the way through memory is a Z followed by its mirror image. A last single row is in plain order.
#pragma once

#include <stddef.h>

namespace android::tiles {

constexpr size_t kWidth = 64;  // bytes
constexpr size_t kHeight = 32;
constexpr size_t kBytes = kWidth * kHeight;

constexpr size_t roundUp(size_t value, size_t multiple) {
  return (value + multiple - 1) / multiple * multiple;
}

// Tiles come in horizontal pairs.
constexpr size_t perRow(size_t width) {
  return roundUp(width, 2 * kWidth) / kWidth;
}
constexpr size_t rows(size_t height) {
  return roundUp(height, kHeight) / kHeight;
}

// The number, counted from the start of the plane, of the tile in column `x` and tile row `y` of a
// plane of `perRow` times `rows` tiles.
constexpr size_t number(size_t x, size_t y, size_t perRow, size_t rows) {
  if (y % 2 != 0) return (y - 1) * perRow + x + (x & ~size_t{3}) + 2;
  if (y + 1 == rows) return y * perRow + x;
  return y * perRow + x + ((x + 2) & ~size_t{3});
}

// Both planes of a picture, luma first.
struct Planes {
  constexpr Planes(size_t width, size_t height)
      : tilesPerRow(perRow(width)),
        lumaRows(rows(height)),
        chromaRows(rows((height + 1) / 2)),
        chromaStart(roundUp(tilesPerRow * lumaRows * kBytes, 4 * kBytes)) {}

  // Offsets, from the start of the picture, of one byte of luma, and of one byte of the rows in which
  // chroma bytes alternate, Cb first.
  constexpr size_t luma(size_t x, size_t y) const { return inPlane(x, y, lumaRows); }
  constexpr size_t chroma(size_t x, size_t y) const { return chromaStart + inPlane(x, y, chromaRows); }

  size_t tilesPerRow;
  size_t lumaRows;
  size_t chromaRows;
  size_t chromaStart;

 private:
  constexpr size_t inPlane(size_t x, size_t y, size_t tileRows) const {
    return kBytes * number(x / kWidth, y / kHeight, tilesPerRow, tileRows) + y % kHeight * kWidth +
           x % kWidth;
  }
};

}  // namespace android::tiles
