// Arithmetic and refusals. That tiles are read where they lie is shown on decoded pictures.
#include <gtest/gtest.h>

#include <algorithm>
#include <vector>

#include <media/stagefright/ColorConverter.h>
#include <media/stagefright/MediaErrors.h>

namespace {

using android::ColorConverter;

constexpr auto kTiled = static_cast<OMX_COLOR_FORMATTYPE>(0x7FA30C03);
constexpr uint16_t kUntouched = 0x5A3C;
constexpr size_t kChroma = 8192;  // where it begins in tiles for up to 128x64 pixels

TEST(ColorConverter, KeepsExtremeSamplesWithinTheRangeAndToTheirPlace) {
  std::vector<uint8_t> tiles(2 * kChroma);
  const int extremes[] = {0, 15, 16, 17, 81, 90, 128, 129, 235, 240, 255};
  for (const int y : extremes) {
    for (const int cb : extremes) {
      for (const int cr : extremes) {
        std::fill_n(tiles.begin(), kChroma, static_cast<uint8_t>(y));
        for (size_t i = kChroma; i < tiles.size(); i += 2) {
          tiles[i] = static_cast<uint8_t>(cb);
          tiles[i + 1] = static_cast<uint8_t>(cr);
        }
        const int luma = 298 * (y - 16);
        const int red = std::clamp((luma + 409 * (cr - 128)) / 256, 0, 255);
        const int green = std::clamp((luma - 208 * (cr - 128) - 100 * (cb - 128)) / 256, 0, 255);
        const int blue = std::clamp((luma + 517 * (cb - 128)) / 256, 0, 255);
        const auto wanted = static_cast<uint16_t>((red >> 3) << 11 | (green >> 2) << 5 | blue >> 3);
        std::vector<uint16_t> pixels(20 * 10, kUntouched);
        ASSERT_EQ(ColorConverter(kTiled, OMX_COLOR_Format16bitRGB565)
                      .convert(tiles.data(), 128, 64, 2, 1, 5, 4, pixels.data(), 20, 10, 7, 3, 10, 6),
                  android::OK);
        for (size_t i = 0; i < pixels.size(); ++i) {
          const bool inside = i % 20 >= 7 && i % 20 <= 10 && i / 20 >= 3 && i / 20 <= 6;
          ASSERT_EQ(pixels[i], inside ? wanted : kUntouched) << y << " " << cb << " " << cr;
        }
      }
    }
  }
}

TEST(ColorConverter, RefusesOtherFormatsAndCropsThatDoNotFit) {
  EXPECT_FALSE(ColorConverter(kTiled, OMX_COLOR_Format16bitBGR565).isValid());
  EXPECT_FALSE(ColorConverter(OMX_COLOR_FormatYUV420SemiPlanar, OMX_COLOR_Format16bitRGB565).isValid());
  constexpr size_t kMost = SIZE_MAX;
  // Width and height of the source; left, top, right and bottom of its crop, and of the destination's.
  const size_t cases[][10] = {
      {64, 32, 1, 0, 8, 7, 0, 0, 7, 7},    // an odd left edge
      {64, 32, 0, 0, 7, 7, 0, 0, 8, 7},    // widths that differ
      {64, 32, 58, 0, 65, 7, 0, 0, 7, 7},  // beyond the source
      {64, 32, 0, 0, 7, 7, 57, 0, 64, 7},  // beyond the destination
      {64, 32, 8, 0, 6, 7, 8, 0, 6, 7},    // right before left
      {0, 0, 0, 0, kMost, kMost, 0, 0, kMost, kMost},
      {kMost, kMost, 0, 0, 7, 7, 0, 0, 7, 7},
      {kMost, kMost, kMost - 9, kMost - 9, kMost - 2, kMost - 2, 0, 0, 7, 7},
  };
  const std::vector<uint8_t> tiles(2 * kChroma);
  std::vector<uint16_t> pixels(64 * 32, kUntouched);
  for (const auto& c : cases) {
    EXPECT_EQ(ColorConverter(kTiled, OMX_COLOR_Format16bitRGB565)
                  .convert(tiles.data(), c[0], c[1], c[2], c[3], c[4], c[5], pixels.data(), 64, 32, c[6],
                           c[7], c[8], c[9]),
              android::ERROR_UNSUPPORTED)
        << &c - cases;
  }
  EXPECT_EQ(std::count(pixels.begin(), pixels.end(), kUntouched), 64 * 32);
}

}  // namespace
