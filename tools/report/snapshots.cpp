#include "tools/report/snapshots.h"

#include <algorithm>

#include "tools/base/text.h"
#include "tools/files/output_file.h"
#include "tools/media/png.h"

namespace tool {

namespace {

Outcome writePng(const std::string& path, const Picture& picture) {
  const auto png = toPng(picture);
  if (!png) return Failure{ExitCode::Output, path + ": not enough memory"};
  const auto file = OutputFile::create(path);
  if (!file.ok()) return file.failure();
  if (auto failure = file.value()->write(*png)) return failure;
  return file.value()->commit();
}

void keep(std::optional<Snapshot>& slot, int64_t time, const Picture& before, const Picture& after,
          double psnr) {
  if (!slot) slot.emplace();
  slot->time = time;
  slot->psnr = psnr;
  slot->before = before;
  slot->after = after;
}

}  // namespace

void SnapshotTaker::offer(int64_t time, const Picture& before, const Picture& after, double psnr) {
  for (auto request = _requests.begin(); request != _requests.end();) {
    if (request->at > time) {
      ++request;
      continue;
    }
    _due.push_back({request->path, sideBySide(before, after)});
    request = _requests.erase(request);
  }
  if (!_forReport) return;
  if (!_kept.first) keep(_kept.first, time, before, after, psnr);
  if (!_kept.worst || psnr < _kept.worst->psnr) keep(_kept.worst, time, before, after, psnr);
  keep(_kept.last, time, before, after, psnr);
}

Outcome SnapshotTaker::finish() const {
  for (const Due& due : _due) {
    if (auto failure = writePng(due.path, due.picture)) return failure;
  }
  if (_requests.empty()) return {};
  return Failure{ExitCode::Output,
                 formatted("%s: there was no picture at %g s", _requests.front().path.c_str(),
                           static_cast<double>(_requests.front().at) / 1e6)};
}

Picture sideBySide(const Picture& left, const Picture& right) {
  Picture both;
  both.resize({left.size.width + right.size.width, std::max(left.size.height, right.size.height)});
  std::fill(both.bytes.begin(), both.bytes.begin() + static_cast<ptrdiff_t>(both.lumaBytes()), uint8_t{16});
  std::fill(both.bytes.begin() + static_cast<ptrdiff_t>(both.lumaBytes()), both.bytes.end(), uint8_t{128});
  int begin = 0;
  for (const Picture* const picture : {&left, &right}) {
    auto from = picture->bytes.begin();
    auto plane = both.bytes.begin();
    for (const int half : {1, 2, 2}) {
      const int stride = both.size.width / half;
      const int width = picture->size.width / half;
      for (int y = 0; y < picture->size.height / half; ++y, from += width) {
        std::copy_n(from, width, plane + static_cast<ptrdiff_t>(y) * stride + begin / half);
      }
      plane += static_cast<ptrdiff_t>(stride) * (both.size.height / half);
    }
    begin += picture->size.width;
  }
  return both;
}

}  // namespace tool
