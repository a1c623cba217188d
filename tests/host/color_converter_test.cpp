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
  ColorConverter converter(kTiled, OMX_COLOR_Format16bitRGB565);
  const int extremes[] = {0, 15, 16, 17, 81, 90, 128, 129, 235, 240, 255};
  for (size_t k = 0; k < 11 * 11 * 11; ++k) {
    const int y = extremes[k % 11], cb = extremes[k / 11 % 11], cr = extremes[k / 121];
    std::vector<uint8_t> tiles(2 * kChroma, static_cast<uint8_t>(y));
    for (size_t i = kChroma; i < tiles.size(); ++i) tiles[i] = static_cast<uint8_t>(i % 2 == 0 ? cb : cr);
    const int luma = 298 * (y - 16);
    const int red = std::clamp((luma + 409 * (cr - 128)) / 256, 0, 255);
    const int green = std::clamp((luma - 208 * (cr - 128) - 100 * (cb - 128)) / 256, 0, 255);
    const int blue = std::clamp((luma + 517 * (cb - 128)) / 256, 0, 255);
    std::vector<uint16_t> pixels(20 * 10, kUntouched), wanted = pixels;
    for (size_t row = 3; row <= 6; ++row)
      std::fill_n(&wanted[row * 20 + 7], 4,
                  static_cast<uint16_t>((red >> 3) << 11 | (green >> 2) << 5 | blue >> 3));
    ASSERT_EQ(converter.convert(tiles.data(), 128, 64, 2, 1, 5, 4, pixels.data(), 20, 10, 7, 3, 10, 6),
              android::OK);
    ASSERT_EQ(pixels, wanted) << y << " " << cb << " " << cr;
  }
}

TEST(ColorConverter, RefusesOtherFormatsAndCropsThatDoNotFit) {
  EXPECT_FALSE(ColorConverter(kTiled, OMX_COLOR_Format16bitBGR565).isValid());
  EXPECT_FALSE(ColorConverter(OMX_COLOR_FormatYUV420SemiPlanar, OMX_COLOR_Format16bitRGB565).isValid());
  constexpr size_t kMost = SIZE_MAX;
  // Width and height of the source; left, top, right and bottom of its crop, and of the destination's. An odd
  // left edge, widths that differ, one beyond the source, beyond the destination, right before left, and sums
  // that wrap.
  const size_t cases[][10] = {{64, 32, 1, 0, 8, 7, 0, 0, 7, 7},
                              {64, 32, 0, 0, 7, 7, 0, 0, 8, 7},
                              {64, 32, 58, 0, 65, 7, 0, 0, 7, 7},
                              {64, 32, 0, 0, 7, 7, 57, 0, 64, 7},
                              {64, 32, 8, 0, 6, 7, 8, 0, 6, 7},
                              {0, 0, 0, 0, kMost, kMost, 0, 0, kMost, kMost},
                              {kMost, kMost, kMost - 9, kMost - 9, kMost - 2, kMost - 2, 0, 0, 7, 7}};
  ColorConverter converter(kTiled, OMX_COLOR_Format16bitRGB565);
  const std::vector<uint8_t> tiles(2 * kChroma);
  std::vector<uint16_t> pixels(64 * 32, kUntouched);
  for (const auto& c : cases) {
    EXPECT_EQ(converter.convert(tiles.data(), c[0], c[1], c[2], c[3], c[4], c[5], pixels.data(), 64, 32, c[6],
                                c[7], c[8], c[9]),
              android::ERROR_UNSUPPORTED)
        << &c - cases;
  }
  EXPECT_EQ(std::count(pixels.begin(), pixels.end(), kUntouched), 64 * 32);
}

}  // namespace
