// The tool as a user runs it: a process with arguments, files or pipes, and an exit code.
#pragma once

#include <gtest/gtest.h>
#include <sys/types.h>

#include <nlohmann/json.hpp>
#include <string>
#include <vector>

#include "tests/tools/temporary_directory.h"

namespace tooltest {

using nlohmann::json;

struct Ended {
  int exitCode = -1;  // -1: it did not end by itself, or not in time
  std::string out{};
  std::string err{};
};

struct Streams {
  std::string in = "/dev/null";            // a file or pipe
  std::string out{};                       // a file or device; empty: collected
  std::vector<std::string> environment{};  // NAME=VALUE, added to the test's own
};

class Process {
 public:
  explicit Process(std::vector<std::string> arguments, Streams streams = {});
  ~Process();  // kills what has not ended
  Process(const Process&) = delete;
  Process& operator=(const Process&) = delete;

  // From now on nobody reads what it writes to standard output.
  void closeOutput();
  // Waits, with a limit, until what was written to standard output contains the text.
  bool waitForOutput(std::string_view text);
  void signal(int number) const;
  // Waits for the end, with a limit.
  Ended finish();

 private:
  bool readOutput();

  const TemporaryDirectory _directory;
  pid_t _pid = -1;
  int _out = -1;  // we read
  std::string _collected;
};

inline Ended runTool(const std::vector<std::string>& arguments, const Streams& streams = {}) {
  return Process(arguments, streams).finish();
}

// A run that ends well and says nothing but its figures.
inline json report(std::vector<std::string> arguments) {
  arguments.emplace_back("--json");
  const Ended run = runTool(arguments);
  EXPECT_EQ(run.exitCode, 0) << run.err;
  EXPECT_EQ(run.err, "");
  return json::parse(run.out, nullptr, false);
}

// Exit codes.
constexpr int kUsage = 2, kInput = 3, kOutput = 4, kDevice = 5, kInterrupted = 130;

inline bool contains(const std::string& text, std::string_view part) {
  return text.find(part) != std::string::npos;
}

}  // namespace tooltest
