// Between I420 and what the device's components take and give. The conversions are the library's own
// frame functions.
#pragma once

#include <stdint.h>

#include <span>
#include <vector>

#include "omxbridge/decoded_picture.h"
#include "tools/base/failure.h"
#include "tools/video/picture.h"

namespace tool {

// Lays a picture out for an encoder of this hardware version. Returns how many bytes of `target` that
// takes; `target` has room for them, as an encoder's input buffers of that picture size do.
size_t layOutForEncoder(const Picture& picture, int hardwareVersion, uint8_t* target);

// Turns decoded pictures into I420. One thread at a time.
class DecodedPictureReader {
 public:
  // Reads the picture that `info` describes from `data`. Fails where the two do not go together or the
  // visible picture has an odd size.
  Outcome read(const DECODEDDATAINFO& info, std::span<const uint8_t> data, Picture& picture);

 private:
  Outcome readCropped(const DECODEDDATAINFO& info, const uint8_t* data, Picture& picture);

  std::vector<uint8_t> _visible;  // semi-planar, cut out
};

}  // namespace tool
