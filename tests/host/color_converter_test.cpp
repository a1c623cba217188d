#include <gtest/gtest.h>
#include <string.h>

#include <algorithm>
#include <memory>
#include <random>
#include <string>
#include <vector>

#include <media/stagefright/ColorConverter.h>
#include <media/stagefright/MediaErrors.h>

namespace {

using android::ColorConverter;

constexpr auto kTiled = static_cast<OMX_COLOR_FORMATTYPE>(0x7FA30C03);
constexpr uint16_t kUntouched = 0x5A3C;

size_t up(size_t value, size_t multiple) {
  return (value + multiple - 1) / multiple * multiple;
}

// The layout, pixel by pixel.
struct Layout {
  Layout(size_t width, size_t height)
      : tw(up(width, 128) / 64),
        ty(up(height, 32) / 32),
        tc(up(height, 64) / 64),
        chromaStart(up(tw * ty * 2048, 8192)),
        bytes(chromaStart + tw * tc * 2048) {}

  static size_t tile(size_t x, size_t y, size_t w, size_t h) {
    if (y % 2 == 1) return (y - 1) * w + x + x / 4 * 4 + 2;
    if (h % 2 == 1 && y == h - 1) return y * w + x;
    return y * w + x + (x + 2) / 4 * 4;
  }
  size_t luma(size_t x, size_t y) const { return 2048 * tile(x / 64, y / 32, tw, ty) + y % 32 * 64 + x % 64; }
  size_t cb(size_t x, size_t y) const {
    const size_t cx = x / 2 * 2;
    const size_t cy = y / 2;
    return chromaStart + 2048 * tile(cx / 64, cy / 32, tw, tc) + cy % 32 * 64 + cx % 64;
  }

  size_t tw, ty, tc, chromaStart, bytes;
};

uint16_t rgb565(int y, int cb, int cr) {
  const int luma = 298 * (y - 16);
  const int u = cb - 128;
  const int v = cr - 128;
  const int blue = std::clamp((luma + 517 * u) / 256, 0, 255);
  const int green = std::clamp((luma - 208 * v - 100 * u) / 256, 0, 255);
  const int red = std::clamp((luma + 409 * v) / 256, 0, 255);
  return static_cast<uint16_t>((red >> 3) << 11 | (green >> 2) << 5 | blue >> 3);
}

struct Crop {
  size_t left, top, right, bottom;
};

// A source of exactly its size, so that reading behind it shows.
struct Source {
  Source(size_t w, size_t h, std::mt19937& random, bool extreme = false)
      : width(w), height(h), layout(w, h), bytes(layout.bytes) {
    constexpr uint8_t kExtremes[] = {0, 1, 15, 16, 17, 127, 128, 129, 234, 235, 236, 240, 254, 255};
    std::generate(bytes.begin(), bytes.end(), [&] {
      return extreme ? kExtremes[random() % std::size(kExtremes)] : static_cast<uint8_t>(random());
    });
  }

  uint16_t pixel(size_t x, size_t y) const {
    const size_t cb = layout.cb(x, y);
    return rgb565(bytes[layout.luma(x, y)], bytes[cb], bytes[cb + 1]);
  }

  size_t width, height;
  Layout layout;
  std::vector<uint8_t> bytes;
};

struct Destination {
  Destination(size_t w, size_t h) : width(w), height(h), pixels(w * h, kUntouched) {}

  // `aligned`: decoders hand over the size of their tiles' area and crop to the picture.
  android::status_t from(const Source& source, const Crop& src, const Crop& dst, bool aligned = false) {
    const size_t columns = aligned ? up(source.width, 128) : source.width;
    const size_t rows = aligned ? up(source.height, 32) : source.height;
    return ColorConverter(kTiled, OMX_COLOR_Format16bitRGB565)
        .convert(source.bytes.data(), columns, rows, src.left, src.top, src.right, src.bottom, pixels.data(),
                 width, height, dst.left, dst.top, dst.right, dst.bottom);
  }

  size_t width, height;
  std::vector<uint16_t> pixels;
};

TEST(ColorConverter, EqualsTheAddressFormulaForAnySizeAndCrop) {
  std::mt19937 random(7);
  const auto within = [&random](size_t low, size_t high) { return low + random() % (high - low + 1); };
  for (int round = 0; round < 300; ++round) {
    const Source source(within(1, 400), within(1, 300), random, round % 4 == 3);
    Crop src{};
    if (round % 3 == 0) {
      src = {0, 0, source.width - 1, source.height - 1};
    } else {
      src.left = within(0, source.width - 1) & ~size_t{1};
      src.right = within(src.left, source.width - 1);
      src.top = within(0, source.height - 1);
      src.bottom = within(src.top, source.height - 1);
    }
    const size_t left = within(0, 9);
    const size_t top = within(0, 9);
    const Crop dst{left, top, left + src.right - src.left, top + src.bottom - src.top};
    Destination destination(dst.right + 1 + within(0, 5), dst.bottom + 1 + within(0, 5));

    ASSERT_EQ(destination.from(source, src, dst, round % 2 == 0), android::OK);
    for (size_t y = 0; y < destination.height; ++y) {
      for (size_t x = 0; x < destination.width; ++x) {
        const bool inside = x >= left && x <= dst.right && y >= top && y <= dst.bottom;
        const uint16_t expected = inside ? source.pixel(src.left + x - left, src.top + y - top) : kUntouched;
        ASSERT_EQ(destination.pixels[y * destination.width + x], expected)
            << source.width << "x" << source.height << " crop " << src.left << "," << src.top << " "
            << src.right << "," << src.bottom << " at " << x << "," << y;
      }
    }
  }
}

TEST(ColorConverter, FindsKnownPixelsAtKnownAddresses) {
  struct Case {
    size_t x, y, luma, cb;
  };
  const Case cases[] = {{100, 70, 18852, 47332}, {150, 40, 8726, 54550}, {170, 140, 37674, 61866}};
  for (const Case& each : cases) {
    std::mt19937 random(1);
    Source source(176, 144, random);
    std::fill(source.bytes.begin(), source.bytes.end(), uint8_t{0});
    source.bytes[each.luma] = 81;  // red
    source.bytes[each.cb] = 90;
    source.bytes[each.cb + 1] = 240;
    Destination destination(176, 144);
    const Crop whole{0, 0, 175, 143};
    ASSERT_EQ(destination.from(source, whole, whole), android::OK);
    EXPECT_EQ(destination.pixels[each.y * 176 + each.x], 0xF800);
  }
}

TEST(ColorConverter, KnowsOnePairOfFormats) {
  EXPECT_TRUE(ColorConverter(kTiled, OMX_COLOR_Format16bitRGB565).isValid());
  const OMX_COLOR_FORMATTYPE others[] = {
      OMX_COLOR_FormatUnused, OMX_COLOR_FormatYUV420Planar, OMX_COLOR_FormatYUV420SemiPlanar,
      OMX_QCOM_COLOR_FormatYVU420SemiPlanar, OMX_TI_COLOR_FormatYUV420PackedSemiPlanar};
  std::mt19937 random(1);
  const Source source(4, 4, random);
  for (const OMX_COLOR_FORMATTYPE other : others) {
    ColorConverter converter(other, OMX_COLOR_Format16bitRGB565);
    EXPECT_FALSE(converter.isValid());
    uint16_t pixel = kUntouched;
    EXPECT_EQ(converter.convert(source.bytes.data(), 4, 4, 0, 0, 0, 0, &pixel, 1, 1, 0, 0, 0, 0),
              android::ERROR_UNSUPPORTED);
    EXPECT_EQ(pixel, kUntouched);
  }
  EXPECT_FALSE(ColorConverter(kTiled, OMX_COLOR_Format16bitBGR565).isValid());
}

TEST(ColorConverter, RefusesCropsThatDoNotFit) {
  constexpr size_t kMost = SIZE_MAX;
  struct Case {
    const char* what;
    size_t srcWidth, srcHeight;
    Crop src;
    size_t dstWidth, dstHeight;
    Crop dst;
  };
  const Case cases[] = {
      {"odd left edge", 64, 32, {1, 0, 8, 7}, 64, 32, {0, 0, 7, 7}},
      {"widths differ", 64, 32, {0, 0, 7, 7}, 64, 32, {0, 0, 8, 7}},
      {"beyond the source's right", 64, 32, {0, 0, 64, 7}, 128, 64, {0, 0, 64, 7}},
      {"beyond the destination's right", 64, 32, {0, 0, 7, 7}, 64, 32, {57, 0, 64, 7}},
      {"right before left", 64, 32, {8, 0, 6, 7}, 64, 32, {8, 0, 6, 7}},
      {"no source", 0, 0, {0, 0, kMost, kMost}, 64, 32, {0, 0, kMost, kMost}},
      {"sizes without end", kMost, kMost, {0, 0, 7, 7}, 64, 32, {0, 0, 7, 7}},
      {"destination without end", 64, 32, {0, 0, 7, 7}, kMost, kMost, {0, 0, 7, 7}},
      {"far away", kMost, kMost, {kMost - 9, kMost - 9, kMost - 2, kMost - 2}, 64, 32, {0, 0, 7, 7}},
  };
  std::mt19937 random(1);
  const Source source(64, 32, random);
  ColorConverter converter(kTiled, OMX_COLOR_Format16bitRGB565);
  std::vector<uint16_t> pixels(128 * 64, kUntouched);
  const auto convert = [&](const void* from, void* to, const Case& each) {
    return converter.convert(from, each.srcWidth, each.srcHeight, each.src.left, each.src.top, each.src.right,
                             each.src.bottom, to, each.dstWidth, each.dstHeight, each.dst.left, each.dst.top,
                             each.dst.right, each.dst.bottom);
  };
  for (const Case& each : cases) {
    EXPECT_EQ(convert(source.bytes.data(), pixels.data(), each), android::ERROR_UNSUPPORTED) << each.what;
  }
  const Case good{"", 64, 32, {0, 0, 7, 7}, 64, 32, {0, 0, 7, 7}};
  EXPECT_EQ(convert(nullptr, pixels.data(), good), android::ERROR_UNSUPPORTED);
  EXPECT_EQ(convert(source.bytes.data(), nullptr, good), android::ERROR_UNSUPPORTED);
  EXPECT_TRUE(std::all_of(pixels.begin(), pixels.end(), [](uint16_t pixel) { return pixel == kUntouched; }));
  EXPECT_EQ(convert(source.bytes.data(), pixels.data(), good), android::OK);
}

}  // namespace
