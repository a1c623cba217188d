#include "omxbridge/frames/scale.h"

#include <gtest/gtest.h>

#include "tests/frames/harness.h"
#include "tests/frames/reference_scale.h"

namespace frames_test {
namespace {

using namespace webrtc;

struct InPlaceScaler {
  const char* name;
  int (*call)(unsigned width, unsigned height, unsigned char* buffer);
  void (*reference)(Bytes& buffer, Size s);
  int (*result)(Size s);
};

int halfRows(Size s) {
  return static_cast<int>(s.width / 2 * s.height * 3);
}

const InPlaceScaler kInPlace[] = {
    {"UpHalf", ScaleI420UpHalfFrame, reference::upHalf,
     [](Size s) { return static_cast<int>(reference::i420Bytes(s)); }},
    {"DownHalf", ScaleI420DownHalfFrame, reference::downHalf, halfRows},
    {"Quarter", ScaleI420FrameQuarter, reference::quarter, halfRows},
};

class ScaleInPlace : public testing::TestWithParam<InPlaceScaler> {};
INSTANTIATE_TEST_SUITE_P(Functions, ScaleInPlace, testing::ValuesIn(kInPlace),
                         [](const auto& test) { return std::string(test.param.name); });

TEST_P(ScaleInPlace, EqualsReferenceForEverySize) {
  const InPlaceScaler& function = GetParam();
  Content content(31);
  forEachSize([&](Size s) {
    SCOPED_TRACE(text(s));
    const Bytes buffer = content.bytes(reference::i420Bytes(s));
    Bytes expected = buffer;
    function.reference(expected, s);
    expectInPlace([&](auto* memory) { return function.call(s.width, s.height, memory); }, buffer, expected,
                  function.result(s));
  });
  EXPECT_EQ(function.call(0, 2, nullptr), -1);
  EXPECT_EQ(function.call(2, 0, nullptr), -1);
  EXPECT_EQ(function.call(0xFFFFFFFF, 0xFFFFFFFF, nullptr), -1);
}

// --- Scalers that may grow the buffer ---

struct Growing {
  const char* name;
  int (*call)(unsigned, unsigned, unsigned char*&, unsigned, unsigned&, unsigned&);
  bool (*accepts)(Size s);
  Bytes (*reference)(const Bytes& src, Size s, Size& out);
};

template <unsigned kGroup>
Bytes enlarged(const Bytes& src, Size s, Size& out) {
  out = {s.width / kGroup * (kGroup + 1), s.height / kGroup * (kGroup + 1)};
  return reference::enlarge(kGroup, src, s);
}

const Growing kGrowing[] = {
    {"Down1_3", ScaleI420Down1_3,
     [](Size s) {
       return s.width > 5 && s.height > 5 && s.width % 2 == 0 && s.height % 2 == 0 && s.height / 3 % 2 == 0;
     },
     reference::third},
    {"Up3_2", ScaleI420Up3_2, [](Size s) { return s.width % 4 == 0 && s.height % 4 == 0; }, enlarged<2>},
    {"Up2", ScaleI420Up2, [](Size s) { return s.width % 2 == 0 && s.height % 2 == 0; }, enlarged<1>},
};

// A buffer from new[], as the functions want it.
struct Owned {
  explicit Owned(const Bytes& bytes) : memory(new unsigned char[bytes.size()]) {
    std::copy_n(bytes.data(), bytes.size(), memory);
  }
  ~Owned() { delete[] memory; }
  Owned(const Owned&) = delete;
  unsigned char* memory;
};

class ScaleGrowing : public testing::TestWithParam<Growing> {
 protected:
  // capacity: what the buffer has, at least the source frame.
  void expectScaled(const Bytes& src, Size s, std::size_t capacity) {
    const Growing& function = GetParam();
    SCOPED_TRACE(text(s) + " in " + std::to_string(capacity));
    Size out{};
    const Bytes expected = function.reference(src, s, out);
    Bytes initial(capacity);
    for (std::size_t i = 0; i < capacity; ++i) initial[i] = i < src.size() ? src[i] : 0x5A;
    onEveryTarget([&] {
      Owned buffer(initial);
      unsigned char* const before = buffer.memory;
      Size given{};
      EXPECT_EQ(function.call(s.width, s.height, buffer.memory, static_cast<unsigned>(capacity), given.width,
                              given.height),
                static_cast<int>(expected.size()));
      EXPECT_EQ(text(given), text(out));
      EXPECT_EQ(buffer.memory == before, expected.size() <= capacity);
      EXPECT_TRUE(std::equal(expected.data(), expected.data() + expected.size(), buffer.memory));
      if (expected.size() >= capacity || expected.size() < src.size()) return;
      EXPECT_TRUE(std::all_of(buffer.memory + expected.size(), buffer.memory + capacity,
                              [](unsigned char b) { return b == 0x5A; }));
    });
  }
};
INSTANTIATE_TEST_SUITE_P(Functions, ScaleGrowing, testing::ValuesIn(kGrowing),
                         [](const auto& test) { return std::string(test.param.name); });

TEST_P(ScaleGrowing, EqualsReferenceAndGrowsWhereItMust) {
  Content content(32);
  unsigned scaled = 0;
  forEachSize([&](Size any) {
    const Size s{any.width * 2, any.height * 2};
    if (!GetParam().accepts(s)) return;
    const Bytes src = content.bytes(reference::i420Bytes(s));
    expectScaled(src, s, src.size());
    expectScaled(src, s, src.size() * 4 + 100);
    ++scaled;
  });
  EXPECT_GT(scaled, 50u);
}

TEST_P(ScaleGrowing, RefusesWithoutTouchingAnything) {
  const Growing& function = GetParam();
  const Bytes src = Content(33).bytes(1000);
  for (unsigned k = 0; k < 20 * 20; ++k) {
    const Size s{k % 20, k / 20};
    const bool fits = !function.accepts(s) || s.area() == 0;
    Owned buffer(src);
    unsigned char* const before = buffer.memory;
    unsigned width = 7, height = 8;
    const auto size = fits ? 1000u : static_cast<unsigned>(reference::i420Bytes(s)) - 1;
    EXPECT_EQ(function.call(s.width, s.height, buffer.memory, size, width, height), -1) << text(s);
    EXPECT_EQ(buffer.memory, before);
    EXPECT_EQ(width * 10 + height, 78u);
    EXPECT_TRUE(std::equal(src.data(), src.data() + src.size(), buffer.memory));
  }
  unsigned char* none = nullptr;
  unsigned width = 0, height = 0;
  EXPECT_EQ(function.call(48, 48, none, 1 << 20, width, height), -1);
  EXPECT_EQ(function.call(0x80000000, 0x80000000, none, 0xFFFFFFFF, width, height), -1);
}

}  // namespace
}  // namespace frames_test
