// Pictures: the measures of difference, and what devices give.
#include <gtest/gtest.h>

#include "tools/video/device_layout.h"
#include "tools/video/psnr.h"
#include "tools/video/ssim.h"

namespace {

using namespace tool;

TEST(Difference, IsMeasuredInTheUsualWay) {
  std::vector<uint8_t> black(1000, 0);
  const std::vector<uint8_t> other = black;
  EXPECT_EQ(psnr(black, other), kBestPsnr);
  black[999] = 255;
  EXPECT_NEAR(psnr(black, other), 30, 1e-9);  // a thousandth of the peak's square
  // Longer than what is summed up at once.
  const std::vector<uint8_t> many(100'000, 7);
  EXPECT_NEAR(psnr(many, std::vector<uint8_t>(100'000, 6)), 48.1308, 1e-4);

  // Flat planes: the luminance term alone, (2ab + c) / (aa + bb + c).
  const std::vector<uint8_t> flat(64, 100);
  EXPECT_EQ(ssim(flat, flat, {8, 8}), 1);
  EXPECT_NEAR(ssim(flat, std::vector<uint8_t>(64, 120), {8, 8}), 24006.5025 / 24406.5025, 1e-9);
}

TEST(DeviceLayout, RefusesPicturesThatCannotBe) {
  constexpr uint32_t kHuge = 0xFFFFFFFE;
  const DECODEDDATAINFO cases[] = {
      {0, 2, DECODED_DATA_NATIVE, 0, 0, 0, 0},
      {4, 4, DECODED_DATA_NATIVE, 0, 0, 0, 0},  // more than there is
      {kHuge, kHuge, DECODED_DATA_NATIVE, 0, 0, 0, 0},
      {4, 2, DECODED_DATA_RGB565, 0, 0, 0, 0},
      {4, 2, DECODED_DATA_CROPPED, 6, 2, 0, 0},
      {4, 2, DECODED_DATA_CROPPED, 4, 2, kHuge, 0},
      {4, 2, DECODED_DATA_CROPPED, kHuge, kHuge, 4, 4},
  };
  DecodedPictureReader reader;
  Picture picture;
  for (const DECODEDDATAINFO& info : cases) {
    EXPECT_TRUE(reader.read(info, std::vector<uint8_t>(12), picture)) << &info - cases;
  }
}

}  // namespace
