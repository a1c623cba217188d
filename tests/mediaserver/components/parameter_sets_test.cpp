// Parameter sets and levels by themselves.

#include "host/mediaserver/components/sequence_set.h"
#include "tests/mediaserver/components/component_run.h"

namespace componenttest {
namespace {

using namespace mediaserver;  // NOLINT(google-build-using-namespace): everything here is about it

TEST(SequenceSet, IsReadAsTheEncoderWroteItAndRaisedToAHigherProfile) {
  const std::string everything =
      "nal-hrd=vbr:vbv-maxrate=200:vbv-bufsize=100:cqm=jvt:overscan=show:colorprim=bt709:chromaloc=1:sar=40/"
      "33";
  for (const std::string& options :
       {std::string("profile=main refs=4"), "refs=4 b=100000 x264-params=" + everything}) {
    const std::vector<Unit> units = encode("libx264", options + " bf=3 b-pyramid=normal", scenes(98, 54, 2));
    const std::vector<uint8_t> nal = nals(units[0].bytes).at(0);
    const SequenceSet set = readSequenceSet(nal).value();
    EXPECT_TRUE(set.macroblocks == 28U && set.referenceFrames == 4U && set.reorderFrames == 2U);
    std::vector<uint8_t> raised;
    appendSequenceSet(nal, kProfileHigh, &raised);
    SequenceSet again = readSequenceSet(nals(raised).at(0)).value();
    EXPECT_EQ(std::exchange(again.profileIdc, set.profileIdc), kProfileHigh);
    EXPECT_EQ(again, set);
  }
}

TEST(SequenceSet, LimitsReorderingByTheLevelWhereNothingElseDoes) {
  SequenceSet set{.profileIdc = kProfileMain, .levelIdc = 31, .macroblocks = 3600};
  EXPECT_EQ(reorderDepth(set), 5U);
  set.macroblocks = 99;
  EXPECT_EQ(reorderDepth(set), 16U);
  set.reorderFrames = 99;
  EXPECT_EQ(reorderDepth(set), 16U);
  set.pictureOrderType = 2;
  EXPECT_EQ(reorderDepth(set), 0U);
  EXPECT_EQ(reorderDepth({.profileIdc = kProfileBaseline, .levelIdc = 31, .macroblocks = 99}), 0U);
}

}  // namespace
}  // namespace componenttest
