// Pictures: the scene, the measure of difference, and what devices take and give.
#include <gtest/gtest.h>

#include <array>

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

TEST(Scene, IsTheSameOnEveryMachineAndTakesAnySize) {
  EXPECT_EQ(checksum(sceneAt({320, 240}, 0).bytes), 3133910423U);
  EXPECT_EQ(checksum(sceneAt({320, 240}, 40).bytes), 1766105285U);
  for (const Size size : {Size{2, 2}, Size{2, 300}, Size{640, 2}}) {
    EXPECT_NE(sceneAt(size, 3).bytes, sceneAt(size, 12).bytes) << size.width << "x" << size.height;
  }
}

TEST(Psnr, IsTheUsualOne) {
  std::vector<uint8_t> black(1000, 0);
  const std::vector<uint8_t> other = black;
  EXPECT_EQ(psnr(black, other), kBestPsnr);
  black[999] = 255;
  EXPECT_NEAR(psnr(black, other), 30, 1e-9);  // a thousandth of the peak's square
  // Longer than what is summed up at once.
  const std::vector<uint8_t> many(100'000, 7);
  EXPECT_NEAR(psnr(many, std::vector<uint8_t>(100'000, 6)), 48.1308, 1e-4);
}

TEST(DeviceLayout, InterleavesChromaForEncodersAndAlignsItWhereTheyWantIt) {
  Picture picture;
  picture.resize({176, 144});
  for (size_t i = 0; i < picture.bytes.size(); ++i) picture.bytes[i] = static_cast<uint8_t>(i % 251);
  constexpr size_t kLuma = 176 * 144;
  std::vector<uint8_t> expected = picture.bytes;
  for (size_t i = 0; i < kLuma / 2; ++i) {
    expected[kLuma + i] = picture.bytes[kLuma + i % 2 * (kLuma / 4) + i / 2];
  }
  for (const auto& [version, gap] : {std::pair{HW_VERSION_QCOM_OTHER, 0}, {HW_VERSION_MSM8X60, 1280}}) {
    expected.insert(expected.begin() + kLuma, static_cast<size_t>(gap), 0);
    std::vector<uint8_t> laidOut(expected.size() + 1, 0xEE);
    EXPECT_EQ(layOutForEncoder(picture, version, laidOut.data()), expected.size());
    EXPECT_EQ(laidOut.back(), 0xEE);
    laidOut.pop_back();
    EXPECT_EQ(laidOut, expected);
  }
}

using Window = std::array<uint32_t, 4>;  // width, height, left, top

DECODEDDATAINFO described(uint32_t width, uint32_t height, int32_t type = DECODED_DATA_NATIVE,
                          const Window& crop = {}) {
  return {width, height, type, crop[0], crop[1], crop[2], crop[3]};
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
