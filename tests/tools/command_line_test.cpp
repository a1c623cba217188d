// The command line as a user meets it: what it refuses and how, help, lists, exit codes.
#include <gtest/gtest.h>
#include <signal.h>
#include <sys/stat.h>

#include <fstream>

#include "tests/tools/process.h"

namespace {

using namespace tooltest;

TEST(CommandLine, TellsOfItselfAndOfTheDevices) {
  const struct {
    std::vector<std::string> arguments;
    const char* part;
  } cases[] = {{{"--help"}, "Exit codes:"},
               {{"decode", "-h"}, "  130  interrupted"},
               {{"manual"}, ".SH EXIT STATUS"},
               {{"completion", "bash"}, "--per-picture"},
               {{"devices"}, "* msm8960 "},
               {{"components"}, "hardware version 1"},
               {{"components", "-d", "exynos4"}, "no components"}};
  for (const auto& each : cases) {
    const Ended run = runTool(each.arguments);
    EXPECT_EQ(run.exitCode, 0);
    EXPECT_EQ(run.err, "");
    EXPECT_TRUE(contains(run.out, each.part)) << run.out;
  }
  const json listed = report({"devices", "-d", "omap4"});
  for (const auto& device : listed["devices"]) {
    const bool isOmap4 = device["decoder"] == "OMX.TI.DUCATI1.VIDEO.DECODER==";
    EXPECT_TRUE(device["chosen"] == isOmap4 && isOmap4 == (device["name"] == "omap4")) << device;
  }
  EXPECT_EQ(report({"components", "-d", "omap4"})["device"], "omap4");
  const Ended noServer =
      runTool({"components"}, {.environment = {"OMXBRIDGE_MEDIASERVER=/missing", "OMXBRIDGE_LOG=silent"}});
  EXPECT_EQ(noServer.exitCode, kDevice);
  EXPECT_TRUE(contains(noServer.err, "OMXBRIDGE_MEDIASERVER")) << noServer.err;
}

TEST(CommandLine, NamesWhatItDoesNotUnderstandOrFindsWrong) {
  const TemporaryDirectory directory;
  const std::string text = directory.write("notes.txt", "nothing of interest, but rather long");
  const std::string empty = directory.write("empty", "");
  const std::string small = directory.file("small.y4m"), large = directory.file("large.y4m");
  report({"convert", "-s", "64x48", "-n", "1", "-o", small});
  report({"convert", "-s", "96x64", "-n", "3", "-o", large});
  const struct {
    std::vector<std::string> arguments;
    int exitCode;
    std::string complaint;
  } cases[] = {
      {{}, kUsage, "subcommand is required"},
      {{"call", "--loud"}, kUsage, "--loud"},
      {{"call", "--size", "640"}, kUsage, "\"640\" is not a size as 640x480"},
      {{"call", "--bitrate", "1G"}, kUsage, "\"1G\" is not a rate from 1k to 1000M"},
      {{"call", "--frames", "99999999999999999999"}, kUsage, "is not a number from 1 on"},
      {{"call", "--device", "nokia"}, kUsage, "no device \"nokia\"; there are msm7x30, "},
      {{"call", "-o", "-", "--stream", "-"}, kUsage, "cannot both go to -"},
      {{"call", "-o", "-", "--json"}, kUsage, "--json needs standard output for itself"},
      {{"call", "--at", "soon", "keyframe"}, kUsage, "\"soon\" is not a time as 3s"},
      {{"call", "--at", "3s", "rotate=45"}, kUsage, "\"rotate=45\" is not a change as bitrate=300k"},
      {{"call", "--loss", "101%"}, kUsage, "is not a share of packets"},
      {{"call", text}, kInput, "notes.txt"},
      {{"call", empty}, kInput, "empty"},
      {{"call", directory.file("")}, kInput, directory.file("")},
      {{"call", "-o", "/dev/full"}, kOutput, "/dev/full"},
      {{"call", "--at", "1s", "fps=60"}, kUsage, "fps=60 is more than the input has"},
      {{"call", "-d", "exynos4"}, kDevice, "exynos4"},
      {{"call", "-s", "8192x16", "-n", "1"}, kDevice, "8192x16"},
      {{"convert", small, "--cut", "96x96"}, kUsage, "is larger than the picture, which is 64x48"},
      {{"convert", small, "--scale", "33x32"}, kUsage, "\"33x32\" is not an even size"},
      {{"compare", small, large}, kInput, "the pictures differ in size, 64x48 and 96x64"},
      {{"encode", large, "-o", "/dev/full", "--format", "mp4"}, kOutput, "/dev/full: no space left"},
  };
  for (const auto& each : cases) {
    SCOPED_TRACE(each.complaint);
    const Ended run = runTool(each.arguments);
    EXPECT_EQ(run.exitCode, each.exitCode) << run.err;
    EXPECT_TRUE(contains(run.err, each.complaint)) << run.err;
    // What only the input shows is found when the device has been told.
    EXPECT_TRUE(run.exitCode != kUsage || run.out.empty() || run.out.starts_with("Device ")) << run.out;
  }
  const Ended run = runTool({"devices"}, {.environment = {"OMXBRIDGE_DEVICE=nokia"}});
  EXPECT_EQ(run.exitCode, kUsage);
  EXPECT_TRUE(contains(run.err, "OMXBRIDGE_DEVICE: no device \"nokia\"")) << run.err;
  EXPECT_EQ(directory.names().size(), 4U) << "left behind";
  EXPECT_EQ(runTool({"devices"}, {.out = "/dev/full"}).exitCode, kOutput);
}

TEST(CommandLine, EndsAtCtrlCWhileItWaitsForInput) {
  const TemporaryDirectory directory;
  const std::string path = directory.file("pipe");
  ASSERT_EQ(mkfifo(path.c_str(), 0600), 0);
  std::fstream pipe(path);  // for both, which does not wait for the tool
  for (const int number : {SIGINT, SIGTERM}) {
    Process tool({"call", "-", "-o", directory.file("a.y4m")}, {.in = path});
    pipe << "YUV4MPEG2 W64 H64 F30:1\n" << std::flush;
    ASSERT_TRUE(tool.waitForOutput("Components"));
    tool.signal(number);
    const Ended run = tool.finish();
    EXPECT_EQ(run.exitCode, kInterrupted) << run.err;
    EXPECT_EQ(directory.names(), std::vector<std::string>{"pipe"});
  }
}

}  // namespace
