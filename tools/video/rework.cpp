#include "tools/video/rework.h"

#include <algorithm>

#include "omxbridge/frames.h"

namespace tool {

namespace {

struct Sides {
  explicit Sides(Size size)
      : width(static_cast<unsigned int>(size.width)), height(static_cast<unsigned int>(size.height)) {}
  unsigned int width;
  unsigned int height;
};

}  // namespace

const Picture& turned(const Picture& picture, int degrees, Picture& scratch) {
  if (degrees == 0) return picture;
  const Sides from(picture.size);
  scratch.resize(degrees == 180 ? picture.size : Size{picture.size.height, picture.size.width});
  const Sides to(scratch.size);
  const uint8_t* const source = picture.bytes.data();
  uint8_t* const target = scratch.bytes.data();
  if (degrees == 180) {
    webrtc::ConvertToI420AndMirrorUpDown(source, target, from.width, from.height, webrtc::kI420);
  } else if (degrees == 90) {
    webrtc::ConvertToI420AndRotateClockwise(source, from.width, from.height, target, to.width, to.height,
                                            webrtc::kI420);
  } else {
    webrtc::ConvertToI420AndRotateAntiClockwise(source, from.width, from.height, target, to.width, to.height,
                                                webrtc::kI420);
  }
  return scratch;
}

void scale(const Picture& from, Size size, Picture& to) {
  to.resize(size);
  const Sides source(from.size);
  const Sides target(size);
  // Large enough, so the function keeps to it.
  unsigned char* destination = to.bytes.data();
  auto capacity = static_cast<unsigned int>(to.bytes.size());
  webrtc::ScaleBilinear(from.bytes.data(), destination, source.width, source.height, target.width,
                        target.height, capacity);
}

void pad(const Picture& from, Size size, Picture& to) {
  to.resize(size);
  const Sides source(from.size);
  const Sides target(size);
  if (from.size == size) {
    to.bytes = from.bytes;
    return;
  }
  webrtc::PadI420Frame(from.bytes.data(), to.bytes.data(), source.width, source.height, target.width,
                       target.height);
}

void cut(const Picture& from, Size size, Picture& to) {
  to.resize(size);
  const Sides source(from.size);
  const Sides target(size);
  webrtc::ConvertI420ToI420(from.bytes.data(), source.width, source.height, to.bytes.data(), target.width,
                            target.height);
}

void fit(const Picture& from, Size size, Picture& to) {
  const double ratio = std::min(static_cast<double>(size.width) / from.size.width,
                                static_cast<double>(size.height) / from.size.height);
  const auto side = [ratio](int length) { return std::max(2, static_cast<int>(length * ratio) / 2 * 2); };
  Picture scaled;
  scale(from, {side(from.size.width), side(from.size.height)}, scaled);
  pad(scaled, size, to);
}

}  // namespace tool
