// Pictures of a call before and after, kept for files and for the report. One thread at a time.
#pragma once

#include <stdint.h>

#include <optional>
#include <string>
#include <vector>

#include "tools/base/failure.h"
#include "tools/video/picture.h"

namespace tool {

struct SnapshotRequest {
  int64_t at;  // microseconds of the video: the first decoded picture not before
  std::string path;
};

struct Snapshot {
  int64_t time = 0;
  double psnr = 0;  // dB
  Picture before;
  Picture after;
};

class SnapshotTaker {
 public:
  // `forReport`: the first picture, the worst and the last are kept.
  SnapshotTaker(std::vector<SnapshotRequest> requests, bool forReport)
      : _requests(std::move(requests)), _forReport(forReport) {}

  // Each decoded picture with its source, in order. Only copies: what takes time would be seen in the
  // latency.
  void offer(int64_t time, const Picture& before, const Picture& after, double psnr);
  // At the end: writes the files. Fails where a picture never came.
  Outcome finish() const;

  struct Kept {
    std::optional<Snapshot> first;
    std::optional<Snapshot> worst;
    std::optional<Snapshot> last;
  };
  const Kept& kept() const { return _kept; }

 private:
  struct Due {
    std::string path;
    Picture picture;
  };

  std::vector<SnapshotRequest> _requests;  // those still to come
  std::vector<Due> _due;
  const bool _forReport;
  Kept _kept;
};

// One to the left of the other, both of even size.
Picture sideBySide(const Picture& left, const Picture& right);

}  // namespace tool
