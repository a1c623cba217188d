// The command line as a user meets it: what it refuses and how, help, lists, exit codes.
#include <gtest/gtest.h>
#include <signal.h>
#include <stdlib.h>
#include <sys/stat.h>

#include <fstream>
#include <set>

#include "tests/tools/process.h"

namespace {

using namespace tooltest;

std::string replaced(std::string text, const std::string& what, const std::string& by) {
  for (size_t at = text.find(what); at != std::string::npos; at = text.find(what, at + by.size())) {
    text.replace(at, what.size(), by);
  }
  return text;
}

TEST(CommandLine, RefusesWhatItDoesNotUnderstandAndSaysWhatItTakes) {
  const struct {
    std::vector<std::string> arguments;
    const char* complaint;
  } cases[] = {
      {{}, "subcommand is required"},
      {{"sing"}, "subcommand is required"},
      {{"call", "--loud"}, "--loud"},
      {{"call", "a", "b"}, "b"},
      {{"call", "--size", "640"}, "\"640\" is not a size as 640x480"},
      {{"call", "--size", "641x480"}, "641x480 is an odd size"},
      {{"call", "--fps", "0"}, "\"0\" is not a rate"},
      {{"call", "--bitrate", "1G"}, "\"1G\" is not a rate from 1k to 1000M"},
      {{"call", "--profile", "extended"}, "is not baseline, main or high"},
      {{"call", "--frames", "0"}, "is not a number from 1 on"},
      {{"call", "--frames", "99999999999999999999"}, "is not a number from 1 on"},
      {{"call", "--refs", "17"}, "is not a number from 1 to 16"},
      {{"call", "--entropy", "huffman"}, "cabac"},
      {{"call", "--format", "avi"}, "y4m"},
      {{"call", "--device", "nokia"}, "no device \"nokia\"; there are msm7x30, "},
      {{"call", "-o", "-", "--stream", "-"}, "cannot both go to -"},
      {{"call", "-o", "a", "--stream", "a"}, "cannot both go to a"},
      {{"call", "-o", "-", "--json"}, "--json needs standard output for itself"},
      {{"call", "--at", "soon", "keyframe"}, "\"soon\" is not a time as 3s"},
      {{"call", "--at", "3s", "rotate=45"}, "\"rotate=45\" is not a change as bitrate=300k"},
      {{"call", "--loss", "101%"}, "is not a share of packets"},
      {{"call", "--delay", "11s"}, "is not a time up to 10s"},
      {{"decode"}, "INPUT is required"},
      {{"decode", "a", "--bitrate", "1M"}, "--bitrate"},
  };
  for (const auto& each : cases) {
    SCOPED_TRACE(each.arguments.empty() ? "" : each.arguments.back());
    const Ended run = runTool(each.arguments);
    EXPECT_EQ(run.exitCode, kUsage);
    EXPECT_TRUE(contains(run.err, each.complaint)) << run.err;
    EXPECT_EQ(run.out, "");
  }
  const Ended run = runTool({"devices"}, {.environment = {"OMXBRIDGE_DEVICE=nokia"}});
  EXPECT_EQ(run.exitCode, kUsage);
  EXPECT_TRUE(contains(run.err, "OMXBRIDGE_DEVICE: no device \"nokia\"")) << run.err;
}

TEST(CommandLine, HelpsWithExamplesAndExitCodes) {
  const struct {
    std::vector<std::string> arguments;
    const char* part;
  } cases[] = {{{"--help"}, "Exit codes:"},
               {{"call", "--help"}, "Examples:"},
               {{"decode", "-h"}, "  130  interrupted"},
               {{"devices", "--help"}, "Usage: omxbridge"}};
  for (const auto& each : cases) {
    const Ended run = runTool(each.arguments);
    EXPECT_EQ(run.exitCode, 0);
    EXPECT_EQ(run.err, "");
    EXPECT_TRUE(contains(run.out, each.part)) << run.out;
  }
}

TEST(CommandLine, TellsShellsAndManOfEveryOption) {
  const std::string bash = runTool({"completion", "bash"}).out;
  const std::string zsh = runTool({"completion", "zsh"}).out;
  const std::string manual = runTool({"manual"}).out;
  for (const char* const option :
       {"--at", "--loss", "--report", "--per-picture", "--cut", "--json", "--format"}) {
    EXPECT_TRUE(contains(bash, option)) << option;
    EXPECT_TRUE(contains(zsh, option)) << option;
    EXPECT_TRUE(contains(manual, "\\-\\-" + std::string(option).substr(2, 2))) << option;
  }
  EXPECT_TRUE(contains(manual, ".SH EXIT STATUS"));
  // As a shell uses it.
  const TemporaryDirectory directory;
  const std::string script = directory.write("completion", bash);
  const std::string ask =
      "source " + script +
      "; complete_it() { COMP_WORDS=(\"$@\"); COMP_CWORD=$(($# - 1)); _omxbridge; "
      "printf '%s ' \"${COMPREPLY[@]}\"; }; complete_it omxbridge co; complete_it omxbridge "
      "call --profile m; complete_it omxbridge call --key";
  const std::string answer = directory.file("answer");
  ASSERT_EQ(system(("bash -c '" + replaced(ask, "'", "'\\''") + "' > " + answer).c_str()), 0);
  EXPECT_EQ(contentOf(answer), "convert compare components completion main --key-interval ");
}

TEST(CommandLine, ListsDevicesAndComponentsAndWhatTheyAreUsedFor) {
  const auto list = json::parse(runTool({"devices", "--json", "-d", "omap4"}).out)["devices"];
  ASSERT_GE(list.size(), 6U);
  for (const auto& device : list) {
    EXPECT_EQ(device["chosen"], device["name"] == "omap4");
    if (!device["chosen"]) continue;
    EXPECT_EQ(device["hardware_version"], 5);
    EXPECT_EQ(device["decoder"], "OMX.TI.DUCATI1.VIDEO.DECODER==");
  }
  const Ended table = runTool({"devices"});
  EXPECT_TRUE(contains(table.out, "* msm8960 ")) << table.out;
  EXPECT_TRUE(contains(table.out, "4 (MSM8x60)")) << table.out;

  const json object = json::parse(runTool({"components", "--json", "-d", "omap4"}).out);
  EXPECT_EQ(object["device"], "omap4");
  std::set<std::string> uses;
  for (const auto& component : object["components"]) {
    EXPECT_TRUE(component["available"]);
    if (!component["use"].is_null()) uses.insert(component["use"]);
  }
  EXPECT_EQ(uses, (std::set<std::string>{"decoder", "encoder"}));
  EXPECT_TRUE(contains(runTool({"components"}).out, "hardware version 1"));
  EXPECT_TRUE(contains(runTool({"components", "-d", "exynos4"}).out, "no components"));
  const Ended noServer =
      runTool({"components"}, {.environment = {"OMXBRIDGE_MEDIASERVER=/missing", "OMXBRIDGE_LOG=silent"}});
  EXPECT_EQ(noServer.exitCode, kDevice);
  EXPECT_TRUE(contains(noServer.err, "OMXBRIDGE_MEDIASERVER")) << noServer.err;
}

TEST(CommandLine, NamesTheFileThatIsWrong) {
  const TemporaryDirectory directory;
  const std::string text = directory.write("notes.txt", "nothing of interest, but rather long");
  const std::string empty = directory.write("empty", "");
  const struct {
    std::vector<std::string> arguments;
    int exitCode;
    std::string name;
  } cases[] = {
      {{"call", directory.file("missing")}, kInput, "missing"},
      {{"call", text}, kInput, "notes.txt"},
      {{"call", empty}, kInput, "empty"},
      {{"call", "-"}, kInput, "standard input"},
      {{"call", directory.file("")}, kInput, directory.file("")},
      {{"decode", text}, kInput, "notes.txt"},
      {{"call", "-o", directory.file("no/a.y4m")}, kOutput, "no/a.y4m"},
      {{"call", "--stream", "/dev/full"}, kOutput, "/dev/full"},
      {{"call", "-o", "/dev/full"}, kOutput, "/dev/full"},
      {{"call", "--at", "1s", "fps=60"}, kUsage, "fps=60 is more than the input has"},
      {{"call", "-d", "exynos4"}, kDevice, "exynos4"},
      {{"call", "-s", "8192x16", "-n", "1"}, kDevice, "8192x16"},
  };
  for (const auto& each : cases) {
    SCOPED_TRACE(each.arguments.back());
    const Ended run = runTool(each.arguments);
    EXPECT_EQ(run.exitCode, each.exitCode) << run.err;
    EXPECT_TRUE(contains(run.err, "omxbridge: ")) << run.err;
    EXPECT_TRUE(contains(run.err, each.name)) << run.err;
  }
  EXPECT_EQ(directory.names().size(), 2U) << "left behind";
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
