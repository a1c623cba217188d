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
  constexpr const char* kLevels[] = {"verbose", "error", "silent", "", "loud"};
  setenv("OMXBRIDGE_LOG", kLevels[kIndex], 1);
  writeOneOfEach();
}

TEST(Log, WritesTheLinesOfItsLevelToStandardError) {
  const std::string error = "E/tag: line 6\nF/tag: line 7\n";
  const std::string warn = "W/tag: line 5\n" + error;
  EXPECT_IN_NEW_PROCESS(writeAtLevel<0>, testing::Eq("V/tag: line 2\nD/tag: line 3\nI/tag: line 4\n" + warn));
  EXPECT_IN_NEW_PROCESS(writeAtLevel<1>, testing::Eq(error));
  EXPECT_IN_NEW_PROCESS(writeAtLevel<2>, testing::Eq(""));
  EXPECT_IN_NEW_PROCESS(writeAtLevel<3>, testing::Eq(warn));
  EXPECT_IN_NEW_PROCESS(writeAtLevel<4>,
                        testing::ContainsRegex("^W/omxhost: OMXBRIDGE_LOG .*\n" + warn + "$"));
}

TEST(Log, CutsTextsTo1023CharactersAndKeepsWhatIsCapturedFromStandardError) {
  EXPECT_IN_NEW_PROCESS(
      [] {
        setenv("OMXBRIDGE_LOG", "error", 1);
        {
          const LogCapture capture;
          writeOneOfEach();
          for (const size_t length : {1022U, 1023U, 1024U, 5000U}) {
            const std::string text(length, 'x');
            __android_log_print(ANDROID_LOG_ERROR, nullptr, "%s", text.c_str());
            __android_log_write(ANDROID_LOG_ERROR, "tag", text.c_str());
            const std::vector<omxhost::LogLine> lines = capture.lines();
            for (size_t i = lines.size() - 2; i < lines.size(); ++i) {
              EXPECT_EQ(lines[i].text.size(), std::min<size_t>(length, 1023));
            }
          }
          EXPECT_EQ(capture.lines()[0].priority, ANDROID_LOG_VERBOSE);
          EXPECT_EQ(capture.lines()[0].tag + capture.lines()[0].text, "tagline 2");
        }
        __android_log_write(ANDROID_LOG_ERROR, nullptr, "no tag\n");
        __android_log_write(ANDROID_LOG_ERROR, "tag", "two\nlines\n\n");
        __android_log_write(ANDROID_LOG_ERROR, "tag", nullptr);
      },
      testing::Eq("E/: no tag\nE/tag: two lines\nE/tag: \n"));
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
