#include <gtest/gtest.h>

#include <memory>
#include <tuple>
#include <vector>

#include "omxbridge/frames/scale.h"
#include "tests/frames/harness.h"
#include "tests/frames/reference_scale.h"

namespace frames_test {
namespace {

using namespace webrtc;

void expectScaled(Content& content, Size from, Size to) {
  SCOPED_TRACE(text(from) + " to " + text(to));
  const Bytes src = content.bytes(reference::i420Bytes(from));
  const std::vector<int> expected = reference::bilinear(src, from, to);
  const Bytes dst = content.bytes(expected.size() + content.number(0, 1) * 16);
  const std::size_t written = to.area() + std::size_t{to.width / 2} * (to.height / 2) * 2;
  std::vector<Bytes> outputs;
  onEveryTarget([&] {
    Bytes output = dst;
    unsigned char* destination = output.data();
    auto size = static_cast<unsigned>(dst.size());
    EXPECT_EQ(ScaleBilinear(src.data(), destination, from.width, from.height, to.width, to.height, size),
              static_cast<int>(to.height));
    EXPECT_EQ(destination, output.data());
    EXPECT_EQ(size, dst.size());
    for (std::size_t i = 0; i < dst.size(); ++i) {
      if (i >= written) {
        ASSERT_EQ(output[i], dst[i]) << i;
      } else if (expected[i] >= 0) {
        ASSERT_EQ(output[i], expected[i]) << i;
      }
    }
    // Bytes that nobody wrote are nobody's business, but they are the same everywhere.
    outputs.push_back(output);
    EXPECT_EQ(output, outputs.front());
  });
}

TEST(ScaleBilinearArithmetic, EqualsReferenceForEveryWidth) {
  Content content(41);
  forEachSize([&](Size from) {
    expectScaled(content, from, {content.number(1, 2 * from.width), content.number(1, 2 * from.height)});
    expectScaled(content, from, {content.number(1, from.width + 1), from.height});
    expectScaled(content, from, {from.width, content.number(1, 3 * from.height)});
  });
  for (unsigned width = 1; width <= 200 && !HasFailure(); ++width) {
    expectScaled(content, {2 * width, 3}, {width, 5});
    expectScaled(content, {width, 3}, {2 * width, 5});
  }
}

TEST(ScaleBilinearMemory, ReplacesADestinationThatIsTooSmallAndTakesTheSourceForOne) {
  const Size from{48, 20};
  const Bytes src = Content(43).bytes(reference::i420Bytes(from));
  for (const Size to : {Size{31, 33}, Size{24, 10}, Size{72, 33}}) {
    const std::size_t needed = reference::i420Bytes(to);
    std::vector<Bytes> results;
    // One that is a byte too small, and the source itself.
    for (const std::size_t has : {needed - 1, src.size()}) {
      const bool isSource = has == src.size();
      unsigned char* destination = new unsigned char[has];
      if (isSource) std::copy_n(src.data(), has, destination);
      auto size = static_cast<unsigned>(has);
      EXPECT_EQ(ScaleBilinear(isSource ? destination : src.data(), destination, from.width, from.height,
                              to.width, to.height, size),
                static_cast<int>(to.height));
      const std::unique_ptr<unsigned char[]> owner(destination);
      EXPECT_EQ(size, std::max(isSource ? has : 0, needed));
      Bytes result(to.area() + std::size_t{to.width / 2} * (to.height / 2) * 2);
      std::copy_n(destination, result.size(), result.data());
      results.push_back(result);
      EXPECT_EQ(result, results.front());
    }
  }
  unsigned char* destination = nullptr;
  unsigned size = 3;
  const unsigned refused[][4] = {{0, 2, 2, 2},     {2, 0, 2, 2},     {2, 2, 0, 2},        {2, 2, 2, 0},
                                 {65536, 2, 2, 2}, {2, 2, 65536, 1}, {2, 2, 65535, 65535}};
  for (const auto& s : refused) {
    EXPECT_EQ(ScaleBilinear(src.data(), destination, s[0], s[1], s[2], s[3], size), -1);
  }
  EXPECT_EQ(destination, nullptr);
}

TEST(Interpolator, TakesOnlyPairsThatItDoesNotSupport) {
  interpolator scaler;
  const auto unknown = static_cast<interpolatorType>(1);
  EXPECT_EQ(scaler.Method(kBilinear), 1);
  EXPECT_EQ(scaler.Method(unknown), 0);
  EXPECT_EQ(scaler.SupportedVideoType(kYV12, kYV12), 0);
  EXPECT_EQ(scaler.SupportedVideoType(kI420, kYV12), -1);

  std::uint8_t src[6] = {10, 20, 30, 40, 50, 60}, memory[6];
  unsigned char* destination = memory;
  unsigned size = 6;
  // Each way of being refused ends the configuration before.
  for (const auto& [width, type, method] :
       {std::tuple{2u, kI420, kBilinear}, {0u, kRGB24, kBilinear}, {2u, kRGB24, unknown}}) {
    EXPECT_EQ(scaler.Interpolate(src, destination, size), -2);
    ASSERT_EQ(scaler.Set(2, 2, 2, 2, kRGB24, kARGB, kBilinear), 0);
    EXPECT_EQ(scaler.Interpolate(nullptr, destination, size), -1);
    EXPECT_EQ(scaler.Interpolate(src, destination, size), 2);
    EXPECT_EQ(scaler.Set(2, 2, width, 2, type, type, method), -1);
  }
  EXPECT_EQ(scaler.Interpolate(src, destination, size), -2);
}

}  // namespace
}  // namespace frames_test
