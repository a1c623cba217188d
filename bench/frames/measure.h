// What is measured, and how. Everything runs on one thread.
//
// The contenders of a case take turns on the same two buffers: in each of many rounds each of them runs once
// unmeasured, which warms caches and predictors, and then a few times measured. The shortest run counts:
// whatever else the machine does can only add to it, and a ratio of two shortest runs is the one that comes
// out alike on a busy machine and on an idle one.
#pragma once

#include <cstddef>
#include <cstdint>
#include <functional>
#include <memory>
#include <string>
#include <vector>

namespace bench {

struct Size {
  unsigned width, height;
  std::size_t area() const { return std::size_t{width} * height; }
  std::size_t i420() const { return area() * 3 / 2; }
};

inline constexpr Size kVga{640, 480}, kHd{1920, 1080};

struct Contender {
  std::string name;
  std::function<void()> run;
};

// A source and a destination, aligned for the longest vectors. Neither is ever freed by what is measured.
class Buffers {
 public:
  Buffers(std::size_t srcBytes, std::size_t dstBytes);
  std::uint8_t* src() const { return _src; }
  std::uint8_t* dst() const { return _dst; }

 private:
  std::unique_ptr<std::uint8_t[]> _memory;
  std::uint8_t *_src, *_dst;
};

// What a function is to reach; 0 for no goal.
struct Goal {
  double timesBestPeer = 0;  // at least so many times as fast
  double timesLimit = 0;     // at most so many times the limit's time
};

struct Case {
  std::string function, size;
  std::size_t bytesRead, bytesWritten;
  std::shared_ptr<Buffers> buffers;  // of at least these sizes
  std::function<void()> ours;
  std::vector<Contender> peers;
  Goal goal;
};

// Seconds.
struct Result {
  double ours, limit;
  double bestPeer = 0;  // 0: none has this operation
  std::string bestPeerName;
};

// secondsPerContender: how long each contender runs in all.
Result measure(const Case& c, double secondsPerContender);

// The plainest loop over vectors of the processor that moves bytes.
void copyByVectors(const std::uint8_t* src, std::uint8_t* dst, std::size_t bytes);

// One list for each group of functions.
void addRgbCases(std::vector<Case>& cases);
void addYuvCases(std::vector<Case>& cases);
void addRotateCases(std::vector<Case>& cases);
void addScaleCases(std::vector<Case>& cases);

}  // namespace bench
