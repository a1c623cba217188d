// What the frame functions mean, stated sample by sample and sharing nothing with them. Every access is
// checked: a statement that leaves a frame fails the test with an exception.
#pragma once

#include <cstdint>
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
};

inline std::size_t i420Bytes(Size s) {
  return s.area() * 3 / 2;
}

// Centring along one axis: half of what is too much is skipped, half of what is missing is margin.
struct Axis {
  Axis(unsigned from, unsigned to)
      : count(from < to ? from : to), skip((from - count) / 2), margin((to - count) / 2) {}
  std::size_t count, skip, margin;
};

}  // namespace reference
