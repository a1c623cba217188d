#include <gtest/gtest.h>
#include <stdlib.h>

#include <string>
#include <thread>

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
  const std::string warn = "W/tag: line 5\nE/tag: line 6\nF/tag: line 7\n";
  const std::pair<const char*, std::string> cases[] = {
      {"verbose", "V/tag: line 2\nD/tag: line 3\nI/tag: line 4\n" + warn},
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
          const LogCapture log;
          for (const size_t length : {1023U, 1024U, 5000U}) {
            const std::string text(length, 'x');
            __android_log_print(ANDROID_LOG_ERROR, nullptr, "%s", text.c_str());
            EXPECT_EQ(log.lines().back().text.size(), 1023U);
            std::jthread([&] { __android_log_write(ANDROID_LOG_VERBOSE, "tag", text.c_str()); }).join();
            EXPECT_EQ(log.lines().back().text.size(), 1023U);
          }
          EXPECT_EQ(log.lines().back().tag, "tag");
        }
        __android_log_write(ANDROID_LOG_ERROR, nullptr, "no tag\n");
        __android_log_write(ANDROID_LOG_ERROR, "tag", "two\nlines\n\n");
        __android_log_write(ANDROID_LOG_ERROR, "tag", nullptr);
      },
      testing::Eq("E/: no tag\nE/tag: two lines\nE/tag: \n"));
}

}  // namespace
