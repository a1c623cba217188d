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

TEST(Log, WritesTheLinesOfItsLevelToStandardError) {
  const std::string error = "E/tag: line 6\nF/tag: line 7\n";
  const std::string warn = "W/tag: line 5\n" + error;
  const std::pair<const char*, std::string> cases[] = {
      {"verbose", "V/tag: line 2\nD/tag: line 3\nI/tag: line 4\n" + warn},
      {"error", error},
      {"silent", ""},
      {"", warn},
      {"loud", "W/omxhost: OMXBRIDGE_LOG [^\n]*\n" + warn}};
  for (const auto& each : cases) {
    const auto write = [&] {
      setenv("OMXBRIDGE_LOG", each.first, 1);
      writeOneOfEach();
    };
    EXPECT_IN_NEW_PROCESS(write, testing::MatchesRegex(each.second));
  }
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
            EXPECT_EQ(capture.lines().back().text.size(), std::min<size_t>(length, 1023));
            __android_log_write(ANDROID_LOG_ERROR, "tag", text.c_str());
            EXPECT_EQ(capture.lines().back().text.size(), std::min<size_t>(length, 1023));
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
  const LogCapture outer;
  __android_log_write(ANDROID_LOG_WARN, "tag", "first");
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
  EXPECT_EQ(inner.lines().size(), 804U);
  EXPECT_EQ(outer.lines().size(), 805U);
}

}  // namespace
