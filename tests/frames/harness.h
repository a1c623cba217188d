// Runs a frame function on every instruction set that processor and build have, and compares result and every
// byte with a reference. Buffers end exactly where they should, for the address sanitizer.
#pragma once

#include <gtest/gtest.h>
#include <hwy/highway.h>
#include <hwy/targets.h>

#include <cstdint>
#include <functional>
#include <optional>
#include <random>
#include <string>

#include "tests/frames/reference.h"

namespace frames_test {

using reference::Bytes;
using reference::Size;

// Noise with a fixed seed, with extremes among it.
class Content {
 public:
  explicit Content(std::uint32_t seed) : _random(seed) {}
  Bytes bytes(std::size_t size) {
    Bytes result(size);
    for (std::size_t i = 0; i < size; ++i) {
      const auto noise = static_cast<std::uint8_t>(_random());
      result[i] = static_cast<std::uint8_t>(noise < 40 ? 0 : noise > 215 ? 255 : noise);
    }
    return result;
  }
  unsigned number(unsigned low, unsigned high) { return std::uniform_int_distribution(low, high)(_random); }

 private:
  std::mt19937 _random;
};

// Calls body once per instruction set, with its name traced.
inline void onEveryTarget(const std::function<void()>& body) {
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

// A function from src to dst. expected: dst after the call; before it dst holds what dst is here.
inline void expectConversion(const std::function<int(const std::uint8_t* src, std::uint8_t* dst)>& call,
                             const Bytes& src, const Bytes& dst, const Bytes& expected, int result) {
  onEveryTarget([&] {
    Bytes to = dst;
    EXPECT_EQ(call(src.data(), to.data()), result);
    if (to == expected) return;
    for (std::size_t i = 0; i < to.size(); ++i) ASSERT_EQ(to[i], expected[i]) << "byte " << i;
  });
}

// A function that works on buffer in place.
inline void expectInPlace(const std::function<int(std::uint8_t* buffer)>& call, const Bytes& buffer,
                          const Bytes& expected, int result) {
  expectConversion([&](auto*, auto* memory) { return call(memory); }, {}, buffer, expected, result);
}

// Every width from 1 past two of the longest vectors of any kernel, each with a few heights, and some odd
// sizes.
inline void forEachSize(const std::function<void(Size)>& body) {
  constexpr unsigned kWidest = 2 * 128 + 5;  // pairs of pixels in vectors of 64 bytes
  std::vector<Size> sizes{{1, 67}, {2, 130}, {17, 131}, {66, 129}, {130, 66}, {176, 144}};
  for (unsigned width = 1; width <= kWidest; ++width) {
    for (const unsigned height : {width % 7 + 1, width % 3 + 8}) sizes.push_back({width, height});
  }
  for (const Size s : sizes) {
    if (!testing::Test::HasFailure()) body(s);
  }
}

inline std::string text(Size s) {
  return std::to_string(s.width) + " x " + std::to_string(s.height);
}

}  // namespace frames_test
