// Quantities as users and files write them.
#include "tools/base/units.h"

#include <gtest/gtest.h>

#include "tools/commands/call_book.h"

namespace {

using namespace tool;

TEST(Units, ReadsSizes) {
  EXPECT_EQ(parseSize("640x480"), (Size{640, 480}));
  EXPECT_EQ(parseSize("2x8192"), (Size{2, 8192}));
  for (const char* text : {"", "x", "640", "640x", "x480", "640x480x2", "640X480", " 640x480", "0x480",
                           "-2x2", "8193x2", "640x99999999999999999999", "6.4x4"}) {
    EXPECT_EQ(parseSize(text), std::nullopt) << text;
  }
}

TEST(Units, ReadsFrameRatesAndReducesThem) {
  const struct {
    const char* text;
    FrameRate rate;
  } good[] = {{"30", {30, 1}},
              {"29.97", {30000, 1001}},
              {"23.976", {24000, 1001}},
              {"30000/1001", {30000, 1001}},
              {"60:2", {30, 1}},
              {"12.5", {25, 2}},
              {"255", {255, 1}},
              {"1/10", {1, 10}},
              // Terms too large to count with become thousandths.
              {"4294967295/143165577", {30, 1}}};
  for (const auto& each : good) EXPECT_EQ(parseFrameRate(each.text), each.rate) << each.text;
  for (const char* text : {"", "0", "0/1", "30/0", "-30", "256", "30/", "/1", "1e2", "nan", "30/1/1",
                           "0.0001", "1/4294967295"}) {
    EXPECT_EQ(parseFrameRate(text), std::nullopt) << text;
  }
}

TEST(Units, ReadsBitRates) {
  for (const auto& [text, rate] : {std::pair{"1.5M", 1'500'000U}, {"800k", 800'000U}, {"64000", 64'000U}}) {
    EXPECT_EQ(parseBitRate(text), rate);
  }
  for (const char* text : {"", "k", "999", "1001M", "1G", "-1M", "1 M", "1e6", "0x10"}) {
    EXPECT_EQ(parseBitRate(text), std::nullopt) << text;
  }
}

TEST(Units, CountsTimeWithoutDriftOrOverflow) {
  const FrameRate ntsc{30000, 1001};
  EXPECT_EQ(ntsc.microseconds(0), 0);
  EXPECT_EQ(ntsc.microseconds(1), 33366);
  EXPECT_EQ(ntsc.microseconds(30000), 1001'000'000);
  EXPECT_EQ(ntsc.microseconds(30'000'000'000), 1'001'000'000'000'000);
  EXPECT_EQ((FrameRate{999'983, 1'000'000}).microseconds(999'982), 999'998'999'982);
}

TEST(CallFigures, TakeThePercentilesByNearestRank) {
  const auto of = [](std::vector<double> values) {
    const Percentiles result = percentiles(std::move(values));
    return std::vector{result.p50, result.p95, result.p99};
  };
  EXPECT_EQ(of({}), (std::vector{0.0, 0.0, 0.0}));
  EXPECT_EQ(of({7}), (std::vector{7.0, 7.0, 7.0}));
  std::vector<double> hundred;
  for (int i = 100; i > 0; --i) hundred.push_back(i);
  EXPECT_EQ(of(hundred), (std::vector{50.0, 95.0, 99.0}));
}

TEST(CallBook, MatchesPicturesByTimeStampAndCountsTheRest) {
  CallBook book;
  for (uint32_t frame = 0; frame < 5; ++frame) {
    book.captured();
    if (frame != 1) book.sending({frame * 1000, Picture(), Clock::time_point(), frame, 0});
  }
  for (const uint32_t timestamp : {0U, 2000U, 3000U}) book.encoded(timestamp, 100, timestamp == 0);
  EXPECT_EQ(book.arrived(0)->timestamp, 0U);
  book.decoded(0, std::chrono::milliseconds(3), 40.0);
  EXPECT_FALSE(book.arrived(0)) << "twice";
  book.strayed();
  EXPECT_EQ(book.arrived(3000)->timestamp, 3000U);
  book.decoded(3000, std::chrono::milliseconds(5), 30.0);
  EXPECT_FALSE(book.arrived(2000)) << "behind a later one";
  EXPECT_EQ(book.arrived(4000)->timestamp, 4000U);
  book.decoded(4000, std::chrono::milliseconds(4), std::nullopt);

  const CallFigures figures = book.figures();
  EXPECT_EQ(figures.framesIn, 5U);
  EXPECT_EQ(figures.framesSent, 4U);
  EXPECT_EQ(figures.framesEncoded, 3U);
  EXPECT_EQ(figures.streamBytes, 300U);
  EXPECT_EQ(figures.framesDecoded, 4U);
  EXPECT_EQ(figures.framesDropped(), 1U);
  EXPECT_EQ(figures.framesOutOfOrder, 1U);
  EXPECT_DOUBLE_EQ(figures.psnr, 35.0);
  EXPECT_DOUBLE_EQ(figures.latencies.p50, 4.0);
}

}  // namespace
