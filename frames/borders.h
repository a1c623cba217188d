// Centring a picture in a plane of another size: what is cropped, and the borders around what is smaller.
// Internal to frames/; any thread.
#pragma once

#include <algorithm>
#include <cstddef>
#include <cstdint>
#include <cstring>

namespace webrtc::detail {

// One axis: of the source, count samples from skip on; in the destination from margin on.
struct CentredAxis {
  unsigned skip, margin, count;

  // Chroma of the axis: half of every quantity, but never more samples than both planes have.
  CentredAxis chroma(unsigned src, unsigned dst) const {
    return {skip / 2, margin / 2, std::min(src / 2, dst / 2)};
  }
};

inline CentredAxis centre(unsigned src, unsigned dst) {
  return src > dst ? CentredAxis{(src - dst) / 2, 0, dst} : CentredAxis{0, (dst - src) / 2, src};
}

// A plane with a picture in it and a fill value around it. Nothing is written before a call says so.
struct BorderedPlane {
  std::uint8_t* data;
  std::size_t width, height;  // of the plane; rows are width bytes apart
  std::size_t left, top;      // of the picture
  std::size_t columns, rows;  // of the picture
  std::uint8_t fill;

  std::uint8_t* row(std::size_t pictureRow) const { return data + (top + pictureRow) * width + left; }
  std::size_t bytes() const { return width * height; }

  void fillAboveAndBelow() const {
    std::memset(data, fill, top * width);
    std::memset(data + (top + rows) * width, fill, (height - top - rows) * width);
  }
  void fillLeft(std::size_t pictureRow) const { std::memset(row(pictureRow) - left, fill, left); }
  void fillRight(std::size_t pictureRow) const {
    std::memset(row(pictureRow) + columns, fill, width - left - columns);
  }
  void fillBeside(std::size_t pictureRow) const {
    fillLeft(pictureRow);
    fillRight(pictureRow);
  }

  // The picture from src, rows pitch bytes apart, and everything around it.
  void place(const std::uint8_t* src, std::size_t pitch) const {
    fillAboveAndBelow();
    for (std::size_t r = 0; r < rows; ++r) {
      fillBeside(r);
      std::memcpy(row(r), src + r * pitch, columns);
    }
  }
};

}  // namespace webrtc::detail
