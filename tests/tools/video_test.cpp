// Measures of difference between pictures, and what devices give.
#include <gtest/gtest.h>

#include "tools/video/device_layout.h"
#include "tools/video/psnr.h"
#include "tools/video/ssim.h"

namespace {

using namespace tool;

TEST(Difference, IsMeasuredInTheUsualWay) {
  using Plane = std::vector<uint8_t>;
  EXPECT_EQ(psnr(Plane(1000, 9), Plane(1000, 9)), kBestPsnr);
  // Longer than what is summed up at once.
  EXPECT_NEAR(psnr(Plane(100'000, 7), Plane(100'000, 6)), 48.1308, 1e-4);
  // Flat planes: the luminance term alone, (2ab + c) / (aa + bb + c).
  EXPECT_NEAR(ssim(Plane(64, 100), Plane(64, 120), {8, 8}), 24006.5025 / 24406.5025, 1e-9);
}

TEST(DeviceLayout, RefusesPicturesThatCannotBe) {
  constexpr uint32_t kHuge = 0xFFFFFFFE;
  const DECODEDDATAINFO cases[] = {{0, 2, DECODED_DATA_NATIVE, 0, 0, 0, 0},
                                   {4, 4, DECODED_DATA_NATIVE, 0, 0, 0, 0},  // more than there is
                                   {kHuge, kHuge, DECODED_DATA_NATIVE, 0, 0, 0, 0},
                                   {4, 2, DECODED_DATA_RGB565, 0, 0, 0, 0},
                                   {4, 2, DECODED_DATA_CROPPED, 6, 2, 0, 0},
                                   {4, 2, DECODED_DATA_CROPPED, 4, 2, kHuge, 0},
                                   {4, 2, DECODED_DATA_CROPPED, kHuge, kHuge, 4, 4}};
  Picture picture;
  for (const DECODEDDATAINFO& info : cases)
    EXPECT_TRUE(DecodedPictureReader().read(info, std::vector<uint8_t>(12), picture)) << &info - cases;
}

}  // namespace
