#include "tools/commands/call_book.h"

#include <algorithm>
#include <cmath>

namespace tool {

Percentiles percentiles(std::vector<double> values) {
  if (values.empty()) return {};
  std::sort(values.begin(), values.end());
  const auto at = [&values](double share) {
    const auto rank = static_cast<size_t>(std::ceil(share * static_cast<double>(values.size())));
    return values[std::clamp<size_t>(rank, 1, values.size()) - 1];
  };
  return {at(0.50), at(0.95), at(0.99)};
}

void CallBook::captured() {
  const std::lock_guard held(_mutex);
  ++_figures.framesIn;
}

void CallBook::sending(SentPicture picture) {
  const std::lock_guard held(_mutex);
  ++_figures.framesSent;
  _underWay.push_back(std::move(picture));
}

void CallBook::encoded(size_t bytes) {
  const std::lock_guard held(_mutex);
  ++_figures.framesEncoded;
  _figures.streamBytes += bytes;
}

std::optional<SentPicture> CallBook::arrived(uint32_t timestamp) {
  const std::lock_guard held(_mutex);
  const auto found = std::find_if(_underWay.begin(), _underWay.end(), [timestamp](const SentPicture& each) {
    return each.timestamp == timestamp;
  });
  if (found == _underWay.end()) return std::nullopt;
  SentPicture picture = std::move(*found);
  _underWay.erase(_underWay.begin(), found + 1);
  return picture;
}

void CallBook::decoded(Clock::duration latency, std::optional<double> psnr) {
  const std::lock_guard held(_mutex);
  ++_figures.framesDecoded;
  _latencies.push_back(std::chrono::duration<double, std::milli>(latency).count());
  if (!psnr) return;
  _figures.psnr += *psnr;
  ++_compared;
}

void CallBook::strayed() {
  const std::lock_guard held(_mutex);
  ++_figures.framesDecoded;
  ++_figures.framesOutOfOrder;
}

CallFigures CallBook::figures() const {
  const std::lock_guard held(_mutex);
  CallFigures figures = _figures;
  if (_compared > 0) figures.psnr /= static_cast<double>(_compared);
  figures.latencies = percentiles(_latencies);
  return figures;
}

}  // namespace tool
