// Where pictures come from: a Y4M stream, raw I420, any other video file, or the built-in scene. One thread
// at a time.
#pragma once

#include <stdint.h>

#include <memory>
#include <optional>
#include <stop_token>
#include <string>

#include "tools/base/failure.h"
#include "tools/video/picture.h"

namespace tool {

class FrameSource {
 public:
  virtual ~FrameSource() = default;

  // The size is even, and the same for every picture.
  virtual Size size() const = 0;
  virtual const VideoTraits& traits() const = 0;
  // Where it is known beforehand.
  virtual std::optional<uint64_t> frameCount() const = 0;

  // The next picture into `picture`, whose memory is reused. False at the end, or once a stop has been
  // requested.
  virtual Result<bool> next(Picture& picture) = 0;
};

struct SourceRequest {
  std::string path;               // "-" standard input; empty: the built-in scene
  std::optional<Size> size;       // needed for raw pictures; of the scene
  std::optional<FrameRate> rate;  // instead of the input's own, or of the default
  std::string layout = "i420";    // of raw pictures, see findLayout()
};

// Tells what the input is by its first bytes.
Result<std::unique_ptr<FrameSource>> openFrameSource(const SourceRequest& request,
                                                     const std::stop_token& stop);

}  // namespace tool
