// Byte streams, parameter sets and levels by themselves.

#include <gtest/gtest.h>

#include "host/mediaserver/components/annex_b.h"
#include "host/mediaserver/components/avc_level.h"
#include "host/mediaserver/components/sequence_set.h"
#include "tests/mediaserver/components/reference_codec.h"

namespace componenttest {
namespace {

using namespace mediaserver;  // NOLINT(google-build-using-namespace): everything here is about it

std::vector<std::vector<uint8_t>> split(const std::vector<uint8_t>& bytes) {
  std::vector<std::vector<uint8_t>> nals;
  Bytes stream(bytes);
  for (Bytes nal = takeNal(&stream); !nal.empty(); nal = takeNal(&stream))
    nals.emplace_back(nal.begin(), nal.end());
  return nals;
}

TEST(AnnexB, FindsUnitsBetweenStartCodes) {
  using Nals = std::vector<std::vector<uint8_t>>;
  EXPECT_EQ(split({}), Nals{});
  EXPECT_EQ(split({0, 0}), Nals{});
  EXPECT_EQ(split({0, 0, 1}), Nals{});
  EXPECT_EQ(split({9, 9, 0, 0, 1, 5}), (Nals{{5}}));
  EXPECT_EQ(split({0, 0, 1, 5, 0, 0, 0, 1, 6, 7, 0, 0}), (Nals{{5}, {6, 7}}));
  EXPECT_EQ(split({0, 0, 1, 0, 0, 1, 0, 0, 0, 1, 8, 1, 1}), (Nals{{8, 1, 1}}));
  EXPECT_EQ(split({0, 0, 0, 0, 1, 2, 0, 1, 0, 0, 2}), (Nals{{2, 0, 1, 0, 0, 2}}));
}

TEST(SequenceSet, IsReadAsTheEncoderWroteIt) {
  using Options = std::map<std::string, std::string>;
  struct {
    Options options;
    int profile;
    uint32_t references;
    std::optional<uint32_t> reorder;
  } const cases[] = {
      {{{"profile", "baseline"}, {"refs", "3"}}, 66, 3, 0},
      {{{"profile", "main"}, {"bf", "1"}, {"refs", "2"}}, 77, 2, 1},
      {{{"bf", "3"}, {"b-pyramid", "normal"}, {"refs", "4"}}, 100, 4, 2},
      {{{"bf", "0"}, {"nal-hrd", "vbr"}, {"b", "100000"}, {"maxrate", "200000"}, {"bufsize", "100000"}},
       100,
       3,
       0},
      {{{"bf", "0"}, {"x264-params", "cqm=jvt:overscan=show:colorprim=bt709:chromaloc=1:sar=40/33"}},
       100,
       3,
       0},
  };
  for (const auto& each : cases) {
    const std::vector<Unit> units = encode({"libx264", each.options}, scenes(98, 54, 2));
    const auto nals = split(units.front().bytes);
    ASSERT_FALSE(nals.empty());
    const auto set = readSequenceSet(nals[0]);
    ASSERT_TRUE(set);
    EXPECT_EQ(set->profileIdc, each.profile);
    EXPECT_EQ(set->referenceFrames, each.references);
    EXPECT_EQ(set->reorderFrames, each.reorder);
    EXPECT_EQ(reorderDepth(*set), *each.reorder);
    EXPECT_EQ(set->macroblocks, 28U);

    // A higher profile is declared, and everything else stays.
    std::vector<uint8_t> raised;
    appendSequenceSet(nals[0], kProfileHigh, &raised);
    const auto again = readSequenceSet(split(raised).front());
    ASSERT_TRUE(again);
    EXPECT_EQ(again->profileIdc, kProfileHigh);
    EXPECT_EQ(again->levelIdc, set->levelIdc);
    EXPECT_EQ(again->referenceFrames, set->referenceFrames);
    EXPECT_EQ(again->macroblocks, set->macroblocks);
    EXPECT_EQ(again->reorderFrames, set->reorderFrames);

    // Whatever is cut off or flipped is read to some end.
    for (size_t size = 0; size < nals[0].size(); ++size) {
      std::vector<uint8_t> damaged(nals[0].begin(), nals[0].begin() + static_cast<ptrdiff_t>(size));
      static_cast<void>(readSequenceSet(damaged));
      damaged = nals[0];
      for (int bit = 0; bit < 8; ++bit) {
        damaged[size] = static_cast<uint8_t>(damaged[size] ^ 1 << bit);
        if (const auto read = readSequenceSet(damaged)) {
          EXPECT_LE(reorderDepth(*read), 16U);
        }
      }
    }
  }
}

TEST(SequenceSet, LimitsReorderingByTheLevelWhereNothingElseDoes) {
  SequenceSet set;
  set.profileIdc = kProfileMain;
  set.levelIdc = 31;
  set.macroblocks = 3600;
  EXPECT_EQ(reorderDepth(set), 5U);
  set.macroblocks = 99;
  EXPECT_EQ(reorderDepth(set), 16U);
  set.reorderFrames = 99;
  EXPECT_EQ(reorderDepth(set), 16U);
  set.reorderFrames.reset();
  set.pictureOrderType = 2;
  EXPECT_EQ(reorderDepth(set), 0U);
  set.pictureOrderType = 0;
  set.profileIdc = kProfileBaseline;
  EXPECT_EQ(reorderDepth(set), 0U);
}

}  // namespace
}  // namespace componenttest
