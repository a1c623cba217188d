#include <algorithm>
#include <cstring>
#include <functional>
#include <memory>
#include <vector>

#include "frames/geometry.h"
#include "frames/kernels/scale.h"
#include "omxbridge/frames/scale.h"

namespace webrtc {
namespace {

using namespace detail;

constexpr unsigned kMaxSize = 65535;  // positions have 16 bits of fraction in 32
constexpr std::uint32_t kOne = 0x10000;
constexpr std::uint8_t kNoChroma = 128;

using Bytes = std::vector<std::uint8_t>;

std::size_t roundUp(std::size_t n, std::size_t unit) {
  return (n + unit - 1) / unit * unit;
}

struct Plane {
  const std::uint8_t* rows;
  std::size_t width, height;   // rows are width bytes apart
  const std::uint8_t* behind;  // the row that counts as the one after the last

  const std::uint8_t* row(std::size_t r) const { return r < height ? rows + r * width : behind; }
};

// The planes of a source frame as the scaler sees them. The arithmetic takes the row after for whole
// positions and so, at the bottom of a plane, what lies behind it in memory. That is the next plane's
// beginning, seen through the row pitch of the frame: packed for widths that are multiples of 32, otherwise
// rounded up as in the padded copies that such frames were scaled from.
class Source {
 public:
  Source(const std::uint8_t* frame, unsigned width, unsigned height)
      : _frame(frame),
        _width(width),
        _height(height),
        _chromaWidth((std::size_t{width} + 1) / 2),
        _chromaHeight(height / 2),
        _packed(width % 32 == 0) {
    const std::size_t area = planeArea(width, height), bytes = area + area / 2;
    _u = frame + area;
    _v = _u + _chromaWidth * _chromaHeight;
    const std::size_t end = area + 2 * _chromaWidth * _chromaHeight;
    if (end > bytes) {
      // Chroma rows of an odd width are taken for longer than they are: the end of V lies behind the frame.
      const std::size_t present = bytes - static_cast<std::size_t>(_v - frame);
      _vCopy.assign(_chromaWidth * _chromaHeight, frame[bytes - 1]);
      std::copy_n(_v, present, _vCopy.begin());
      _v = _vCopy.data();
    }
    joinRowBehindLuma(bytes);
  }
  Source(const Source&) = delete;
  Source& operator=(const Source&) = delete;

  bool hasChroma() const { return _chromaHeight != 0; }
  Plane luma() const { return {_frame, _width, _height, _behindLuma.data()}; }
  Plane u() const { return {_u, _chromaWidth, _chromaHeight, _v}; }
  Plane v() const {
    // Behind V the frame ends, unless an odd height leaves half a row there.
    const std::uint8_t* end = _v + _chromaWidth * _chromaHeight;
    return {_v, _chromaWidth, _chromaHeight, _packed && _height % 2 != 0 ? end : end - _chromaWidth};
  }

 private:
  void joinRowBehindLuma(std::size_t frameBytes) {
    const std::uint8_t* last = _frame + _width * (_height - 1);
    _behindLuma.assign(last, last + _width);
    if (_packed) {
      const std::size_t present = std::min(_width, frameBytes - _width * _height);
      std::copy_n(_u, present, _behindLuma.begin());
    } else if (hasChroma()) {
      const std::size_t pitch = roundUp(roundUp(_width, 16) / 2, 16);
      const std::uint8_t* second = _chromaHeight > 1 ? _u + _chromaWidth : _v;
      for (std::size_t x = 0; x < _width; ++x) {
        const std::uint8_t* row = x < pitch ? _u : second;
        _behindLuma[x] = row[std::min(x % pitch, _chromaWidth - 1)];
      }
    }
  }

  const std::uint8_t* _frame;
  std::size_t _width, _height, _chromaWidth, _chromaHeight;
  bool _packed;
  const std::uint8_t *_u, *_v;
  Bytes _vCopy, _behindLuma;
};

// Scales one plane after another; the rows in between are kept.
class PlaneScaler {
 public:
  // The destination's rows are width bytes apart. A plane without a sample is left out.
  void scale(const Plane& src, std::uint8_t* dst, std::size_t width, std::size_t height) {
    if (width == 0 || height == 0) return;
    const std::uint32_t yStep = step(src.height, height);
    const bool resize = width != src.width;
    if (resize) planColumns(src.width, width);
    const std::uint32_t half = yStep > 0x1FFFF ? kOne / 2 : 0;
    for (std::uint32_t j = 0; j < height; ++j, dst += width) {
      const std::uint32_t y = j * yStep + half;
      std::uint8_t* blended = resize ? _row.data() : dst;
      blendRows(src, y, yStep, blended);
      if (resize) {
        blended[src.width] = blended[src.width - 1];
        _resample(blended, {_window.data(), _pick.data(), _weight.data()}, dst, width);
      } else if (width > 1) {
        // Kept: part of the arithmetic that applications compare with.
        dst[width - 1] = dst[width - 2];
      }
    }
  }

 private:
  static std::uint32_t step(std::size_t from, std::size_t to) {
    return static_cast<std::uint32_t>(from * std::size_t{kOne} / to);
  }

  static void blendRows(const Plane& src, std::uint32_t y, std::uint32_t yStep, std::uint8_t* to) {
    const std::size_t r = y / kOne;
    const unsigned fraction = y / 256 % 256;
    if (fraction == 0 || yStep == kOne || r + 1 >= src.height) {
      // Kept: the row after, also for positions that fall on a row.
      std::memcpy(to, src.row(r + 1), src.width);
    } else {
      scaleKernels().blend(src.row(r), src.row(r + 1), fraction, to, src.width);
    }
  }

  void planColumns(std::size_t from, std::size_t to) {
    const std::uint32_t xStep = step(from, to);
    const bool near = xStep <= 2 * kOne;  // eight columns then span no more than a window
    _row.assign(from + kWindow, 0);
    _window.resize(to);
    _pick.resize(to);
    _weight.resize(to);
    for (std::uint32_t i = 0; i < to; ++i) {
      const std::uint32_t x = i * xStep, fraction = x % kOne;
      const std::uint32_t window = (near ? i / 8 * 8 * xStep : x) / kOne;
      const std::uint32_t left = x / kOne - window, right = left + 1;
      const bool leftIsCloser = fraction < kOne / 2;
      _window[i] = static_cast<std::uint16_t>(window);
      _pick[i] = static_cast<std::uint16_t>(leftIsCloser ? left | right << 8 : right | left << 8);
      _weight[i] = static_cast<std::uint16_t>(leftIsCloser ? fraction : kOne - 1 - fraction);
    }
    const ScaleKernels& kernels = scaleKernels();
    _resample = from == 2 * to   ? kernels.resampleToHalf
                : to == 2 * from ? kernels.resampleToTwice
                : near           ? kernels.resampleNear
                                 : kernels.resampleFar;
  }

  Bytes _row;
  std::vector<std::uint16_t> _window, _pick, _weight;
  ResampleRow _resample = nullptr;
};

void scaleFrame(const Source& source, std::uint8_t* dst, unsigned width, unsigned height) {
  PlaneScaler scaler;
  scaler.scale(source.luma(), dst, width, height);
  std::uint8_t *u = dst + planeArea(width, height), *v = dst + thirdPlaneBySamples(width, height);
  if (source.hasChroma()) {
    scaler.scale(source.u(), u, width / 2, height / 2);
    scaler.scale(source.v(), v, width / 2, height / 2);
  } else {
    std::memset(u, kNoChroma, 2 * planeArea(width / 2, height / 2));
  }
}

bool overlap(const std::uint8_t* a, std::size_t aBytes, const std::uint8_t* b, std::size_t bBytes) {
  const std::less<const std::uint8_t*> before;
  return before(a, b + bBytes) && before(b, a + aBytes);
}

}  // namespace

int ScaleBilinear(const unsigned char* source, unsigned char*& destination, unsigned int srcWidth,
                  unsigned int srcHeight, unsigned int dstWidth, unsigned int dstHeight,
                  unsigned int& destinationSize) {
  for (const unsigned size : {srcWidth, srcHeight, dstWidth, dstHeight}) {
    if (size == 0 || size > kMaxSize) return kRefused;
  }
  const int bytes = i420Bytes(dstWidth, dstHeight);
  if (source == nullptr || bytes == kRefused) return kRefused;
  const auto output = static_cast<std::size_t>(bytes);
  const std::size_t planes =
      thirdPlaneBySamples(dstWidth, dstHeight) + planeArea(dstWidth / 2, dstHeight / 2);
  const std::size_t input = planeArea(srcWidth, srcHeight) + planeArea(srcWidth, srcHeight) / 2;
  const Source planesOfSource(source, srcWidth, srcHeight);

  const bool reuse = destination != nullptr && destinationSize >= output;
  if (reuse && !overlap(source, input, destination, output)) {
    scaleFrame(planesOfSource, destination, dstWidth, dstHeight);
    return static_cast<int>(dstHeight);
  }
  // Also if the destination is the source: it is read to the end before anything happens to it.
  std::unique_ptr<std::uint8_t[]> scaled(new std::uint8_t[output]);
  scaleFrame(planesOfSource, scaled.get(), dstWidth, dstHeight);
  if (reuse) {
    std::memcpy(destination, scaled.get(), planes);
    return static_cast<int>(dstHeight);
  }
  std::memset(scaled.get() + planes, 0, output - planes);
  delete[] destination;
  destination = scaled.release();
  destinationSize = static_cast<unsigned>(output);
  return static_cast<int>(dstHeight);
}

}  // namespace webrtc
