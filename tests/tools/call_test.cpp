// Calls and decodings on every emulated device, with the real components: what comes out, and what the
// report says of it.
#include <gtest/gtest.h>
#include <signal.h>

#include <cmath>

#include "tests/tools/process.h"

namespace {

using namespace tooltest;

// How many pictures a Y4M file holds; -1 where it is not whole.
long picturesIn(const std::string& path, size_t pictureBytes) {
  const std::string content = contentOf(path);
  const size_t each = std::string_view("FRAME\n").size() + pictureBytes, head = content.find('\n') + 1;
  const bool whole = content.starts_with("YUV4MPEG2 ") && (content.size() - head) % each == 0;
  return whole ? static_cast<long>((content.size() - head) / each) : -1;
}

class CallOn : public testing::TestWithParam<const char*> {
 protected:
  const double leastPsnr = GetParam() == std::string("msm8x60") ? 28 : 35;  // dB
};

TEST_P(CallOn, LosesNothingAndKeepsItsQualityAndRate) {
  const json figures = report({"call", "-d", GetParam(), "-n", std::to_string(CALL_FRAMES)});
  EXPECT_EQ(figures["device"], GetParam());
  for (const char* const count : {"frames_in", "frames_encoded", "frames_decoded"})
    EXPECT_EQ(figures[count], CALL_FRAMES) << count;
  EXPECT_EQ(figures["frames_dropped"], 0);
  EXPECT_EQ(figures["frames_out_of_order"], 0);
  EXPECT_EQ(figures["bitrate_target"], 1'000'000);
  EXPECT_NEAR(figures["bitrate_reached"], 1e6, 1e5);
  EXPECT_GE(figures["psnr_y"], leastPsnr);
  EXPECT_LT(figures["psnr_y"], 60) << "no lossy coder does that";
  EXPECT_GT(figures["latency_ms"]["p50"], 0);
  EXPECT_GT(figures["cpu_seconds"], 0);
}

TEST_P(CallOn, WritesAStreamThatDecodesToThePicturesItWrote) {
  const TemporaryDirectory directory;
  const std::string stream = directory.file("coded.264");
  const std::string called = directory.file("called.y4m");
  const std::string decoded = directory.file("decoded.y4m");
  const json figures = report({"call", "-d", GetParam(), "-s", "320x176", "--fps", "25", "-n", "40", "-k",
                               "10", "-p", "high", "--stream", stream, "-o", called});
  EXPECT_EQ(figures["profile"], GetParam() == std::string("msm7x30") ? 66 : 100);
  EXPECT_EQ(picturesIn(called, 320 * 176 * 3 / 2), 40);
  const json again = report({"decode", "-d", GetParam(), stream, "-o", decoded, "--fps", "25"});
  EXPECT_EQ(again["access_units"], 40);
  EXPECT_TRUE(contentOf(called) == contentOf(decoded));
  EXPECT_EQ(directory.names().size(), 3U);
}

// Pictures 0 to 59 as configured, a key frame at 30 and from there on three times the bits; then half as many
// pictures; then turned on their side.
TEST_P(CallOn, CarriesOutChangesAtThePictureTheyAreMeantFor) {
  const TemporaryDirectory directory;
  const std::string pictures = directory.file("a.y4m");
  const json figures =
      report({"call",   "-d",        GetParam(), "-s",     "200x120", "-n", "120",         "-b",
              "200k",   "--at",      "2s",       "fps=15", "--at",    "1s", "keyframe",    "--at",
              "3000ms", "rotate=90", "-o",       pictures, "--at",    "1s", "bitrate=600k"});
  EXPECT_EQ(figures["frames_in"], 90);
  EXPECT_EQ(figures["frames_dropped"], 0);
  EXPECT_EQ(figures["key_frames"], json({0, 30, 75}));
  EXPECT_EQ(figures["changes"][0], json({{"seconds", 1.0}, {"change", "keyframe"}}));
  EXPECT_NEAR(figures["bitrate_reached"], 500'000, 100'000);
  EXPECT_GE(figures["psnr_y"], leastPsnr) << "compared with pictures turned in the same way";
  EXPECT_EQ(picturesIn(pictures, 200 * 120 * 3 / 2), 90);
}

INSTANTIATE_TEST_SUITE_P(Device, CallOn, testing::Values("msm7x30", "msm8x55", "msm8x60", "msm8960", "omap4"),
                         [](const auto& instance) { return std::string(instance.param); });

TEST(Call, RecoversFromLossesTheSameWayEveryTimeAndReportsThem) {
  const TemporaryDirectory directory;
  const std::string page = directory.file("call.html"), snapshot = directory.file("first.png");
  std::vector<std::string> arguments{"call", "-s",     "192x128", "-b",        "600k", "-k",
                                     "0",    "--loss", "1%",      "--delay",   "40ms", "-n",
                                     "200",  "--seed", "3",       "--reorder", "2%"};
  const json first = report(arguments);
  arguments.insert(arguments.end(), {"--report", page, "--snapshot", "1s", snapshot});
  const json again = report(arguments);
  EXPECT_GT(first["network"]["packets_lost"], 0);
  EXPECT_GT(first["network"]["packets_late"], 0);
  EXPECT_EQ(first["network"]["pictures_lost"], first["frames_dropped"]);
  EXPECT_GT(first["frames_decoded"], 100);
  EXPECT_EQ(first["frames_out_of_order"], 0);
  EXPECT_GT(first["psnr_y"], 30) << "broken pictures have been shown";
  EXPECT_GE(first["latency_ms"]["p50"], 40);
  EXPECT_GE(first["key_frames"].size(), 2U) << "one for the beginning, others on request";
  for (const char* const key : {"network", "key_frames", "psnr_y", "bitrate_reached"})
    EXPECT_EQ(first[key], again[key]) << key;
  const std::string html = contentOf(page);
  EXPECT_TRUE(contains(html, "packets lost") && contains(html, "data:image/png;base64,iVBORw0KGgo"));
  EXPECT_EQ(html.find("http://"), std::string::npos) << "nothing comes from elsewhere";
  EXPECT_TRUE(html.ends_with("</html>\n"));
  EXPECT_TRUE(contentOf(snapshot).starts_with("\x89PNG"));
}

TEST(Call, EndsCleanlyAtCtrlC) {
  const TemporaryDirectory directory;
  const std::string output = directory.file("a.y4m");
  // The stream on standard output shows that the call runs.
  Process tool({"call", "-n", "1000000000", "-r", "--stream", "-", "-o", output});
  ASSERT_TRUE(tool.waitForOutput(std::string_view("\0\0\1", 3)));
  EXPECT_FALSE(std::filesystem::exists(output));
  tool.signal(SIGINT);
  const Ended run = tool.finish();
  EXPECT_EQ(run.exitCode, kInterrupted) << run.err;
  EXPECT_TRUE(contains(run.err, "Dropped        0")) << run.err;
  EXPECT_GE(picturesIn(output, 640 * 480 * 3 / 2), 1);
  EXPECT_EQ(directory.names(), std::vector<std::string>{"a.y4m"});
}

TEST(Call, EndsWhenNobodyReadsItsOutput) {
  const TemporaryDirectory directory;
  Process tool({"call", "-n", "1000000000", "-o", "-", "--stream", directory.file("a.264")});
  ASSERT_TRUE(tool.waitForOutput("FRAME"));
  tool.closeOutput();
  const Ended run = tool.finish();
  EXPECT_EQ(run.exitCode, kOutput);
  EXPECT_TRUE(contains(run.err, "standard output: whoever was reading it has gone")) << run.err;
  EXPECT_TRUE(directory.names().empty());
}

TEST(Decode, TakesDamageAndReportsPicturesThatChangeTheirSize) {
  const TemporaryDirectory directory;
  report({"call", "-s", "64x48", "-n", "20", "--stream", directory.file("a.264")});
  report({"call", "-s", "96x64", "-n", "20", "--stream", directory.file("b.264")});
  const std::string small = contentOf(directory.file("a.264")), large = contentOf(directory.file("b.264"));
  const std::string both = directory.write("both.264", small + large);
  const std::string raw = directory.file("both.yuv");
  const json figures = report({"decode", both, "-o", raw});
  EXPECT_EQ(figures["frames_decoded"], 40);
  EXPECT_EQ(figures["size_changes"], 1);
  EXPECT_EQ(contentOf(raw).size(), size_t{20 * (64 * 48 + 96 * 64) * 3 / 2});
  const Ended y4m = runTool({"decode", both, "-o", directory.file("both.y4m")});
  EXPECT_EQ(y4m.exitCode, kOutput);
  EXPECT_TRUE(contains(y4m.err, "--format raw")) << y4m.err;
  EXPECT_FALSE(std::filesystem::exists(directory.file("both.y4m")));

  std::string damaged = large;
  for (size_t i = damaged.size() / 4; i < damaged.size(); i += 97) damaged[i] = static_cast<char>(i);
  const Ended run = runTool({"decode", directory.write("damaged.264", damaged + small), "--json"});
  EXPECT_TRUE(run.exitCode == 0 || run.exitCode == kInput) << run.err;
  const json after = json::parse(run.out, nullptr, false);
  EXPECT_GE(after["frames_decoded"], 20) << "what comes behind the damage is not lost";
}

}  // namespace
