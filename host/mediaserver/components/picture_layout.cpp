#include "host/mediaserver/components/picture_layout.h"

#include <algorithm>
#include <cstring>

#include "host/media/tile_order.h"
#include "host/mediaserver/components/vendor_records.h"

namespace mediaserver {

namespace {

namespace tiles = android::tiles;

constexpr uint32_t kChromaAlignment = 2048;
constexpr uint32_t kLargestPitch = 8192;

// Borders of TI's decoded pictures, in pixels on each side.
constexpr uint32_t kTiBorderX = 32;
constexpr uint32_t kTiBorderY = 24;

constexpr uint32_t roundUp(uint32_t value, uint32_t multiple) {
  return (value + multiple - 1) / multiple * multiple;
}

// Repeats the last of an odd number of samples.
void copyLuma(const uint8_t* from, uint32_t count, uint8_t* to) {
  std::memcpy(to, from, count);
  if (count % 2 != 0) to[count] = from[count - 1];
}

void interleave(const uint8_t* cb, const uint8_t* cr, size_t count, uint8_t* to) {
  for (size_t i = 0; i < count; ++i) {
    to[2 * i] = cb[i];
    to[2 * i + 1] = cr[i];
  }
}

const uint8_t* row(const PlanarView& picture, size_t plane, uint32_t y) {
  return picture.planes[plane] + static_cast<ptrdiff_t>(y) * picture.pitches[plane];
}

void writeSemiPlanar(const OutputGeometry& geometry, const PlanarView& picture, uint8_t* out) {
  const size_t pitch = geometry.pitch;
  uint8_t* luma = out + geometry.top * pitch + geometry.left;
  for (uint32_t y = 0; y < geometry.visibleHeight; ++y, luma += pitch) {
    copyLuma(row(picture, 0, std::min(y, picture.height - 1)), picture.width, luma);
  }
  uint8_t* chroma = out + geometry.frameHeight * pitch + geometry.top / 2 * pitch + geometry.left;
  for (uint32_t y = 0; y < geometry.visibleHeight / 2; ++y, chroma += pitch) {
    interleave(row(picture, 1, y), row(picture, 2, y), geometry.visibleWidth / 2, chroma);
  }
}

void writeTiled(const OutputGeometry& geometry, const PlanarView& picture, uint8_t* out) {
  const tiles::Planes planes(geometry.visibleWidth, geometry.visibleHeight);
  for (uint32_t y = 0; y < geometry.visibleHeight; ++y) {
    const uint8_t* const luma = row(picture, 0, std::min(y, picture.height - 1));
    for (uint32_t x = 0; x < picture.width; x += tiles::kWidth) {
      const auto count = std::min<uint32_t>(tiles::kWidth, picture.width - x);
      copyLuma(luma + x, count, out + planes.luma(x, y));
    }
  }
  for (uint32_t y = 0; y < geometry.visibleHeight / 2; ++y) {
    const uint8_t* const cb = row(picture, 1, y);
    const uint8_t* const cr = row(picture, 2, y);
    for (uint32_t x = 0; x < geometry.visibleWidth; x += tiles::kWidth) {
      const auto count = std::min<uint32_t>(tiles::kWidth, geometry.visibleWidth - x) / 2;
      interleave(cb + x / 2, cr + x / 2, count, out + planes.chroma(x, y));
    }
  }
}

// One plane, whose samples (or pairs of them) are Units, turned about. Rows come out without gaps.
template <typename Unit>
void rotatePlane(const uint8_t* from, size_t pitch, uint32_t width, uint32_t height, unsigned degrees,
                 uint8_t* to) {
  const bool swapped = degrees % 180 != 0;
  const uint32_t columns = swapped ? height : width;
  const uint32_t rows = swapped ? width : height;
  for (uint32_t y = 0; y < rows; ++y) {
    for (uint32_t x = 0; x < columns; ++x, to += sizeof(Unit)) {
      const uint32_t fromX = degrees == 90 ? y : degrees == 180 ? width - 1 - x : width - 1 - y;
      const uint32_t fromY = degrees == 90 ? height - 1 - x : degrees == 180 ? height - 1 - y : x;
      std::memcpy(to, from + fromY * pitch + fromX * sizeof(Unit), sizeof(Unit));
    }
  }
}

}  // namespace

OMX_COLOR_FORMATTYPE colourFormat(PictureLayout layout) {
  switch (layout) {
    case PictureLayout::Tiled:
      return kTiledFormat;
    case PictureLayout::TiPacked:
    case PictureLayout::TiPadded:
      return OMX_TI_COLOR_FormatYUV420PackedSemiPlanar;
    case PictureLayout::SemiPlanar:
    case PictureLayout::SemiPlanarAligned:
      break;
  }
  return OMX_COLOR_FormatYUV420SemiPlanar;
}

OutputGeometry outputGeometry(PictureLayout layout, uint32_t width, uint32_t height) {
  OutputGeometry geometry{};
  geometry.layout = layout;
  geometry.visibleWidth = geometry.frameWidth = roundUp(width, 2);
  geometry.visibleHeight = geometry.frameHeight = roundUp(height, 2);
  geometry.pitch = geometry.frameWidth;
  if (layout == PictureLayout::Tiled) {
    const tiles::Planes planes(geometry.visibleWidth, geometry.visibleHeight);
    geometry.pitch = static_cast<uint32_t>(planes.tilesPerRow * tiles::kWidth);
    const size_t chroma = planes.tilesPerRow * planes.chromaRows * tiles::kBytes;
    geometry.bytes = static_cast<uint32_t>(planes.chromaStart + tiles::roundUp(chroma, 4 * tiles::kBytes));
    return geometry;
  }
  if (layout == PictureLayout::TiPadded) {
    geometry.left = kTiBorderX;
    geometry.top = kTiBorderY;
    geometry.frameWidth = geometry.pitch = roundUp(geometry.visibleWidth + 2 * kTiBorderX, 128);
    geometry.frameHeight = roundUp(geometry.visibleHeight, 16) + 4 * kTiBorderY;
  }
  geometry.bytes = geometry.pitch * geometry.frameHeight * 3 / 2;
  return geometry;
}

void writePicture(const OutputGeometry& geometry, const PlanarView& picture, uint8_t* out) {
  if (geometry.layout == PictureLayout::Tiled) {
    writeTiled(geometry, picture, out);
  } else {
    writeSemiPlanar(geometry, picture, out);
  }
}

InputGeometry inputGeometry(PictureLayout layout, uint32_t width, uint32_t height, int32_t pitch,
                            uint32_t sliceHeight) {
  InputGeometry geometry{layout, width, height, width, height};
  if (layout != PictureLayout::TiPacked) return geometry;
  const auto wanted = static_cast<uint32_t>(std::max(pitch, 0));
  geometry.pitch = wanted >= width && wanted <= kLargestPitch ? wanted : roundUp(width, 16);
  if (sliceHeight > height && sliceHeight <= kLargestPitch) geometry.sliceHeight = sliceHeight;
  return geometry;
}

uint32_t inputBytes(const InputGeometry& geometry) {
  if (geometry.layout == PictureLayout::SemiPlanarAligned) {
    return roundUp(geometry.width * geometry.height, kChromaAlignment) + geometry.width * geometry.height / 2;
  }
  return geometry.pitch * geometry.sliceHeight + geometry.pitch * geometry.height / 2;
}

std::optional<SemiPlanarView> viewInput(const InputGeometry& geometry, const uint8_t* data, size_t length) {
  SemiPlanarView view{data, nullptr, geometry.pitch, geometry.width, geometry.height};
  const uint32_t luma = geometry.width * geometry.height;
  if (length >= inputBytes(geometry)) {
    const bool aligned = geometry.layout == PictureLayout::SemiPlanarAligned;
    const uint32_t above = aligned ? roundUp(luma, kChromaAlignment) : geometry.pitch * geometry.sliceHeight;
    view.chroma = data + above;
  } else if (geometry.layout == PictureLayout::TiPacked && length >= size_t{luma} / 2 * 3) {
    // Kept: a client that agrees on a pitch rounded up to 16 may still send its rows without gaps, width
    // times height times one and a half bytes in all. Only the length tells the two apart.
    view.pitch = geometry.width;
    view.chroma = data + luma;
  } else {
    return std::nullopt;
  }
  return view;
}

SemiPlanarView rotate(const SemiPlanarView& picture, unsigned degrees, std::vector<uint8_t>* memory) {
  if (degrees == 0) return picture;
  const size_t luma = size_t{picture.width} * picture.height;
  memory->resize(luma / 2 * 3);
  rotatePlane<uint8_t>(picture.luma, picture.pitch, picture.width, picture.height, degrees, memory->data());
  rotatePlane<uint16_t>(picture.chroma, picture.pitch, picture.width / 2, picture.height / 2, degrees,
                        memory->data() + luma);
  const bool swapped = degrees % 180 != 0;
  const uint32_t width = swapped ? picture.height : picture.width;
  const uint32_t height = swapped ? picture.width : picture.height;
  return {memory->data(), memory->data() + luma, width, width, height};
}

}  // namespace mediaserver
