// What a process uses, looked at while it runs, and whether it stays the same.
#pragma once

#include <stdint.h>

#include <mutex>
#include <string>
#include <vector>

namespace bench {

struct Usage {
  double memory;       // bytes in core
  double descriptors;  // open files
  double threads;
};
Usage usageNow();
// Bytes of the heap that are handed out.
double heapInUse();

// Collects latencies between two looks. Any thread.
class Latencies {
 public:
  void add(double milliseconds);
  // The 95th percentile of those since the last call; not a number without any.
  double take();

 private:
  std::mutex _mutex;
  std::vector<double> _values;
};

struct Sample {
  double time;  // seconds
  Usage usage;
  double latency;  // milliseconds
};

// One quantity over the run. It is flat when its level, the median, in the last third is not above that in
// the third before by more than a share of it or `slack`, whichever is more: what leaks grows all the time.
struct Line {
  const char* name;
  const char* unit;
  double Sample::*direct;  // one of the two
  double Usage::*used;
  double factor;  // from the sample to the unit
  double share;
  double slack;  // in the unit

  double value(const Sample& sample) const;
};
const std::vector<Line>& lines();

struct Flatness {
  double before;
  double after;
  bool isFlat;
};
Flatness flatness(const Line& line, const std::vector<Sample>& samples);

}  // namespace bench
