#include "tests/frames/harness.h"

#include <hwy/highway.h>
#include <hwy/targets.h>

#include <algorithm>

namespace frames_test {
namespace {

constexpr std::uint8_t kWatched = 0xA5;
constexpr std::size_t kLeads[] = {0, 1, 7, 16};

std::size_t nextLead() {
  static std::size_t turn = 0;
  return kLeads[turn++ % std::size(kLeads)];
}

}  // namespace

Bytes Content::bytes(std::size_t size) {
  Bytes result(size);
  const unsigned kind = number(0, 3), flat = number(0, 255);
  for (std::size_t i = 0; i < size; ++i) {
    const auto noise = static_cast<std::uint8_t>(_random());
    result[i] = kind == 0                  ? static_cast<std::uint8_t>(noise < 128 ? 0 : 255)
                : kind == 1 && noise < 250 ? static_cast<std::uint8_t>(flat)
                                           : noise;
  }
  return result;
}

ExactBuffer::ExactBuffer(const Bytes& bytes, std::size_t lead)
    : _lead(lead), _size(bytes.size()), _memory(new std::uint8_t[lead + bytes.size()]) {
  std::fill_n(_memory.get(), lead, kWatched);
  std::copy_n(bytes.data(), _size, data());
}

void ExactBuffer::expect(const Bytes& bytes) const {
  const std::uint8_t *start = _memory.get(), *at = start + _lead;
  ASSERT_EQ(bytes.size(), _size);
  if (const auto [here, there] = std::mismatch(at, at + _size, bytes.data()); here != at + _size) {
    ADD_FAILURE() << "byte " << here - at << " of " << _size << " is " << int{*here} << ", not "
                  << int{*there};
  }
  EXPECT_TRUE(std::all_of(start, at, [](std::uint8_t b) { return b == kWatched; }))
      << "written before the buffer";
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
    ExactBuffer from(src, nextLead()), to(dst, nextLead());
    EXPECT_EQ(call(from.data(), to.data()), result);
    to.expect(expected);
    from.expect(src);
  });
}

void expectInPlace(const InPlace& call, const Bytes& buffer, const Bytes& expected, int result) {
  onEveryTarget([&] {
    ExactBuffer memory(buffer, nextLead());
    EXPECT_EQ(call(memory.data()), result);
    memory.expect(expected);
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
