// Where the log goes on this port. Lines of at least the level that the environment variable
// OMXBRIDGE_LOG names (verbose, debug, info, warn, error or silent; default warn) go to standard
// error, one line each: "E/tag: text". A LogCapture takes them instead.
#pragma once

#include <chrono>
#include <memory>
#include <string>
#include <string_view>
#include <vector>

namespace omxhost {

struct LogLine {
  int priority;
  std::string tag;
  std::string text;  // as written, after the cut
};

// Collects every line of the process while it lives, whatever the level, and keeps all of them from
// standard error. Captures may overlap; each gets every line. Any thread may ask.
class LogCapture {
 public:
  LogCapture();
  ~LogCapture();
  LogCapture(const LogCapture&) = delete;
  LogCapture& operator=(const LogCapture&) = delete;

  std::vector<LogLine> lines() const;
  void clear();

  // How many lines contain `part`.
  size_t count(std::string_view part) const;
  bool contains(std::string_view part) const { return count(part) != 0; }

  // Waits until a line that contains `part` has arrived, which may be one that already has.
  // False if the time ran out.
  [[nodiscard]] bool waitFor(std::string_view part,
                             std::chrono::milliseconds limit = std::chrono::seconds(10)) const;

 private:
  friend struct LogSinks;
  struct State;
  const std::shared_ptr<State> _state;
};

}  // namespace omxhost
