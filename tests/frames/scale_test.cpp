#include "omxbridge/frames/scale.h"

#include <gtest/gtest.h>

#include <memory>
#include <tuple>
#include <vector>

#include "tests/frames/harness.h"
#include "tests/frames/reference_scale.h"

namespace frames_test {
namespace {

using namespace webrtc;

struct InPlaceScaler {
  std::string name;
  int (*call)(unsigned width, unsigned height, unsigned char* buffer);
  void (*reference)(Bytes& buffer, Size s);
  int (*result)(Size s);
};

int halfRows(Size s) {
  return static_cast<int>(s.width / 2 * s.height * 3);
}

const InPlaceScaler kInPlace[] = {
    {"UpHalf ", ScaleI420UpHalfFrame, reference::upHalf,
     [](Size s) { return static_cast<int>(reference::i420Bytes(s)); }},
    {"DownHalf ", ScaleI420DownHalfFrame, reference::downHalf, halfRows},
    {"Quarter ", ScaleI420FrameQuarter, reference::quarter, halfRows},
};

TEST(ScaleInPlace, EqualsReferenceForEverySize) {
  Content content(31);
  for (const InPlaceScaler& function : kInPlace) {
    forEachSize([&](Size s) {
      SCOPED_TRACE(function.name + text(s));
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
}

// --- Scalers that may grow the buffer ---

struct Growing {
  std::string name;
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
    {"Down1_3 ", ScaleI420Down1_3,
     [](Size s) {
       return s.width > 5 && s.height > 5 && s.width % 2 == 0 && s.height % 2 == 0 && s.height / 3 % 2 == 0;
     },
     reference::third},
    {"Up3_2 ", ScaleI420Up3_2, [](Size s) { return s.width % 4 == 0 && s.height % 4 == 0; }, enlarged<2>},
    {"Up2 ", ScaleI420Up2, [](Size s) { return s.width % 2 == 0 && s.height % 2 == 0; }, enlarged<1>},
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

// capacity: what the buffer has, at least the source frame.
void expectGrown(const Growing& function, const Bytes& src, Size s, std::size_t capacity) {
  SCOPED_TRACE(function.name + text(s) + " in " + std::to_string(capacity));
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

TEST(ScaleGrowing, EqualsReferenceAndGrowsWhereItMust) {
  Content content(32);
  for (const Growing& function : kGrowing) {
    unsigned scaled = 0;
    forEachSize([&](Size any) {
      const Size s{any.width * 2, any.height * 2};
      if (!function.accepts(s)) return;
      const Bytes src = content.bytes(reference::i420Bytes(s));
      expectGrown(function, src, s, src.size());
      expectGrown(function, src, s, src.size() * 4 + 100);
      ++scaled;
    });
    EXPECT_GT(scaled, 50u);
  }
}

TEST(ScaleGrowing, RefusesWithoutTouchingAnything) {
  const Bytes src = Content(33).bytes(1000);
  for (const Growing& function : kGrowing) {
    for (unsigned k = 0; k < 20 * 20; ++k) {
      const Size s{k % 20, k / 20};
      const bool fits = !function.accepts(s) || s.area() == 0;
      Owned buffer(src);
      unsigned char* const before = buffer.memory;
      Size out{7, 8};
      const auto size = fits ? 1000u : static_cast<unsigned>(reference::i420Bytes(s)) - 1;
      EXPECT_EQ(function.call(s.width, s.height, buffer.memory, size, out.width, out.height), -1) << text(s);
      EXPECT_EQ(buffer.memory, before);
      EXPECT_EQ(text(out), text({7, 8}));
      EXPECT_TRUE(std::equal(src.data(), src.data() + src.size(), buffer.memory));
    }
    unsigned char* none = nullptr;
    Size out{};
    EXPECT_EQ(function.call(48, 48, none, 1 << 20, out.width, out.height), -1);
    EXPECT_EQ(function.call(0x80000000, 0x80000000, none, 0xFFFFFFFF, out.width, out.height), -1);
  }
}

// --- Bilinear: any size to any other ---

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
