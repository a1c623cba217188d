// What scales, pads and cuts frames, and does not simply go from one frame to another.

#include "omxbridge/frames/scale.h"

#include <gtest/gtest.h>

#include <memory>
#include <tuple>
#include <vector>

#include "omxbridge/frames/pad.h"
#include "tests/frames/harness.h"
#include "tests/frames/reference_scale.h"

namespace frames_test {
namespace {

using namespace webrtc;

// --- Scalers that may grow the buffer ---

struct Growing {
  std::string name;
  int (*call)(unsigned, unsigned, unsigned char*&, unsigned, unsigned&, unsigned&);
  bool (*accepts)(Size s);
  Bytes (*reference)(const Bytes& src, Size s, Size& out);
};

const Growing kGrowing[] = {
    {"Down1_3 ", ScaleI420Down1_3,
     [](Size s) { return s.width > 5 && s.height > 5 && s == s.even() && s.height / 3 % 2 == 0; },
     reference::third},
    {"Up3_2 ", ScaleI420Up3_2, [](Size s) { return s.width % 4 == 0 && s.height % 4 == 0; },
     reference::enlarged<2>},
    {"Up2 ", ScaleI420Up2, [](Size s) { return s == s.even(); }, reference::enlarged<1>},
};

// In a buffer of so many bytes. What is refused leaves everything as it is.
void expectGrown(Content& content, const Growing& function, Size s, std::size_t capacity) {
  SCOPED_TRACE(function.name + text(s) + " in " + std::to_string(capacity));
  const Bytes initial = content.bytes(capacity);
  const bool fits = function.accepts(s) && s.area() != 0 && capacity >= s.i420();
  Size out{7, 8};
  const Bytes expected = fits ? function.reference(initial, s, out) : initial;
  onEveryTarget([&] {
    unsigned char* buffer = new unsigned char[capacity];
    const unsigned char* const before = std::copy_n(initial.data(), capacity, buffer) - capacity;
    Size given{7, 8};
    const int result =
        function.call(s.width, s.height, buffer, static_cast<unsigned>(capacity), given.width, given.height);
    const std::unique_ptr<unsigned char[]> owner(buffer);
    EXPECT_EQ(result, fits ? static_cast<int>(expected.size()) : -1);
    EXPECT_EQ(given, out);
    EXPECT_EQ(buffer == before, expected.size() <= capacity);
    EXPECT_TRUE(std::equal(expected.data(), expected.data() + expected.size(), buffer));
    // What lies behind both frames.
    for (std::size_t i = std::max(expected.size(), s.i420()); i < capacity; ++i)
      ASSERT_EQ(buffer[i], initial[i]) << "byte " << i;
  });
}

TEST(ScaleGrowing, EqualsReferenceGrowsWhereItMustAndRefusesSizesThatDoNotSuit) {
  Content content(32);
  for (const Growing& function : kGrowing) {
    forEachSize([&](Size any) {
      for (const Size s : {any, Size{any.width * 2, any.height * 2}}) {
        expectGrown(content, function, s, s.i420());
        if (function.accepts(s)) expectGrown(content, function, s, s.i420() * 4 + 100);
        if (function.accepts(s)) expectGrown(content, function, s, s.i420() - 1);
      }
    });
    for (unsigned k = 0; k < 20 * 20; ++k) expectGrown(content, function, {k % 20, k / 20}, 1000);
    unsigned char* none = nullptr;
    Size out{};
    EXPECT_EQ(function.call(48, 48, none, 1 << 20, out.width, out.height), -1);
    EXPECT_EQ(function.call(0x80000000, 0x80000000, none, 0xFFFFFFFF, out.width, out.height), -1);
  }
}

// --- Bilinear: any size to any other ---

void expectScaled(Content& content, Size from, Size to) {
  SCOPED_TRACE(text(from) + " to " + text(to));
  const Bytes src = content.bytes(from.i420());
  const std::vector<int> expected = reference::bilinear(src, from, to);
  const Bytes dst = content.bytes(expected.size() + content.number(0, 1) * 16);
  const std::size_t written = to.area() + 2 * to.half().area();
  std::optional<Bytes> first;
  onEveryTarget([&] {
    Bytes output = dst;
    unsigned char* destination = output.data();
    auto size = static_cast<unsigned>(dst.size());
    EXPECT_EQ(ScaleBilinear(src.data(), destination, from.width, from.height, to.width, to.height, size),
              static_cast<int>(to.height));
    EXPECT_EQ(destination, output.data());
    EXPECT_EQ(size, dst.size());
    for (std::size_t i = 0; i < dst.size(); ++i) {
      const int wanted = i < written ? expected[i] : dst[i];
      ASSERT_EQ(output[i], wanted >= 0 ? wanted : output[i]) << i;
    }
    // Bytes that nobody wrote are nobody's business, but they are the same everywhere.
    if (!first) first = output;
    EXPECT_EQ(output, *first);
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
  const Bytes src = Content(43).bytes(from.i420());
  for (const Size to : {Size{31, 33}, Size{40, 24}, Size{72, 33}}) {
    const std::size_t needed = to.i420();
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
      Bytes result(to.area() + 2 * to.half().area());
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
  std::uint8_t src[6] = {10, 20, 30, 40, 50, 60}, memory[6];
  unsigned char* destination = memory;
  unsigned size = 6;
  // Each way of being refused ends the configuration before.
  for (const auto& [width, type, method] :
       {std::tuple{2u, kI420, kBilinear}, {0u, kRGB24, kBilinear}, {2u, kRGB24, unknown}}) {
    EXPECT_EQ(scaler.Interpolate(src, destination, size), -2);
    ASSERT_EQ(scaler.Set(2, 2, 2, 2, kRGB24, kARGB, kBilinear), 0);
    EXPECT_EQ(scaler.Interpolate(src, destination, size), 2);
    EXPECT_EQ(scaler.Set(2, 2, width, 2, type, type, method), -1);
  }
  EXPECT_EQ(scaler.Interpolate(src, destination, size), -2);
}

// --- Padding and cutting ---

TEST(PadFrame, RefusesFramesThatAreSmallerOrTooLarge) {
  std::uint8_t byte[1] = {};
  const unsigned refused[][4] = {{4, 2, 2, 4}, {2, 4, 4, 2}, {2, 2, 65536, 65536}};
  for (const auto& s : refused) EXPECT_EQ(PadI420Frame(byte, byte, s[0], s[1], s[2], s[3]), -1);
  for (const unsigned size : {0U, 1000U}) EXPECT_EQ(PadI420Frame(size, byte, byte, true), -1);
}

TEST(PadFrame, FixedSizesAreCutAndPaddedButForFourBytes) {
  Content content(52);
  const auto expectFixed = [&](Size from, Size cut, Size to, std::size_t untouched) {
    const Bytes src = content.bytes(from.i420()), dst = content.bytes(to.i420());
    Bytes picture = src, expected = dst;
    if (cut != from) reference::cut(picture, from, cut);
    reference::pad(picture, expected, cut, to, to.width);
    for (std::size_t i = untouched; i < untouched + 4 && i < dst.size(); ++i) expected[i] = dst[i];
    const auto call = [&](auto* in, auto* out) {
      return PadI420Frame(static_cast<unsigned>(src.size()), in, out, true);
    };
    expectConversion(call, src, dst, expected, static_cast<int>(dst.size()));
  };
  expectFixed({320, 240}, {320, 240}, {352, 288}, 352 * 288 * 5 / 4 + 1412);
  expectFixed({160, 120}, {160, 112}, {176, 144}, 176 * 144 * 3 / 2);  // all of it is written
}

TEST(PadBottomRows, MovesChromaAndFillsInPlace) {
  Content content(53);
  for (unsigned k = 0; k < 400 && !HasFailure(); ++k) {
    const Size s{content.number(1, 40), content.number(1, 40)};
    const unsigned added = content.number(0, 40), newArea = s.width * (s.height + added);
    const std::size_t q = s.area() / 4, samples = q + s.width * added / 4;
    SCOPED_TRACE(text(s) + " and " + std::to_string(added));
    const std::size_t v = newArea + newArea / 4;
    const unsigned newSize = (s.height + added) * (s.width / 2 * 3);
    const auto least = static_cast<unsigned>(std::max<std::size_t>(v + samples, newSize));
    const auto capacity = static_cast<unsigned>(std::max<std::size_t>(least, s.i420()));
    const Bytes frame = content.bytes(capacity);
    Bytes expected = frame;
    for (std::size_t i = 0; i < samples; ++i) expected[v + i] = i < q ? frame[s.area() + q + i] : 127;
    for (std::size_t i = 0; i < samples; ++i) expected[newArea + i] = i < q ? frame[s.area() + i] : 127;
    for (std::size_t i = s.area(); i < newArea; ++i) expected[i] = 0;
    unsigned outSize = 99;
    const auto add = [&](unsigned char* buffer, unsigned has) {
      return PadI420BottomRows(buffer, has, s.width, s.height, static_cast<int>(added), outSize);
    };
    EXPECT_EQ(add(nullptr, least - 1), -1);
    EXPECT_EQ(outSize, 99u);
    expectInPlace([&](unsigned char* buffer) { return add(buffer, capacity); }, frame, expected, 0);
    EXPECT_EQ(outSize, newSize);
  }
  unsigned outSize = 99;
  EXPECT_EQ(PadI420BottomRows(nullptr, 1000, 4, 4, -1, outSize), -1);
  EXPECT_EQ(PadI420BottomRows(nullptr, 1000, 0x80000000, 2, 0, outSize), -1);
  EXPECT_EQ(PadI420BottomRows(nullptr, 1000, 0xFFFFFFFF, 0xFFFFFFFF, 0x7FFFFFFF, outSize), -1);
}

TEST(CutFrame, EqualsReferenceForEverySizeAndRefusesWhatIsNoCut) {
  Content content(54);
  forEachSize([&](Size from) {
    const Size to{content.number(1, from.width), content.number(1, from.height)};
    SCOPED_TRACE(text(from) + " to " + text(to));
    const Bytes frame = content.bytes(from.i420());
    Bytes expected = frame;
    const std::size_t result = from == to ? to.i420() : reference::cut(expected, from, to);
    expectInPlace(
        [&](auto* memory) { return CutI420Frame(memory, from.width, from.height, to.width, to.height); },
        frame, expected, static_cast<int>(result));
  });
  const unsigned refused[][4] = {
      {0, 2, 2, 2}, {2, 2, 2, 0}, {4, 4, 6, 2}, {4, 4, 2, 6}, {0x10001, 0x10000, 0x10000, 0x10000}};
  for (const auto& s : refused) EXPECT_EQ(CutI420Frame(nullptr, s[0], s[1], s[2], s[3]), -1);
}

}  // namespace
}  // namespace frames_test
