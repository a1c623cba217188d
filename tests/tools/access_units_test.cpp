// An H.264 byte stream cut into access units.
#include "tools/h264/access_units.h"

#include <gtest/gtest.h>

#include <numeric>
#include <string>

#include "host/mediaserver/components/annex_b.h"
#include "tests/tools/temporary_directory.h"

namespace {

using namespace tool;
using tooltest::TemporaryDirectory;

// A NAL unit, field by field.
class Fields {
 public:
  Fields& u(unsigned int count, uint32_t value) {
    _bits.bits(value, count);
    return *this;
  }
  Fields& ue(uint32_t value) {
    _bits.ue(value);
    return *this;
  }
  // With the stop bit and the bytes that keep start codes out, and no start code.
  std::string nal(uint8_t header) {
    _bits.finish();
    std::vector<uint8_t> stream;
    mediaserver::appendNal(header, _bits.bytes(), &stream);
    return {stream.begin() + 4, stream.end()};
  }

 private:
  mediaserver::BitWriter _bits;
};

constexpr int kHigh = 100;

// 6 bits of frame number, order type 0 with 8 bits; `interlaced` allows fields; 25 frames a second.
std::string sps(bool interlaced = false, uint32_t profile = 66) {
  Fields bits;
  bits.u(8, profile).u(8, 0).u(8, 31).ue(0);
  if (profile == kHigh)
    bits.ue(1).ue(0).ue(0).u(1, 0).u(1, 1).u(1, 1).ue(3).ue(20).u(7, 0);  // a scaling list: 2 more, 10 less
  bits.ue(2).ue(0).ue(4).ue(1).u(1, 0).ue(10).ue(8).u(1, interlaced ? 0 : 1);
  if (interlaced) bits.u(1, 0);
  bits.u(1, 1).u(1, 0);
  bits.u(1, 1).u(4, 0).u(1, 1).u(32, 1).u(32, 50).u(1, 1);  // timing
  return bits.nal(0x67);
}

std::string pps(uint32_t id = 0) {
  return Fields().ue(id).ue(0).u(1, 0).u(1, 0).ue(0).nal(0x68);
}

struct Slice {
  uint32_t first = 0;
  uint32_t frame = 0;
  uint32_t order = 0;
  uint32_t pps = 0;
  bool idr = false;
  uint32_t idrId = 0;
  bool reference = true;
  int field = -1;  // 0 top, 1 bottom; only with interlaced parameters
};

std::string slice(const Slice& fields, bool interlaced = false) {
  Fields bits;
  bits.ue(fields.first).ue(7).ue(fields.pps).u(6, fields.frame);
  if (interlaced) bits.u(1, fields.field >= 0 ? 1 : 0);
  if (fields.field >= 0) bits.u(1, fields.field == 1 ? 1 : 0);
  if (fields.idr) bits.ue(fields.idrId);
  bits.u(8, fields.order).u(16, 0xFFFF);
  return bits.nal(fields.idr ? 0x65 : fields.reference ? 0x61 : 0x01);
}

const std::string kDelimiter = "\x09\xF0";
const std::string kSei = std::string("\x06\x05\x01\x80", 4);
const std::string kPrefix = "\x6E\x80\x80";

using Units = std::vector<std::vector<std::string>>;

struct Cut {
  std::vector<std::string> units{};
  std::string failure{};
  std::optional<FrameRate> rate{};
};

Cut cut(const std::string& stream) {
  const TemporaryDirectory directory;
  auto bytes = ByteReader::open(directory.write("in", stream), {});
  AccessUnitReader reader(std::move(bytes.value()));
  Cut result;
  std::vector<uint8_t> unit;
  auto more = reader.next(unit);
  for (; more.ok() && more.value(); more = reader.next(unit))
    result.units.emplace_back(unit.begin(), unit.end());
  if (!more.ok()) result.failure = more.failure().text;
  result.rate = reader.frameRate();
  return result;
}

// The stream with start codes of either length, in turn.
std::vector<std::string> withStartCodes(const Units& units) {
  std::vector<std::string> result;
  int number = 0;
  for (const auto& unit : units) {
    result.emplace_back();
    for (const std::string& nal : unit)
      result.back() += std::string(number++ % 3 == 1 ? 2 : 3, '\0') + '\1' + nal;
  }
  return result;
}

std::string joined(const std::vector<std::string>& parts) {
  return std::accumulate(parts.begin(), parts.end(), std::string());
}

TEST(AccessUnits, EndWhereThePictureEnds) {
  const std::string idr = slice({.idr = true});
  const struct {
    const char* name;
    Units units;
  } cases[] = {
      {"slices in any order",
       {{sps(), pps(), slice({.first = 40, .idr = true}), idr},
        {slice({.first = 9, .frame = 1}), slice({.first = 0, .frame = 1})},
        {slice({.frame = 2})}}},
      {"a lost first slice", {{sps(), pps(), idr}, {slice({.first = 30, .frame = 1, .order = 2})}}},
      {"redundant slices", {{sps(), pps(), idr, idr, idr}, {slice({.frame = 1})}}},
      {"key frames side by side", {{sps(), pps(), idr}, {slice({.idr = true, .idrId = 1})}, {idr}}},
      {"no references",
       {{sps(), pps(), idr},
        {slice({.order = 2, .reference = false})},
        {slice({.order = 4, .reference = false})}}},
      {"parameter sets again",
       {{sps(), pps(), idr}, {sps(), pps(), slice({.idr = true, .idrId = 1})}, {sps(), idr}}},
      {"other picture parameters", {{sps(), pps(), pps(1), idr}, {slice({.pps = 1, .idr = true})}}},
      {"delimiters and messages",
       {{kDelimiter, sps(), pps(), kSei, idr},
        {kDelimiter, slice({.frame = 1})},
        {kSei, slice({.frame = 2})},
        {kDelimiter, kSei, slice({.frame = 3})}}},
      {"prefixes before each slice",
       {{sps(), pps(), kPrefix, idr, kPrefix, slice({.first = 9, .idr = true})},
        {kPrefix, slice({.frame = 1})},
        {kPrefix, kSei, slice({.frame = 2})}}},
      {"end of sequence", {{sps(), pps(), idr, "\x0A"}, {sps(), pps(), idr}}},
      {"a scaling list",
       {{sps(false, kHigh), pps(), idr}, {slice({.frame = 1}), slice({.first = 5, .frame = 1})}}},
  };
  for (const auto& each : cases) {
    const std::vector<std::string> expected = withStartCodes(each.units);
    const Cut result = cut(joined(expected));
    EXPECT_EQ(result.units, expected) << each.name;
    EXPECT_EQ(result.failure, "") << each.name;
    EXPECT_EQ(result.rate, (FrameRate{25, 1})) << each.name;
  }
}

TEST(AccessUnits, EndWithEachFieldAndGoByTheFirstMacroblockWithoutParameters) {
  const auto fields = withStartCodes({{sps(true), pps(), slice({.idr = true, .field = 0}, true)},
                                      {slice({.frame = 0, .order = 1, .field = 1}, true)},
                                      {slice({.frame = 1, .order = 2}, true)}});
  EXPECT_EQ(cut(joined(fields)).units, fields);
  const std::string idr = slice({.idr = true});
  const auto expected =
      withStartCodes({{idr, slice({.first = 7, .idr = true})}, {slice({.frame = 0})}, {slice({})}});
  EXPECT_EQ(cut(joined(expected)).units, expected);
  EXPECT_EQ(cut(joined(expected)).rate, std::nullopt);
}

TEST(AccessUnits, SurviveStreamsThatAreDamagedOrNone) {
  const auto units = withStartCodes({{sps(), pps(), slice({.idr = true})}, {slice({.frame = 1})}});
  const std::string good = joined(units);
  EXPECT_EQ(cut("garbage" + good).units, units);
  EXPECT_EQ(cut(std::string(100000, '\0') + good).units.size(), 2U);
  for (const std::string& none : {std::string(), std::string("\0\0\1", 3), std::string(100, '\0'),
                                  std::string(200000, 'x'), "\0\0\1" + sps() + std::string("\0\0\1\x68", 4),
                                  joined(withStartCodes({{sps(), pps(), kSei, kDelimiter}}))}) {
    const Cut result = cut(none);
    EXPECT_TRUE(result.units.empty());
    EXPECT_NE(result.failure.find("Annex B"), std::string::npos) << result.failure;
  }
}

TEST(AccessUnits, AreReadOverTheEdgesOfTheBuffer) {
  constexpr size_t kChunk = 65536;
  // Each start code lies a byte further to the front of an edge than the one before.
  std::vector<std::string> expected = withStartCodes({{sps(), pps(), slice({.idr = true})}});
  expected[0].resize(kChunk + 4, 'x');
  for (uint32_t i = 1; i < 12; ++i) {
    expected.push_back(std::string("\0\0\1", 3) + slice({.frame = i}));
    expected.back().resize(kChunk - 1, 'y');
  }
  EXPECT_EQ(cut(joined(expected)).units, expected);
}

}  // namespace
