// The way between the ends: packets that are lost, overtaken and delayed, and what the receiver makes of it.
#include "tools/network/lossy_path.h"

#include <gtest/gtest.h>

namespace {

using namespace tool;

constexpr int64_t kFrame = 40'000;  // microseconds
constexpr size_t kPictureBytes = 5000;

// A sender that makes a key frame of every picture that is asked for.
struct Transmission {
  std::vector<CodedPicture> out;
  std::vector<uint32_t> keys;  // numbers of the pictures
  PathFigures figures;
};

Transmission transmit(const Impairments& impairments, uint32_t count) {
  Transmission result;
  LossyPath path(impairments);
  const auto take = [&result](std::vector<CodedPicture> pictures) {
    for (CodedPicture& picture : pictures) result.out.push_back(std::move(picture));
  };
  for (uint32_t i = 0; i < count; ++i) {
    take(path.advance(i * kFrame));
    const bool isKey = path.takeKeyRequest(i * kFrame) || i == 0;
    if (isKey) result.keys.push_back(i);
    path.send({std::vector<uint8_t>(kPictureBytes, static_cast<uint8_t>(i)), i, isKey}, i * kFrame);
  }
  take(path.drain());
  result.figures = path.figures();
  return result;
}

TEST(LossyPath, DelaysEveryPictureAndPutsOvertakenPacketsBackIntoOrder) {
  for (const double reorder : {0.0, 0.3}) {
    const Transmission sent = transmit({.reorder = reorder, .delay = 70'000}, 200);
    ASSERT_EQ(sent.out.size(), 200U);
    for (uint32_t i = 0; i < 200; ++i) {
      EXPECT_EQ(sent.out[i].timestamp, i);
      EXPECT_EQ(sent.out[i].bytes, std::vector<uint8_t>(kPictureBytes, static_cast<uint8_t>(i)));
      EXPECT_TRUE(reorder > 0 || sent.out[i].networkDelay == 70'000);
    }
    EXPECT_EQ(sent.figures.packets, 200 * 5U);
    EXPECT_EQ(sent.figures.packetsReordered > 200, reorder > 0);
    EXPECT_TRUE(sent.figures.keyRequests.empty());
  }
}

TEST(LossyPath, AsksForAKeyFrameAfterALossAndShowsNothingBeforeIt) {
  constexpr int64_t kDelay = 50'000;
  const Transmission sent = transmit({.loss = 0.02, .delay = kDelay, .seed = 5}, 500);
  ASSERT_FALSE(sent.figures.losses.empty());
  EXPECT_EQ(sent.out.size() + sent.figures.picturesLost, 500U);
  EXPECT_NEAR(static_cast<double>(sent.figures.packetsLost), 0.02 * 2500, 20);
  // Whatever follows a gap is a key frame.
  for (size_t i = 1; i < sent.out.size(); ++i) {
    ASSERT_GT(sent.out[i].timestamp, sent.out[i - 1].timestamp);
    if (sent.out[i].timestamp != sent.out[i - 1].timestamp + 1) {
      EXPECT_TRUE(sent.out[i].isKey) << sent.out[i].timestamp;
    }
  }
  // A request is answered by the first picture after it has travelled back.
  for (size_t i = 0; i < std::min(sent.keys.size() - 1, sent.figures.keyRequests.size()); ++i) {
    EXPECT_GE(sent.keys[i + 1] * kFrame, sent.figures.keyRequests[i] + kDelay);
  }
  EXPECT_GE(sent.keys.size(), 5U);
  EXPECT_TRUE(transmit({.loss = 1}, 50).out.empty());
}

}  // namespace
