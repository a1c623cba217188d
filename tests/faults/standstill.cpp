#include "tests/faults/standstill.h"

#include <string.h>
#include <unistd.h>

#include <filesystem>
#include <fstream>
#include <map>
#include <string>

namespace omxtest {

namespace {

// How often each of the other threads has been switched away from, by thread. Empty when one is running.
using Sleepers = std::map<std::string, std::string>;

// A thread's state and its switches, from its status; empty unless it sleeps.
std::string sleepOf(const std::filesystem::path& thread) {
  std::ifstream status(thread / "status");
  std::string line;
  std::string switches;
  while (std::getline(status, line)) {
    if (line.starts_with("State:") && line.find("S (sleeping)") == line.npos) return "";
    if (line.find("ctxt_switches:") != line.npos) switches += line;
  }
  return switches;
}

Sleepers sleepers() {
  const std::string self = std::to_string(gettid());
  Sleepers result{{self, ""}};  // never empty by itself
  std::error_code gone;         // a thread that ends meanwhile
  for (const auto& thread : std::filesystem::directory_iterator("/proc/self/task", gone)) {
    const std::string id = thread.path().filename();
    if (id == self) continue;
    const std::string sleep = sleepOf(thread.path());
    if (sleep.empty()) return {};
    result[id] = sleep;
  }
  return result;
}

}  // namespace

// Seen asleep twice, with no switch in between, a thread has slept all the time between the two looks at it.
// If that holds of each, all have slept at the moment between the two rounds.
bool atStandstill() {
  const Sleepers before = sleepers();
  return !before.empty() && before == sleepers();
}

size_t entryCount(const char* directory) {
  size_t count = 0;
  for (const auto& entry : std::filesystem::directory_iterator(directory)) count += entry.exists() ? 1u : 0u;
  return count;
}

}  // namespace omxtest
