// A line on standard error that shows how far a command is. Only on a terminal. One thread.
#pragma once

#include <stdint.h>

#include <optional>

#include "tools/base/clock.h"

namespace tool {

class ProgressBar {
 public:
  // `total` frames are expected, where that is known.
  explicit ProgressBar(std::optional<uint64_t> total);
  ~ProgressBar();  // wipes the line
  ProgressBar(const ProgressBar&) = delete;
  ProgressBar& operator=(const ProgressBar&) = delete;

  // Cheap: draws a few times a second at most.
  void update(uint64_t done);

 private:
  const std::optional<uint64_t> _total;
  const bool _shown;
  const Clock::time_point _begin;
  Clock::time_point _nextDrawing;
};

}  // namespace tool
