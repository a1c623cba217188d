#pragma once
// Pictures, the layouts in which components take and give them, stated independently of the components' own
// code, and libavcodec used directly, for streams to decode and for the pictures that they hold. One thread.

#include <cstdint>
#include <span>
#include <string>
#include <vector>

#include <OMX_IVCommon.h>
#include <omxhost/device.h>

namespace componenttest {

// I420 without gaps; chroma planes are half as large, rounded up.
struct Picture {
  uint32_t width = 0;
  uint32_t height = 0;
  std::vector<uint8_t> bytes;

  Picture() = default;
  Picture(uint32_t columns, uint32_t rows);
  uint32_t chromaWidth() const { return (width + 1) / 2; }
  uint32_t chromaHeight() const { return (height + 1) / 2; }
  uint8_t* plane(int index);
  const uint8_t* plane(int index) const { return const_cast<Picture*>(this)->plane(index); }
  std::span<const uint8_t> luma() const { return std::span(bytes).first(size_t{width} * height); }
  bool operator==(const Picture&) const = default;
};

// Picture `number` of a scene with texture that moves; the same for the same arguments.
Picture scene(uint32_t width, uint32_t height, uint32_t number);

// As an encoder's client sends it; of an even size.
std::vector<uint8_t> packInput(const Picture& picture, omxhost::PictureLayout layout);

// The visible picture in a decoder's output.
Picture unpackOutput(const std::vector<uint8_t>& bytes, omxhost::PictureLayout layout, uint32_t frameWidth,
                     uint32_t frameHeight, const OMX_CONFIG_RECTTYPE& crop);

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
