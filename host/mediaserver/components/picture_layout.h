// How raw pictures lie in the components' buffers, and moving them there and from there. Pictures are 4:2:0
// with eight bits a sample. Pure functions on memory that the caller owns.
#pragma once

#include <cstddef>
#include <cstdint>
#include <optional>
#include <vector>

#include <OMX_IVCommon.h>
#include <omxhost/device.h>

namespace mediaserver {

using omxhost::PictureLayout;

// The colour format by which clients know a layout.
OMX_COLOR_FORMATTYPE colourFormat(PictureLayout layout);

// Three planes as a decoder has them. Chroma planes have half the width and height, rounded up.
struct PlanarView {
  const uint8_t* planes[3];
  ptrdiff_t pitches[3];  // bytes
  uint32_t width;
  uint32_t height;
};

// A luma plane and one of alternating Cb and Cr, both with the same pitch. Width and height are even.
struct SemiPlanarView {
  const uint8_t* luma;
  const uint8_t* chroma;
  size_t pitch;  // bytes
  uint32_t width;
  uint32_t height;
};

// A decoder's output buffer for pictures of one size.
struct OutputGeometry {
  PictureLayout layout;
  uint32_t visibleWidth;  // even: the last column or row of odd pictures is repeated
  uint32_t visibleHeight;
  uint32_t left;  // where the visible picture begins
  uint32_t top;
  uint32_t frameWidth;  // as the port announces it
  uint32_t frameHeight;
  uint32_t pitch;
  uint32_t bytes;

  bool operator==(const OutputGeometry&) const = default;
};
OutputGeometry outputGeometry(PictureLayout layout, uint32_t width, uint32_t height);
// `picture` has the size that `geometry` was made for, `out` as many bytes as it says. What is not visible
// stays as it is.
void writePicture(const OutputGeometry& geometry, const PlanarView& picture, uint8_t* out);

// An encoder's input buffer for pictures of one size.
struct InputGeometry {
  PictureLayout layout;
  uint32_t width;  // even, and so is the height
  uint32_t height;
  uint32_t pitch;
  uint32_t sliceHeight;  // rows from the beginning of luma to that of chroma
};
// `pitch` and `sliceHeight` as a client wishes; layouts that have no choice, and wishes that are too small,
// get what is usual.
InputGeometry inputGeometry(PictureLayout layout, uint32_t width, uint32_t height, int32_t pitch,
                            uint32_t sliceHeight);
uint32_t inputBytes(const InputGeometry& geometry);
// The picture in a filled buffer. Nothing when the bytes are too few for one.
std::optional<SemiPlanarView> viewInput(const InputGeometry& geometry, const uint8_t* data, size_t length);

// The picture turned clockwise by 0, 90, 180 or 270 degrees. `memory` keeps it, unless it is the same.
SemiPlanarView rotate(const SemiPlanarView& picture, unsigned degrees, std::vector<uint8_t>* memory);

}  // namespace mediaserver
