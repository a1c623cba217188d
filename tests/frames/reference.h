// What the frame functions mean, stated sample by sample and sharing nothing with them. Every access is
// checked: a statement that leaves a frame fails the test with an exception.
#pragma once

#include <cstdint>
#include <functional>
#include <vector>

namespace reference {

class Bytes {
 public:
  Bytes() = default;
  explicit Bytes(std::size_t size) : _bytes(size) {}
  std::uint8_t& operator[](std::size_t i) { return _bytes.at(i); }
  std::uint8_t operator[](std::size_t i) const { return _bytes.at(i); }
  std::size_t size() const { return _bytes.size(); }
  const std::uint8_t* data() const { return _bytes.data(); }
  std::uint8_t* data() { return _bytes.data(); }
  bool operator==(const Bytes&) const = default;

 private:
  std::vector<std::uint8_t> _bytes;
};

struct Size {
  unsigned width, height;
  std::size_t area() const { return std::size_t{width} * height; }
  std::size_t i420() const { return area() * 3 / 2; }
  Size half() const { return {width / 2, height / 2}; }
  Size even() const { return {width / 2 * 2, height / 2 * 2}; }
  bool operator==(const Size&) const = default;
};

// States what a function makes of `dst`, and returns what it does. The source is tightly packed; destination
// rows may be a stride of pixels apart.
using Conversion =
    std::function<std::size_t(const Bytes& src, Bytes& dst, Size from, Size to, unsigned stride)>;

enum class Chroma { kUThenV, kVThenU, kUvPairs, kVuPairs };

// Where the third plane begins: three ways of counting the second.
inline std::size_t vByArea(Size s) {
  return s.area() + s.area() / 4;
}
inline std::size_t vByRows(Size s) {
  return std::size_t{s.width} * (s.height + s.height / 4);
}
inline std::size_t vBySamples(Size s) {
  return s.area() + s.half().area();
}

// Calls sample(x, y) row by row.
template <typename Sample>
void forEach(Size s, Sample sample) {
  for (std::size_t y = 0; y < s.height; ++y) {
    for (std::size_t x = 0; x < s.width; ++x) sample(x, y);
  }
}

inline void fill(Bytes& dst, std::size_t from, std::size_t n, std::uint8_t value) {
  for (std::size_t i = 0; i < n; ++i) dst[from + i] = value;
}

// A plane of `frame` samples at `to`, all `fill` but for the picture, whose rows lie `pitch` bytes apart.
inline void place(const Bytes& src, std::size_t from, std::size_t pitch, Size picture, Bytes& dst,
                  std::size_t to, Size frame, std::size_t left, std::size_t top, std::uint8_t fill) {
  forEach(frame, [&](std::size_t x, std::size_t y) {
    const bool inside = y >= top && y - top < picture.height && x >= left && x - left < picture.width;
    dst[to + y * frame.width + x] = inside ? src[from + (y - top) * pitch + x - left] : fill;
  });
}

// Centring along one axis: half of what is too much is skipped, half of what is missing is margin.
struct Axis {
  Axis(unsigned from, unsigned to)
      : count(from < to ? from : to), skip((from - count) / 2), margin((to - count) / 2) {}
  unsigned count;
  std::size_t skip, margin;
};

}  // namespace reference
