#include "tests/frames/harness.h"

#include <hwy/highway.h>
#include <hwy/targets.h>

#include <algorithm>

namespace frames_test {
Bytes Content::bytes(std::size_t size) {
  Bytes result(size);
  for (std::size_t i = 0; i < size; ++i) {
    const auto noise = static_cast<std::uint8_t>(_random());
    result[i] = static_cast<std::uint8_t>(noise < 40 ? 0 : noise > 215 ? 255 : noise);
  }
  return result;
}

void expectBytes(const Bytes& bytes, const Bytes& expected) {
  if (bytes == expected) return;
  for (std::size_t i = 0; i < bytes.size(); ++i) ASSERT_EQ(bytes[i], expected[i]) << "byte " << i;
}

void onEveryTarget(const std::function<void()>& body) {
  auto targets = hwy::SupportedAndGeneratedTargets();
  // What the whole build may use is used unasked, also where the processor lacks what Highway asks for.
  if (targets.empty()) targets.push_back(HWY_STATIC_TARGET);
  for (const std::int64_t target : targets) {
    SCOPED_TRACE(hwy::TargetName(target));
    hwy::SetSupportedTargetsForTest(target);
    hwy::GetChosenTarget().Update(target);
    body();
    if (testing::Test::HasFailure()) break;
  }
  hwy::SetSupportedTargetsForTest(0);
  hwy::GetChosenTarget().Update(hwy::SupportedTargets());
}

void expectConversion(const Conversion& call, const Bytes& src, const Bytes& dst, const Bytes& expected,
                      int result) {
  onEveryTarget([&] {
    Bytes to = dst;
    EXPECT_EQ(call(src.data(), to.data()), result);
    expectBytes(to, expected);
  });
}

void expectInPlace(const InPlace& call, const Bytes& buffer, const Bytes& expected, int result) {
  onEveryTarget([&] {
    Bytes memory = buffer;
    EXPECT_EQ(call(memory.data()), result);
    expectBytes(memory, expected);
  });
}

void forEachSize(const std::function<void(Size)>& body) {
  constexpr unsigned kWidest = 2 * 128 + 5;  // pairs of pixels in vectors of 64 bytes
  for (unsigned width = 1; width <= kWidest; ++width) {
    for (const unsigned height : {width % 7 + 1, width % 3 + 8}) {
      body({width, height});
      if (testing::Test::HasFailure()) return;
    }
  }
  for (const Size s :
       {Size{1, 67}, Size{2, 130}, Size{17, 131}, Size{66, 129}, Size{130, 66}, Size{176, 144}}) {
    body(s);
    if (testing::Test::HasFailure()) return;
  }
}

std::string text(Size s) {
  return std::to_string(s.width) + " x " + std::to_string(s.height);
}

}  // namespace frames_test
