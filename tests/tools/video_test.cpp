// Pictures: the scene, the measure of difference, and what devices take and give.
#include <gtest/gtest.h>

#include <algorithm>

#include "omxbridge/hardware_version.h"
#include "tools/video/device_layout.h"
#include "tools/video/psnr.h"
#include "tools/video/scene.h"

namespace {

using namespace tool;

Picture sceneAt(Size size, int frame) {
  Scene scene(size, FrameRate());
  Picture picture;
  for (int i = 0; i <= frame; ++i) EXPECT_TRUE(scene.next(picture).value());
  return picture;
}

// 32 bits that any change of the bytes changes.
uint32_t checksum(const std::vector<uint8_t>& bytes) {
  uint32_t sum = 2166136261U;
  for (const uint8_t byte : bytes) sum = (sum ^ byte) * 16777619U;
  return sum;
}

TEST(Scene, IsTheSameOnEveryMachine) {
  EXPECT_EQ(checksum(sceneAt({320, 240}, 0).bytes), 3133910423U);
  EXPECT_EQ(checksum(sceneAt({320, 240}, 40).bytes), 1766105285U);
}

TEST(Scene, MovesAndTakesAnySize) {
  for (const Size size :
       {Size{2, 2}, Size{16, 16}, Size{176, 144}, Size{2, 300}, Size{640, 2}, Size{1280, 720}}) {
    const Picture one = sceneAt(size, 3);
    const Picture other = sceneAt(size, 12);
    EXPECT_EQ(one.bytes.size(), pictureBytes(size));
    EXPECT_NE(one.bytes, other.bytes) << size.width << "x" << size.height;
  }
}

TEST(Psnr, IsTheUsualOne) {
  const std::vector<uint8_t> black(1000, 0);
  std::vector<uint8_t> other = black;
  EXPECT_EQ(psnr(black, other), kBestPsnr);
  other[999] = 255;
  EXPECT_NEAR(psnr(black, other), 30, 1e-9);  // a thousandth of the peak's square
  EXPECT_NEAR(psnr(black, std::vector<uint8_t>(1000, 255)), 0, 1e-9);
  // Longer than what is summed up at once.
  const std::vector<uint8_t> many(100'000, 7);
  EXPECT_NEAR(psnr(many, std::vector<uint8_t>(100'000, 6)), 48.1308, 1e-4);
}

TEST(DeviceLayout, InterleavesChromaForEncodersAndAlignsItWhereTheyWantIt) {
  Picture picture;
  picture.resize({176, 144});
  for (size_t i = 0; i < picture.bytes.size(); ++i) picture.bytes[i] = static_cast<uint8_t>(i % 251);
  const size_t luma = 25344;
  std::vector<uint8_t> plain(38016 + 1, 0xEE);
  EXPECT_EQ(layOutForEncoder(picture, HW_VERSION_QCOM_OTHER, plain.data()), 38016U);
  EXPECT_EQ(plain.back(), 0xEE);
  EXPECT_TRUE(std::equal(picture.bytes.begin(), picture.bytes.begin() + luma, plain.begin()));
  EXPECT_EQ(plain[luma], picture.bytes[luma]);             // the first Cb
  EXPECT_EQ(plain[luma + 1], picture.bytes[luma + 6336]);  // and Cr

  std::vector<uint8_t> aligned(39296 + 1, 0xEE);
  EXPECT_EQ(layOutForEncoder(picture, HW_VERSION_MSM8X60, aligned.data()), 39296U);
  EXPECT_EQ(aligned.back(), 0xEE);
  EXPECT_TRUE(std::equal(plain.begin(), plain.begin() + luma, aligned.begin()));
  EXPECT_TRUE(
      std::all_of(aligned.begin() + luma, aligned.begin() + 26624, [](uint8_t byte) { return byte == 0; }));
  EXPECT_TRUE(std::equal(plain.begin() + luma, plain.end() - 1, aligned.begin() + 26624));
}

struct Window {
  uint32_t width = 0;
  uint32_t height = 0;
  uint32_t left = 0;
  uint32_t top = 0;
};

DECODEDDATAINFO described(uint32_t width, uint32_t height, int32_t type = DECODED_DATA_NATIVE,
                          const Window& crop = Window()) {
  return {width, height, type, crop.width, crop.height, crop.left, crop.top};
}

TEST(DeviceLayout, ReadsWhatDecodersGive) {
  DecodedPictureReader reader;
  Picture picture;

  // 4 x 2, semi-planar.
  const std::vector<uint8_t> native{1, 2, 3, 4, 5, 6, 7, 8, 11, 21, 12, 22};
  DECODEDDATAINFO info = described(4, 2, DECODED_DATA_NATIVE);
  EXPECT_FALSE(reader.read(info, native, picture));
  EXPECT_EQ(picture.bytes, (std::vector<uint8_t>{1, 2, 3, 4, 5, 6, 7, 8, 11, 12, 21, 22}));

  // The same in the middle of a padded picture of 8 x 6.
  std::vector<uint8_t> padded(8 * 6 * 3 / 2, 99);
  for (ptrdiff_t row = 0; row < 2; ++row) {
    std::copy_n(native.begin() + 4 * row, 4, padded.begin() + (2 + row) * 8 + 2);
  }
  std::copy_n(native.begin() + 8, 4, padded.begin() + 8 * 6 + 1 * 8 + 2);
  info = described(8, 6, DECODED_DATA_CROPPED, {4, 2, 2, 2});
  EXPECT_FALSE(reader.read(info, padded, picture));
  EXPECT_EQ(picture.size, (Size{4, 2}));
  EXPECT_EQ(picture.bytes, (std::vector<uint8_t>{1, 2, 3, 4, 5, 6, 7, 8, 11, 12, 21, 22}));

  // White and black in RGB565.
  const std::vector<uint8_t> rgb{0xFF, 0xFF, 0, 0, 0xFF, 0xFF, 0, 0};
  info = described(2, 2, DECODED_DATA_RGB565);
  EXPECT_FALSE(reader.read(info, rgb, picture));
  EXPECT_GT(picture.bytes[0], 225);
  EXPECT_EQ(picture.bytes[1], 16);
}

TEST(DeviceLayout, RefusesPicturesThatCannotBe) {
  constexpr uint32_t kHuge = 0xFFFFFFFE;
  const DECODEDDATAINFO cases[] = {
      described(0, 2),
      described(4, 4),  // more than there is
      described(kHuge, kHuge),
      described(65536, 65536),
      described(3, 2),
      described(4, 2, DECODED_DATA_RGB565),
      described(4, 2, DECODED_DATA_CROPPED),
      described(4, 2, DECODED_DATA_CROPPED, {6, 2, 0, 0}),
      described(4, 2, DECODED_DATA_CROPPED, {2, 2, 4, 0}),
      described(4, 2, DECODED_DATA_CROPPED, {4, 2, kHuge, 0}),
      described(4, 2, DECODED_DATA_CROPPED, {4, 2, 0, kHuge}),
      described(4, 2, DECODED_DATA_CROPPED, {2, 2, 1, 0}),
      described(4, 2, DECODED_DATA_CROPPED, {kHuge, kHuge, 4, 4}),
  };
  const std::vector<uint8_t> data(12);
  DecodedPictureReader reader;
  Picture picture;
  for (const DECODEDDATAINFO& info : cases) {
    EXPECT_TRUE(reader.read(info, data, picture))
        << info.width << "x" << info.height << " type " << info.dataType;
  }
}

}  // namespace
