// The tool as a user runs it: a process with arguments, files or pipes, and an exit code.
#pragma once

#include <sys/types.h>

#include <string>
#include <vector>

#include "tests/tools/temporary_directory.h"

namespace tooltest {

struct Ended {
  int exitCode = -1;  // -1: it did not end by itself, or not in time
  std::string out;
  std::string err;
};

class Process {
 public:
  struct Streams {
    std::string in = "/dev/null";            // a file
    bool inPipe = false;                     // instead: what send() is given
    std::string out{};                       // a file or device; empty: collected
    bool terminal = false;                   // standard error is a terminal
    std::vector<std::string> environment{};  // NAME=VALUE, added to the test's own
  };

  explicit Process(const std::vector<std::string>& arguments);
  Process(const std::vector<std::string>& arguments, const Streams& streams);
  ~Process();  // kills what has not ended
  Process(const Process&) = delete;
  Process& operator=(const Process&) = delete;

  void send(std::string_view text) const;
  void closeInput();
  // From now on nobody reads what it writes to standard output.
  void closeOutput();
  // Waits, with a limit, until what was written to standard output contains the text.
  bool waitForOutput(std::string_view text);
  void signal(int number) const;
  // Waits for the end, with a limit.
  Ended finish();

 private:
  bool readOutput(int milliseconds);

  const TemporaryDirectory _directory;
  pid_t _pid = -1;
  int _in = -1;   // we write
  int _out = -1;  // we read
  int _terminal = -1;
  std::string _collected;
};

inline Ended runTool(const std::vector<std::string>& arguments, const Process::Streams& streams = {}) {
  return Process(arguments, streams).finish();
}

}  // namespace tooltest
