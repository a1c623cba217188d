// An H.264 byte stream cut into access units.
#include "tools/h264/access_units.h"

#include <gtest/gtest.h>

#include <map>
#include <numeric>
#include <optional>
#include <sstream>
#include <string>

#include "host/mediaserver/components/annex_b.h"
#include "tests/tools/temporary_directory.h"

namespace {

using namespace tool;
using tooltest::TemporaryDirectory;

using mediaserver::BitWriter;

// With the stop bit and the bytes that keep start codes out, and no start code.
std::string nal(uint8_t header, BitWriter& bits) {
  std::vector<uint8_t> stream;
  mediaserver::appendNal(header, bits.finish().bytes(), &stream);
  return {stream.begin() + 4, stream.end()};
}

constexpr int kHigh = 100;

// 6 bits of frame number, order type 0 with 8 bits, 25 frames a second.
std::string sps(uint32_t profile = 66) {
  BitWriter bits;
  bits.bits(profile, 8).bits(0, 8).bits(31, 8).ue(0);
  // A scaling list: 2 more, 10 less.
  if (profile == kHigh) bits.ue(1).ue(0).ue(0).bits(3, 3).ue(3).ue(20).bits(0, 7);
  bits.ue(2).ue(0).ue(4).ue(1).bits(0, 1).ue(10).ue(8).bits(1, 1);
  bits.bits(1, 1).bits(0, 1);
  bits.bits(1, 1).bits(0, 4).bits(1, 1).bits(1, 32).bits(50, 32).bits(1, 1);  // timing
  return nal(0x67, bits);
}

std::string pps(uint32_t id = 0) {
  BitWriter bits;
  return nal(0x68, bits.ue(id).ue(0).bits(0, 2).ue(0));
}

struct Slice {
  uint32_t frame = 0, order = 0, pps = 0;
  std::optional<uint32_t> idr{};  // its id
  bool reference = true;
};

std::string slice(const Slice& fields, uint32_t first) {
  BitWriter bits;
  bits.ue(first).ue(7).ue(fields.pps).bits(fields.frame, 6);
  if (fields.idr) bits.ue(*fields.idr);
  bits.bits(fields.order, 8).bits(0xFFFF, 16);
  return nal(fields.idr ? 0x65 : fields.reference ? 0x61 : 0x01, bits);
}

const std::map<char, std::string> kOthers = {{'S', sps()},          {'H', sps(kHigh)},
                                             {'P', pps()},          {'Q', pps(1)},
                                             {'D', "\x09\xF0"},     {'M', std::string("\x06\x05\x01\x80", 4)},
                                             {'X', "\x6E\x80\x80"}, {'E', "\x0A"}};
const std::map<char, Slice> kSlices = {{'i', {.idr = 0}},
                                       {'j', {.idr = 1}},
                                       {'k', {.pps = 1, .idr = 0}},
                                       {'a', {.frame = 1}},
                                       {'b', {.frame = 2, .order = 4}},
                                       {'m', {.order = 2, .reference = false}},
                                       {'n', {.order = 4, .reference = false}},
                                       {'z', {}}};

// The units of a stream, with start codes of either length in turn. A letter stands for each NAL unit: small
// ones for slices, with the first macroblock behind them; S and H sequence parameters, P and Q picture
// parameters, D a delimiter, M a message, X a prefix, E the end of a sequence. Bars lie between units.
std::vector<std::string> units(const std::string& text) {
  std::vector<std::string> result(1);
  std::istringstream words(text);
  int number = 0;
  for (std::string word; words >> word;) {
    if (word == "|") {
      result.emplace_back();
      continue;
    }
    const auto first = static_cast<uint32_t>(std::atoi(word.c_str() + 1));
    const std::string nal =
        kOthers.contains(word[0]) ? kOthers.at(word[0]) : slice(kSlices.at(word[0]), first);
    result.back() += std::string(number++ % 3 == 1 ? 2 : 3, '\0') + '\1' + nal;
  }
  return result;
}

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

std::string joined(const std::vector<std::string>& parts) {
  return std::accumulate(parts.begin(), parts.end(), std::string());
}

TEST(AccessUnits, EndWhereThePictureEnds) {
  const std::pair<const char*, const char*> cases[] = {
      {"slices in any order", "S P i40 i | a9 a | b"},
      {"a lost first slice", "S P i | b30"},
      {"redundant slices", "S P i i i | a"},
      {"key frames side by side", "S P i | j | i"},
      {"no references", "S P i | m | n"},
      {"parameter sets again", "S P i | S P j | S i"},
      {"other picture parameters", "S P Q i | k"},
      {"delimiters and messages", "D S P M i | D a | M b | D M a"},
      {"prefixes before each slice", "S P X i X i9 | X a | X M b"},
      {"end of sequence", "S P i E | S P i"},
      {"a scaling list", "H P i | a a5"},
  };
  for (const auto& [name, stream] : cases) {
    const std::vector<std::string> expected = units(stream);
    const Cut result = cut(joined(expected));
    EXPECT_EQ(result.units, expected) << name;
    EXPECT_EQ(result.failure, "") << name;
    EXPECT_EQ(result.rate, (FrameRate{25, 1})) << name;
  }
  // Without parameters the first macroblock tells.
  EXPECT_EQ(cut(joined(units("i i7 | z | z"))).units, units("i i7 | z | z"));
  EXPECT_EQ(cut(joined(units("i i7 | z | z"))).rate, std::nullopt);
  EXPECT_EQ(cut("garbage" + joined(units("S P i | a"))).units, units("S P i | a"));
  EXPECT_NE(cut(joined(units("S P M D"))).failure.find("Annex B"), std::string::npos);
}

TEST(AccessUnits, AreReadOverTheEdgesOfTheBuffer) {
  constexpr size_t kChunk = 65536;
  // Each start code lies a byte further to the front of an edge than the one before.
  std::vector<std::string> expected = units("S P i");
  expected[0].resize(kChunk + 4, 'x');
  for (uint32_t i = 1; i < 12; ++i) {
    expected.push_back(std::string("\0\0\1", 3) + slice({.frame = i}, 0));
    expected.back().resize(kChunk - 1, 'y');
  }
  EXPECT_EQ(cut(joined(expected)).units, expected);
}

}  // namespace
