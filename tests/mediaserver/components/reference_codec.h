#pragma once
// libavcodec used directly, for streams to decode and for the pictures that they hold. One thread.

#include <cstdint>
#include <string>
#include <vector>

#include "tests/mediaserver/components/pictures.h"

namespace componenttest {

// One access unit. Time stamps count pictures in the order in which they were given to the encoder.
struct Unit {
  std::vector<uint8_t> bytes;
  int64_t timestamp = 0;
};

struct Decoded {
  Picture picture;
  int64_t timestamp = 0;
};

// Units in order of decoding. `options`: libavcodec's and the encoder's own, "name=value name=value". A
// failure is the test's.
std::vector<Unit> encode(const std::string& encoder, const std::string& options,
                         const std::vector<Picture>& pictures);
std::vector<Picture> scenes(uint32_t width, uint32_t height, uint32_t count);

// What libavcodec makes of the units, in display order, exactly cropped. `decoder`: "h264", "mpeg4", ...;
// `extradata`, if any, as libavcodec wants it, and then the size too.
std::vector<Decoded> decode(const std::string& decoder, const std::vector<Unit>& units,
                            const std::vector<uint8_t>& extradata = {}, uint32_t width = 0,
                            uint32_t height = 0);

// The same in order of decoding: every unit makes one picture.
std::vector<Decoded> inDecodingOrder(const std::vector<Decoded>& pictures, const std::vector<Unit>& units);

// All units in one.
std::vector<uint8_t> joined(const std::vector<Unit>& units);

}  // namespace componenttest
