// Raw pictures as the tool handles them: I420, even sizes, tightly packed.
#pragma once

#include <stddef.h>
#include <stdint.h>

#include <span>
#include <string>
#include <vector>

#include "tools/base/units.h"

namespace tool {

// Bytes of an I420 picture.
inline size_t pictureBytes(Size size) {
  return static_cast<size_t>(size.width) * static_cast<size_t>(size.height) * 3 / 2;
}

inline bool isEven(Size size) {
  return size.width % 2 == 0 && size.height % 2 == 0;
}

// A Y plane, a U and a V plane, one behind the other.
struct Picture {
  Size size;
  std::vector<uint8_t> bytes;

  void resize(Size wanted) {
    size = wanted;
    bytes.resize(pictureBytes(wanted));
  }
  size_t lumaBytes() const { return bytes.size() / 3 * 2; }
  std::span<const uint8_t> luma() const { return std::span(bytes).first(lumaBytes()); }
};

// What does not change from picture to picture, besides the size.
struct VideoTraits {
  FrameRate rate;
  // As Y4M puts them: where chroma samples lie, and the shape of a pixel ("0:0" unknown).
  std::string chroma = "420mpeg2";
  std::string pixelAspect = "0:0";
  std::string layout = "i420";  // of raw files, see findLayout()
};

}  // namespace tool
