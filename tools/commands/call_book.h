// What a call keeps account of: which pictures are under way, and what became of each. A picture that was
// decoded is matched with the one that was sent by its time stamp. Any thread.
#pragma once

#include <stddef.h>
#include <stdint.h>

#include <algorithm>
#include <deque>
#include <mutex>
#include <optional>
#include <string>
#include <vector>

#include "omxbridge/codec_settings.h"
#include "tools/base/clock.h"
#include "tools/video/picture.h"

namespace tool {

struct SentPicture {
  uint32_t timestamp = 0;
  Picture picture;
  Clock::time_point captured;
  int64_t time = 0;  // of the video, microseconds
  int rotation = 0;  // degrees by which the encoder turns it
};

// What became of one picture that the encoder took.
struct PictureTrace {
  uint32_t timestamp = 0;
  int64_t time = 0;  // of the video, microseconds
  size_t bytes = 0;  // 0: the encoder dropped it
  bool isKey = false;
  bool isDecoded = false;
  std::optional<double> psnr;  // dB
  double latency = 0;          // milliseconds
};

// A change that was carried out.
struct ChangeTrace {
  int64_t time;  // of the first picture that it holds for
  CONFIGTYPE item;
  uint32_t value;
  std::string text;
};

struct CallTrace {
  std::vector<PictureTrace> pictures;  // in the order of their time
  std::vector<ChangeTrace> changes;
};

struct Percentiles {
  double p50 = 0;
  double p95 = 0;
  double p99 = 0;
};

// Nearest rank; all 0 without values.
Percentiles percentiles(std::vector<double> values);

struct CallFigures {
  uint64_t framesIn = 0;    // taken from the source
  uint64_t framesSent = 0;  // taken by the encoder
  uint64_t framesEncoded = 0;
  uint64_t framesDecoded = 0;
  uint64_t framesOutOfOrder = 0;  // decoded after a later one, or twice
  uint64_t streamBytes = 0;
  double psnr = 0;        // dB, luma, mean over the decoded pictures
  Percentiles latencies;  // milliseconds

  uint64_t framesDropped() const { return framesIn - std::min(framesIn, framesDecoded); }
};

class CallBook {
 public:
  void captured();
  // Before the picture is sent: its output may be there at once.
  void sending(SentPicture picture);
  void encoded(uint32_t timestamp, size_t bytes, bool isKey);
  // When a picture that was sent is due, in microseconds of the video.
  int64_t timeOf(uint32_t timestamp);
  void changed(ChangeTrace change);
  // The picture that was sent with this time stamp, no longer under way; those sent before it count as
  // lost. Nothing where there is none.
  std::optional<SentPicture> arrived(uint32_t timestamp);
  // The picture that has arrived(). `psnr` is nothing where it could not be compared.
  void decoded(uint32_t timestamp, Clock::duration latency, std::optional<double> psnr);
  // A picture was decoded that is not under way.
  void strayed();

  CallFigures figures() const;
  CallTrace trace() const;

 private:
  PictureTrace* find(uint32_t timestamp);

  mutable std::mutex _mutex;
  CallFigures _figures;  // the counts; psnr is their sum until figures() makes the mean
  std::deque<SentPicture> _underWay;
  CallTrace _trace;
  uint64_t _compared = 0;
};

}  // namespace tool
