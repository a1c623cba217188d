#include <stdint.h>
#include <string.h>

#include <algorithm>
#include <array>

#include <media/stagefright/ColorConverter.h>
#include <media/stagefright/MediaErrors.h>

#include "host/media/tile_order.h"

namespace android {

namespace {

constexpr auto kTiledSemiPlanar = static_cast<OMX_COLOR_FORMATTYPE>(0x7FA30C03);

// Sides that no picture has; below, no product of sizes leaves the range of a word.
constexpr size_t kLargestSide = 1 << 14;

// A component before clamping lies in this range for any Y, Cb and Cr. Looking it up clamps it to a
// byte, cuts it to its bits and puts them in their place, all at once.
constexpr int kLowest = -278;
constexpr int kHighest = 535;
using Clip = std::array<uint16_t, kHighest - kLowest + 1>;

constexpr Clip makeClip(int droppedBits, int place) {
  Clip clip{};
  for (int value = kLowest; value <= kHighest; ++value) {
    clip[static_cast<size_t>(value - kLowest)] =
        static_cast<uint16_t>(std::clamp(value, 0, 255) >> droppedBits << place);
  }
  return clip;
}

constexpr Clip kRed = makeClip(3, 11);
constexpr Clip kGreen = makeClip(2, 5);
constexpr Clip kBlue = makeClip(3, 0);

// What a chroma pair adds to the components of its pixels, in units of 1/256.
struct Chroma {
  Chroma(int cb, int cr)
      : red(409 * (cr - 128)), green(-208 * (cr - 128) - 100 * (cb - 128)), blue(517 * (cb - 128)) {}

  int red;
  int green;
  int blue;
};

uint16_t lookUp(const Clip& clip, int value) {
  // Rounding down where the arithmetic truncates: the two differ below zero only, where all clamps to 0.
  return clip[static_cast<size_t>((value >> 8) - kLowest)];
}

void putPixel(uint8_t* out, int y, const Chroma& chroma) {
  const int luma = 298 * (y - 16);
  const auto pixel =
      static_cast<uint16_t>(lookUp(kRed, luma + chroma.red) | lookUp(kGreen, luma + chroma.green) |
                            lookUp(kBlue, luma + chroma.blue));
  memcpy(out, &pixel, sizeof pixel);
}

// `count` pixels from the middle of one row of a tile, beginning at an even one.
void convertRun(const uint8_t* luma, const uint8_t* chroma, size_t count, uint8_t* out) {
  size_t x = 0;
  for (; x + 1 < count; x += 2) {
    const Chroma pair(chroma[x], chroma[x + 1]);
    putPixel(out + 2 * x, luma[x], pair);
    putPixel(out + 2 * x + 2, luma[x + 1], pair);
  }
  if (x < count) putPixel(out + 2 * x, luma[x], Chroma(chroma[x], chroma[x + 1]));
}

// A rectangle of pixels, made from inclusive corners.
struct Crop {
  Crop(size_t leftEdge, size_t topEdge, size_t right, size_t bottom, size_t pictureWidth,
       size_t pictureHeight)
      : valid(leftEdge <= right && right < pictureWidth && topEdge <= bottom && bottom < pictureHeight),
        left(leftEdge),
        top(topEdge),
        width(right - leftEdge + 1),
        height(bottom - topEdge + 1) {}

  bool valid;
  size_t left;
  size_t top;
  size_t width;
  size_t height;
};

}  // namespace

ColorConverter::ColorConverter(OMX_COLOR_FORMATTYPE from, OMX_COLOR_FORMATTYPE to) : _from(from), _to(to) {}

bool ColorConverter::isValid() const {
  return _from == kTiledSemiPlanar && _to == OMX_COLOR_Format16bitRGB565;
}

status_t ColorConverter::convert(const void* srcBits, size_t srcWidth, size_t srcHeight, size_t srcCropLeft,
                                 size_t srcCropTop, size_t srcCropRight, size_t srcCropBottom, void* dstBits,
                                 size_t dstWidth, size_t dstHeight, size_t dstCropLeft, size_t dstCropTop,
                                 size_t dstCropRight, size_t dstCropBottom) {
  const Crop from(srcCropLeft, srcCropTop, srcCropRight, srcCropBottom, srcWidth, srcHeight);
  const Crop to(dstCropLeft, dstCropTop, dstCropRight, dstCropBottom, dstWidth, dstHeight);
  if (!isValid() || srcBits == nullptr || dstBits == nullptr || !from.valid || !to.valid ||
      from.width != to.width || from.height != to.height || from.left % 2 != 0 ||
      std::max({srcWidth, srcHeight, dstWidth, dstHeight}) > kLargestSide) {
    return ERROR_UNSUPPORTED;
  }

  const tiles::Planes planes(srcWidth, srcHeight);
  const auto* const source = static_cast<const uint8_t*>(srcBits);
  auto* const destination = static_cast<uint8_t*>(dstBits);
  for (size_t row = 0; row < from.height; ++row) {
    const size_t y = from.top + row;
    uint8_t* out = destination + 2 * ((to.top + row) * dstWidth + to.left);
    size_t x = from.left;
    const size_t end = from.left + from.width;
    while (x < end) {
      const size_t count = std::min(end - x, tiles::kWidth - x % tiles::kWidth);
      convertRun(source + planes.luma(x, y), source + planes.chroma(x, y / 2), count, out);
      x += count;
      out += 2 * count;
    }
  }
  return OK;
}

}  // namespace android
