// Prints a table of every frame function: its time, how many times as fast it is as the best other library,
// and how many times the limit it takes. The limit is the shorter time of memcpy and a plain vector loop that
// copy half of the bytes that the function reads and writes.
//
// Arguments: parts of functions' names to take only those; --seconds N, how long each contender of a case
// runs in all (default 0.1); --target NAME, the instruction set of the frame functions instead of the best
// one.
#include <hwy/highway.h>
#include <hwy/targets.h>

#include <algorithm>
#include <cstdio>
#include <cstdlib>
#include <cstring>
#include <fstream>

#include "bench/frames/measure.h"

namespace {

using namespace bench;

struct Options {
  double seconds = 0.1;
  std::string target;
  std::vector<std::string> names;
};

bool parse(int argc, char** argv, Options& options) {
  for (int i = 1; i < argc; ++i) {
    if (std::strcmp(argv[i], "--seconds") == 0 && i + 1 < argc) {
      options.seconds = std::atof(argv[++i]);
    } else if (std::strcmp(argv[i], "--target") == 0 && i + 1 < argc) {
      options.target = argv[++i];
    } else if (argv[i][0] == '-') {
      return false;
    } else {
      options.names.emplace_back(argv[i]);
    }
  }
  return options.seconds > 0;
}

bool wanted(const Options& options, const Case& c) {
  return options.names.empty() ||
         std::any_of(options.names.begin(), options.names.end(),
                     [&](const std::string& name) { return c.function.find(name) != std::string::npos; });
}

// False if processor and build do not have it.
bool choose(const std::string& target) {
  for (const std::int64_t each : hwy::SupportedAndGeneratedTargets()) {
    if (target != hwy::TargetName(each)) continue;
    hwy::SetSupportedTargetsForTest(each);
    hwy::GetChosenTarget().Update(each);
    return true;
  }
  return false;
}

// As it is printed, so that what is said of it agrees with what is seen.
double rounded(double value) {
  return static_cast<double>(static_cast<long>(value * 100 + 0.5)) / 100;
}

std::string fixed(double value, int digits) {
  char text[32];
  std::snprintf(text, sizeof text, "%.*f", digits, value);
  return text;
}

std::string processor() {
  const std::string key = "model name";
  std::ifstream info("/proc/cpuinfo");
  for (std::string line; std::getline(info, line);) {
    const std::size_t colon = line.find(": ");
    if (line.compare(0, key.size(), key) == 0 && colon != std::string::npos) return line.substr(colon + 2);
  }
  return "unknown";
}

class Table {
 public:
  void head() {
    std::printf("Processor: %s; instruction set of the frame functions: %s\n\n", processor().c_str(),
                hwy::TargetName(hwy::SupportedAndGeneratedTargets().front()));
    std::puts("| Function | Size | Time, us | Best peer | Peer / ours | Ours / limit | Goal | |");
    std::puts("| --- | --- | ---: | --- | ---: | ---: | --- | --- |");
  }

  void row(const Case& c, const Result& r) {
    const double timesLimit = rounded(r.ours / r.limit), timesPeer = rounded(r.bestPeer / r.ours);
    std::string goal, peer = r.bestPeer == 0 ? "-" : r.bestPeerName;
    bool met = true;
    const auto require = [&](double value, const char* what, bool reached) {
      if (value == 0) return;
      goal += (goal.empty() ? "" : ", ") + (what + fixed(value, 1));
      met = met && reached;
    };
    if (r.bestPeer != 0) require(c.goal.timesBestPeer, "peer >= ", timesPeer >= c.goal.timesBestPeer);
    require(c.goal.timesLimit, "limit <= ", timesLimit <= c.goal.timesLimit);
    std::printf("| %s | %s | %s | %s | %s | %s | %s | %s |\n", c.function.c_str(), c.size.c_str(),
                fixed(r.ours * 1e6, 1).c_str(), peer.c_str(),
                r.bestPeer == 0 ? "-" : fixed(timesPeer, 2).c_str(), fixed(timesLimit, 2).c_str(),
                goal.empty() ? "-" : goal.c_str(),
                goal.empty() ? ""
                : met        ? "met"
                             : "**missed**");
    std::fflush(stdout);
    if (goal.empty()) return;
    ++_goals;
    if (met) ++_met;
  }

  void foot() const { std::printf("\n%u of %u rows with goals meet them.\n", _met, _goals); }

 private:
  unsigned _goals = 0, _met = 0;
};

}  // namespace

int main(int argc, char** argv) {
  Options options;
  if (!parse(argc, argv, options)) {
    std::fprintf(stderr, "usage: %s [--seconds N] [--target NAME] [PART OF A FUNCTION'S NAME ...]\n",
                 argv[0]);
    return 2;
  }
  if (!options.target.empty() && !choose(options.target)) {
    std::fprintf(stderr, "%s: no such instruction set here. There are:", options.target.c_str());
    for (const std::int64_t each : hwy::SupportedAndGeneratedTargets()) {
      std::fprintf(stderr, " %s", hwy::TargetName(each));
    }
    std::fputs("\n", stderr);
    return 2;
  }
  std::vector<Case> cases;
  addRgbCases(cases);
  addYuvCases(cases);
  addRotateCases(cases);
  addScaleCases(cases);
  Table table;
  table.head();
  for (const Case& c : cases) {
    if (wanted(options, c)) table.row(c, measure(c, options.seconds));
  }
  table.foot();
  return 0;
}
