#include <gtest/gtest.h>
#include <stdlib.h>

#include <string>
#include <thread>
#include <vector>

#include <android/log.h>
#include <omxhost/log.h>

#include "tests/host/new_process.h"

namespace {

using omxhost::LogCapture;

void writeOneOfEach() {
  for (int priority = ANDROID_LOG_VERBOSE; priority <= ANDROID_LOG_SILENT; ++priority) {
    __android_log_print(priority, "tag", "line %d", priority);
  }
}

// Each piece sets the level first thing, in a process that has not logged before.
template <int kIndex>
void writeAtLevel() {
  constexpr const char* kLevels[] = {"verbose", "debug", "info", "warn", "error", "silent", "", "loud"};
  setenv("OMXBRIDGE_LOG", kLevels[kIndex], 1);
  writeOneOfEach();
}

TEST(Log, WritesTheLinesOfItsLevelToStandardError) {
  const std::string error = "E/tag: line 6\nF/tag: line 7\n";
  const std::string warn = "W/tag: line 5\n" + error;
  const std::string info = "I/tag: line 4\n" + warn;
  const std::string debug = "D/tag: line 3\n" + info;
  EXPECT_IN_NEW_PROCESS(writeAtLevel<0>, testing::Eq("V/tag: line 2\n" + debug));
  EXPECT_IN_NEW_PROCESS(writeAtLevel<1>, testing::Eq(debug));
  EXPECT_IN_NEW_PROCESS(writeAtLevel<2>, testing::Eq(info));
  EXPECT_IN_NEW_PROCESS(writeAtLevel<3>, testing::Eq(warn));
  EXPECT_IN_NEW_PROCESS(writeAtLevel<4>, testing::Eq(error));
  EXPECT_IN_NEW_PROCESS(writeAtLevel<5>, testing::Eq(""));
  EXPECT_IN_NEW_PROCESS(writeAtLevel<6>, testing::Eq(warn));
  EXPECT_IN_NEW_PROCESS(writeAtLevel<7>,
                        testing::ContainsRegex("^W/omxhost: OMXBRIDGE_LOG .*\n" + warn + "$"));
}

TEST(Log, EveryTextIsOneLine) {
  EXPECT_IN_NEW_PROCESS(
      [] {
        unsetenv("OMXBRIDGE_LOG");
        __android_log_write(ANDROID_LOG_ERROR, nullptr, "no tag\n");
        __android_log_write(ANDROID_LOG_ERROR, "tag", "two\nlines\n\n");
        __android_log_write(ANDROID_LOG_ERROR, "tag", nullptr);
        __android_log_write(1000, "tag", "out of range");
        __android_log_write(-1, "tag", "below everything");
      },
      testing::Eq("E/: no tag\nE/tag: two lines\nE/tag: \n"));
}

TEST(Log, CapturesEveryLevelAsWrittenAndKeepsItFromStandardError) {
  EXPECT_IN_NEW_PROCESS(
      [] {
        setenv("OMXBRIDGE_LOG", "error", 1);
        {
          const LogCapture capture;
          writeOneOfEach();
          __android_log_print(ANDROID_LOG_ERROR, nullptr, "with a break\n");
          const std::vector<omxhost::LogLine> lines = capture.lines();
          ASSERT_EQ(lines.size(), 8U);
          EXPECT_EQ(lines[0].priority, ANDROID_LOG_VERBOSE);
          EXPECT_EQ(lines[0].tag + lines[0].text, "tagline 2");
          EXPECT_EQ(lines[7].tag + lines[7].text, "with a break\n");
        }
        __android_log_print(ANDROID_LOG_ERROR, "tag", "after");
      },
      testing::Eq("E/tag: after\n"));
}

TEST(Log, CutsTextsTo1023Characters) {
  const LogCapture capture;
  for (const size_t length : {1022U, 1023U, 1024U, 5000U}) {
    const std::string text(length, 'x');
    __android_log_print(ANDROID_LOG_ERROR, "tag", "%s", text.c_str());
    __android_log_write(ANDROID_LOG_ERROR, "tag", text.c_str());
    const std::vector<omxhost::LogLine> lines = capture.lines();
    for (size_t i = lines.size() - 2; i < lines.size(); ++i) {
      EXPECT_EQ(lines[i].text.size(), std::min<size_t>(length, 1023));
    }
  }
}

TEST(Log, CapturesOverlapAndWaitForLinesOfOtherThreads) {
  LogCapture outer;
  __android_log_write(ANDROID_LOG_WARN, "tag", "first");
  {
    const LogCapture inner;
    EXPECT_FALSE(inner.waitFor("late", std::chrono::milliseconds(1)));
    std::vector<std::thread> threads;
    for (int i = 0; i < 4; ++i) {
      threads.emplace_back([] {
        for (int n = 0; n < 200; ++n) __android_log_print(ANDROID_LOG_INFO, "tag", "line %d", n);
        __android_log_write(ANDROID_LOG_INFO, "tag", "this is late");
      });
    }
    EXPECT_TRUE(inner.waitFor("late"));
    for (std::thread& each : threads) each.join();
    EXPECT_EQ(inner.count("line"), 800U);
    EXPECT_FALSE(inner.contains("first"));
  }
  EXPECT_EQ(outer.lines().size(), 805U);
  outer.clear();
  EXPECT_TRUE(outer.lines().empty());
}

}  // namespace
