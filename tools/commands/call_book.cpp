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
  PictureTrace& trace = _trace.pictures.emplace_back();
  trace.timestamp = picture.timestamp;
  trace.time = picture.time;
  _underWay.push_back(std::move(picture));
}

// From the end: what is asked about is hardly ever far from it.
PictureTrace* CallBook::find(uint32_t timestamp) {
  const auto found =
      std::find_if(_trace.pictures.rbegin(), _trace.pictures.rend(),
                   [timestamp](const PictureTrace& each) { return each.timestamp == timestamp; });
  return found != _trace.pictures.rend() ? &*found : nullptr;
}

void CallBook::encoded(uint32_t timestamp, size_t bytes, bool isKey) {
  const std::lock_guard held(_mutex);
  ++_figures.framesEncoded;
  _figures.streamBytes += bytes;
  if (PictureTrace* const picture = find(timestamp)) {
    picture->bytes = bytes;
    picture->isKey = isKey;
  }
}

int64_t CallBook::timeOf(uint32_t timestamp) {
  const std::lock_guard held(_mutex);
  const PictureTrace* const picture = find(timestamp);
  return picture != nullptr ? picture->time : 0;
}

void CallBook::changed(ChangeTrace change) {
  const std::lock_guard held(_mutex);
  _trace.changes.push_back(std::move(change));
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

void CallBook::decoded(uint32_t timestamp, Clock::duration latency, std::optional<double> psnr) {
  const std::lock_guard held(_mutex);
  ++_figures.framesDecoded;
  if (psnr) {
    _figures.psnr += *psnr;
    ++_compared;
  }
  if (PictureTrace* const picture = find(timestamp)) {
    picture->isDecoded = true;
    picture->psnr = psnr;
    picture->latency = std::chrono::duration<double, std::milli>(latency).count();
  }
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
  std::vector<double> latencies;
  for (const PictureTrace& picture : _trace.pictures) {
    if (picture.isDecoded) latencies.push_back(picture.latency);
  }
  figures.latencies = percentiles(std::move(latencies));
  return figures;
}

CallTrace CallBook::trace() const {
  const std::lock_guard held(_mutex);
  return _trace;
}

}  // namespace tool
