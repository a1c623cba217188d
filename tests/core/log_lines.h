// A log capture as text, for comparison: one entry a line, the priority's letter in front ("E text",
// "W text"); a tag shows as "E/tag text". Exact, blanks and line ends included.
#pragma once

#include <string>
#include <vector>

#include <android/log.h>
#include <omxhost/log.h>

namespace omxtest {

using LogLines = std::vector<std::string>;

inline LogLines logLines(const omxhost::LogCapture& capture) {
  LogLines lines;
  for (const omxhost::LogLine& line : capture.lines()) {
    std::string text = line.priority == ANDROID_LOG_ERROR  ? "E"
                       : line.priority == ANDROID_LOG_WARN ? "W"
                                                           : std::to_string(line.priority);
    if (!line.tag.empty()) text += "/" + line.tag;
    lines.push_back(text + " " + line.text);
  }
  return lines;
}

}  // namespace omxtest
