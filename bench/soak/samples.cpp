#include "bench/soak/samples.h"

#include <malloc.h>
#include <unistd.h>

#include <algorithm>
#include <cmath>
#include <filesystem>
#include <fstream>
#include <iterator>
#include <limits>

namespace bench {

namespace {

double entriesIn(const char* folder) {
  const std::filesystem::directory_iterator begin(folder);
  return static_cast<double>(std::distance(begin, std::filesystem::directory_iterator()));
}

double median(std::vector<double> values) {
  if (values.empty()) return std::numeric_limits<double>::quiet_NaN();
  const auto middle = values.begin() + static_cast<ptrdiff_t>(values.size() / 2);
  std::nth_element(values.begin(), middle, values.end());
  return *middle;
}

}  // namespace

Usage usageNow() {
  double size = 0;
  double resident = 0;
  std::ifstream("/proc/self/statm") >> size >> resident;
  return {resident * static_cast<double>(sysconf(_SC_PAGESIZE)), entriesIn("/proc/self/fd"),
          entriesIn("/proc/self/task")};
}

double heapInUse() {
  const auto heap = mallinfo2();
  return static_cast<double>(heap.uordblks + heap.hblkhd);
}

void Latencies::add(double milliseconds) {
  const std::lock_guard held(_mutex);
  _values.push_back(milliseconds);
}

double Latencies::take() {
  std::vector<double> values;
  {
    const std::lock_guard held(_mutex);
    values.swap(_values);
  }
  if (values.empty()) return std::numeric_limits<double>::quiet_NaN();
  const auto at = values.begin() + static_cast<ptrdiff_t>(values.size() * 95 / 100);
  std::nth_element(values.begin(), at, values.end());
  return *at;
}

double Line::value(const Sample& sample) const {
  return (direct != nullptr ? sample.*direct : sample.usage.*used) * factor;
}

const std::vector<Line>& lines() {
  static const std::vector<Line> all = {
      {"Memory", "MB in core", nullptr, &Usage::memory, 1e-6, 0.2, 8},
      {"Descriptors", "open files", nullptr, &Usage::descriptors, 1, 0.1, 8},
      {"Threads", "", nullptr, &Usage::threads, 1, 0.1, 8},
      {"Latency", "ms from sending to the output, 95th percentile", &Sample::latency, nullptr, 1, 0.5, 20},
  };
  return all;
}

Flatness flatness(const Line& line, const std::vector<Sample>& samples) {
  std::vector<double> thirds[3];
  for (size_t i = 0; i < samples.size(); ++i) {
    const double value = line.value(samples[i]);
    if (!std::isnan(value)) thirds[i * 3 / samples.size()].push_back(value);
  }
  const double before = median(thirds[1]);
  const double after = median(thirds[2]);
  return {before, after, after <= before + std::max(line.slack, line.share * before)};
}

}  // namespace bench
