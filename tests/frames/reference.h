// What the frame functions mean, stated sample by sample and sharing nothing with them. Every access is
// checked: a statement that leaves a frame fails the test with an exception.
#pragma once

#include <array>
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

// --- RGB ---
struct Sums {
  int r, g, b;  // before clamping
};
Sums sumsOf(int y, int u, int v);

using Pixel = void (*)(const Sums& sums, std::uint8_t* to);
void pixelBgr(const Sums& sums, std::uint8_t* to);
void pixelBgra(const Sums& sums, std::uint8_t* to);
void pixelArgb(const Sums& sums, std::uint8_t* to);
void pixelRgba(const Sums& sums, std::uint8_t* to);
void pixel565(const Sums& sums, std::uint8_t* to);
void pixel4444(const Sums& sums, std::uint8_t* to);
void pixel1555(const Sums& sums, std::uint8_t* to);

enum class Rows { kTopDown, kBottomUp, kHalfStride };
struct RgbLayout {
  Pixel pixel;
  unsigned bytes;
  Rows rows;
  bool strideMovesRows = true, exchangedChroma = false, semiPlanar = false;
};
void toRgb(const RgbLayout& layout, const Bytes& src, Bytes& dst, Size s, unsigned stride);
void rgb24ToArgb(const Bytes& src, Bytes& dst, Size s, unsigned stride);

enum class Rgb { k24, kMac, k565 };
unsigned bytesOf(Rgb layout);
void fromRgb(Rgb layout, const Bytes& src, Bytes& dst, Size s);
void fromRgbCentred(const Bytes& src, Size from, Bytes& dst, Size to);

// --- YUV ---
void i420ToYv12(const Bytes& src, Bytes& dst, Size s, unsigned stride);
void i420ToI420(const Bytes& src, Bytes& dst, Size s, unsigned stride);
void i420Centred(const Bytes& src, Size from, Bytes& dst, Size to);
void interleave(bool vFirst, const Bytes& src, Bytes& dst, Size s);
void split(bool vFirst, const Bytes& src, Bytes& dst, Size s);
void cropNv12(const Bytes& src, unsigned stride, unsigned height, std::array<unsigned, 4> ltrb, Bytes& dst);
struct Order {
  unsigned luma, chroma;  // of each pair of bytes
};
inline constexpr Order kYuy2{0, 1}, kUyvy{1, 0};
void pack(Order order, const Bytes& src, Bytes& dst, Size s, unsigned stride);
void unpack(Order order, bool average, const Bytes& src, Bytes& dst, Size s);
void unpackCentred(Order order, bool interlaced, const Bytes& src, Size from, Bytes& dst, Size to);

// --- Rotation ---
enum class Turn { kClockwise, kAntiClockwise, kHalf, kUpDown, kLeftRight };
enum class Chroma { kUThenV, kVThenU, kUvPairs, kVuPairs };
void turn(Turn turn, Chroma chroma, const Bytes& src, Bytes& dst, Size s);

// --- Scaling ---
void upHalf(Bytes& buffer, Size s);
void downHalf(Bytes& buffer, Size s);
void quarter(Bytes& buffer, Size s);
Bytes third(const Bytes& src, Size s, Size& out);
Bytes enlarge(unsigned group, const Bytes& src, Size s);
// -1 where a value depends on bytes that nobody has written.
std::vector<int> bilinear(const Bytes& src, Size from, Size to);

// --- Padding ---
void padPlane(const Bytes& src, std::size_t from, Size s, unsigned padW, unsigned left, unsigned padH,
              unsigned top, std::uint8_t fill, Bytes& dst, std::size_t& to);
void pad(const Bytes& src, Size from, Bytes& dst, Size to);
void cut(Bytes& frame, Size from, Size to);

}  // namespace reference
