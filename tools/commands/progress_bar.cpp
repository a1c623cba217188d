#include "tools/commands/progress_bar.h"

#include <inttypes.h>
#include <stdio.h>
#include <unistd.h>

#include <algorithm>
#include <string>

#include "tools/base/text.h"

namespace tool {

namespace {

constexpr std::chrono::milliseconds kPause{100};
constexpr size_t kWidth = 30;  // letters

}  // namespace

ProgressBar::ProgressBar(std::optional<uint64_t> total)
    : _total(total),
      _shown(isatty(STDERR_FILENO) != 0),
      _begin(Clock::now()),
      _nextDrawing(_begin + kPause) {}

ProgressBar::~ProgressBar() {
  if (_shown) fputs("\r\033[K", stderr);
}

void ProgressBar::update(uint64_t done) {
  if (!_shown) return;
  const auto now = Clock::now();
  if (now < _nextDrawing) return;
  _nextDrawing = now + kPause;

  const double seconds = std::chrono::duration<double>(now - _begin).count();
  std::string line = "\r\033[K";
  if (_total && *_total > 0) {
    const auto filled = static_cast<size_t>(std::min(done, *_total) * kWidth / *_total);
    line += "[" + std::string(filled, '#') + std::string(kWidth - filled, '.') + "] ";
    line += formatted("%" PRIu64 "/%" PRIu64 " frames", done, *_total);
  } else {
    line += formatted("%" PRIu64 " frames", done);
  }
  line += formatted(", %.0f frames/s", static_cast<double>(done) / seconds);
  fputs(line.c_str(), stderr);
}

}  // namespace tool
