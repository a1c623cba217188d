#include "omxbridge/frames/pad.h"

#include <gtest/gtest.h>

#include "tests/frames/harness.h"
#include "tests/frames/reference_scale.h"

namespace frames_test {
namespace {

using namespace webrtc;

TEST(PadFrame, EqualsReferenceForEverySizeAndMargin) {
  Content content(51);
  forEachSize([&](Size from) {
    Size to{from.width + content.number(0, 70), from.height + content.number(0, 70)};
    if (content.number(0, 2) == 0) to = {from.width + 16 * content.number(0, 4), from.height + 16};
    if (to.width == from.width && to.height == from.height) ++to.height;
    SCOPED_TRACE(text(from) + " to " + text(to));
    const Bytes src = content.bytes(reference::i420Bytes(from)),
                dst = content.bytes(reference::i420Bytes(to));
    Bytes expected = dst;
    reference::pad(src, from, expected, to);
    const unsigned columns = from.width / 2 + (to.width - from.width) / 2;
    const unsigned rows = from.height / 2 + (to.height - from.height) / 2;
    expectConversion(
        [&](auto* in, auto* out) {
          return PadI420Frame(in, out, from.width, from.height, to.width, to.height);
        },
        src, dst, expected, static_cast<int>(to.area() + 2 * columns * rows));
  });
}

TEST(PadFrame, ChecksInOrder) {
  std::uint8_t byte[1] = {};
  EXPECT_EQ(PadI420Frame(nullptr, nullptr, 320, 240, 320, 240), 115200);
  EXPECT_EQ(PadI420Frame(nullptr, byte, 2, 2, 4, 4), -1);
  EXPECT_EQ(PadI420Frame(byte, nullptr, 2, 2, 4, 4), -1);
  const unsigned refused[][4] = {{0, 2, 2, 2},
                                 {2, 2, 0, 2},
                                 {4, 2, 2, 4},
                                 {2, 4, 4, 2},
                                 {2, 2, 0x10000, 0x10000},
                                 {0x10000, 0x10000, 0x10000, 0x10000}};
  for (const auto& s : refused) EXPECT_EQ(PadI420Frame(byte, byte, s[0], s[1], s[2], s[3]), -1);
  EXPECT_EQ(PadI420Frame(115200, nullptr, nullptr, false), -1);
  EXPECT_EQ(PadI420Frame(115201, nullptr, nullptr, true), -1);
}

TEST(PadFrame, FixedSizes) {
  Content content(52);
  const auto expectFixed = [&](Size from, Size to, unsigned cropRows, unsigned left, unsigned top,
                               std::size_t untouched) {
    const Bytes src = content.bytes(reference::i420Bytes(from)),
                dst = content.bytes(reference::i420Bytes(to));
    Bytes expected = dst;
    std::size_t at = 0;
    const auto plane = [&](std::size_t start, unsigned unit, std::uint8_t fill) {
      const Size picture{from.width / unit, (from.height - 2 * cropRows) / unit};
      reference::padPlane(src, start + cropRows / unit * picture.width, picture,
                          (to.width - from.width) / unit, left / unit, to.height / unit - picture.height,
                          top / unit, fill, expected, at);
    };
    plane(0, 1, 0);
    plane(from.area(), 2, 127);
    plane(from.area() * 5 / 4, 2, 127);
    for (std::size_t i = untouched; i < untouched + 4 && i < dst.size(); ++i) expected[i] = dst[i];
    expectConversion(
        [&](auto* in, auto* out) { return PadI420Frame(static_cast<unsigned>(src.size()), in, out, true); },
        src, dst, expected, static_cast<int>(dst.size()));
  };
  expectFixed({320, 240}, {352, 288}, 0, 16, 16, 352 * 288 * 5 / 4 + 1412);
  expectFixed({160, 120}, {176, 144}, 4, 0, 16, 176 * 144 * 3 / 2);  // all of it is written
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
    const auto capacity = static_cast<unsigned>(std::max<std::size_t>(least, s.area() * 3 / 2));
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
    const Bytes frame = content.bytes(reference::i420Bytes(from));
    Bytes expected = frame;
    const bool same = from.width == to.width && from.height == to.height;
    if (!same) reference::cut(expected, from, to);
    const unsigned result = same ? to.width * to.height * 3 / 2 : to.width / 2 * to.height * 3;
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
