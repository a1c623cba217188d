#pragma once
// Pictures for the components' tests: a moving scene, and the layouts in which components take and give them,
// stated independently of the components' own code. Plain values and pure functions.

#include <cstdint>
#include <span>
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

// As an encoder's client sends it. `pitch` counts for the TI layout alone.
std::vector<uint8_t> packInput(const Picture& picture, omxhost::PictureLayout layout, uint32_t pitch = 0);

// The visible picture in a decoder's output.
Picture unpackOutput(const std::vector<uint8_t>& bytes, omxhost::PictureLayout layout, uint32_t frameWidth,
                     uint32_t frameHeight, const OMX_CONFIG_RECTTYPE& crop);

}  // namespace componenttest
