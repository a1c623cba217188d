// The frame functions with any sizes, strides and flags, on buffers that end exactly where the headers say:
// the sanitizers see every byte too far. What is refused must leave the destination alone.
#include "omxbridge/frames.h"

#include <fuzzer/FuzzedDataProvider.h>

#include <algorithm>
#include <cstdint>
#include <cstdlib>
#include <memory>
#include <variant>
#include <vector>

namespace {

using Byte = unsigned char;

// Buffers above this are not made; a call that needs more than the library can do has to be refused.
constexpr uint64_t kLargestBuffer = 1U << 22;
// Results are at most 2147483647 bytes, and some count an odd row less than the frame has.
constexpr uint64_t kSurelyTooMuch = uint64_t{2} << 31;

void require(bool holds) {
  if (!holds) std::abort();
}

// Beyond all buffers, and yet a result of 0 where an odd row or column does not count.
bool isOneLongLine(unsigned width, unsigned height) {
  return std::min(width, height) == 1 && std::max(width, height) > kLargestBuffer / 8;
}

// `half` counts half bytes per pixel: 3 for 4:2:0.
uint64_t frameBytes(uint64_t width, uint64_t height, unsigned half) {
  return width * height * half / 2;
}

class Input {
 public:
  Input(const uint8_t* data, size_t size) : _data(data, size) {}

  FuzzedDataProvider& data() { return _data; }
  // Mostly a size at which pictures can be made, and now and then any number.
  unsigned size() {
    return _data.ConsumeIntegralInRange<unsigned>(0, 15) == 0
               ? _data.ConsumeIntegral<unsigned>()
               : _data.ConsumeIntegralInRange<unsigned>(0, 160);
  }
  unsigned stride(unsigned width) {
    switch (_data.ConsumeIntegralInRange<unsigned>(0, 3)) {
      case 0:
        return 0;
      case 1:
        return width;
      case 2:
        return width + _data.ConsumeIntegralInRange<unsigned>(0, 40);
      default:
        return size();
    }
  }
  Byte fill() { return _data.ConsumeIntegral<Byte>(); }

 private:
  FuzzedDataProvider _data;
};

// An array of its own for each buffer, so that the sanitizers know its end.
class Buffer {
 public:
  Buffer(uint64_t size, Byte first) : _size(size), _bytes(new Byte[size]) {
    for (uint64_t i = 0; i < size; ++i) _bytes[i] = static_cast<Byte>(first + i * 7);
  }
  Byte* get() { return _bytes.get(); }
  std::vector<Byte> copy() const { return {_bytes.get(), _bytes.get() + _size}; }

 private:
  uint64_t _size;
  std::unique_ptr<Byte[]> _bytes;
};

// Calls with buffers of these sizes; where the result is beyond all bounds with tiny ones, which is right
// only if the call is refused.
template <typename Call>
void run(Input& input, uint64_t srcBytes, uint64_t dstBytes, Call call) {
  const bool refused = dstBytes > kSurelyTooMuch;
  if (!refused && (srcBytes > kLargestBuffer || dstBytes > kLargestBuffer)) return;
  Buffer src(refused ? 1 : srcBytes, input.fill());
  Buffer dst(refused ? 1 : dstBytes, input.fill());
  const std::vector<Byte> before = dst.copy();
  const int result = call(src.get(), dst.get());
  require(result >= -1 && (!refused || result <= 0));  // 0: some take a width of 0
  if (result == -1) require(dst.copy() == before);
}

// --- One size ---------------------------------------------------------------------------------------------

using SrcDst = int (*)(const Byte*, Byte*, unsigned, unsigned);
using SrcDstStride = int (*)(const Byte*, Byte*, unsigned, unsigned, unsigned);
using SizeSrcDst = int (*)(unsigned, unsigned, const Byte*, Byte*);
using SrcSizeDst = int (*)(const Byte*, unsigned, unsigned, Byte*);

struct OneSize {
  std::variant<SrcDst, SrcDstStride, SizeSrcDst, SrcSizeDst> function;
  unsigned srcHalf;  // half bytes per pixel
  unsigned dstHalf;
};

const OneSize kOneSize[] = {
    {webrtc::ConvertI420ToRGB24, 3, 6},
    {webrtc::ConvertI420ToRGB24_EX, 3, 6},
    {webrtc::ConvertI420ToARGB, 3, 8},
    {webrtc::ConvertI420ToARGBMac, 3, 8},
    {webrtc::ConvertI420ToRGBAMac, 3, 8},
    {webrtc::ConvertI420ToRGBAIPhone, 3, 8},
    {webrtc::ConvertI420ToARGB4444, 3, 4},
    {webrtc::ConvertI420ToARGB4444_EX, 3, 4},
    {webrtc::ConvertI420ToRGB565, 3, 4},
    {webrtc::ConvertI420ToRGB565_EX, 3, 4},
    {webrtc::ConvertI420ToRGB565Android, 3, 4},
    {webrtc::ConvertI420ToARGB1555, 3, 4},
    {webrtc::ConvertI420ToARGB1555_EX, 3, 4},
    {webrtc::ConvertNV12ToRGB565, 3, 4},
    {webrtc::ConvertRGB24ToARGB, 6, 8},
    {webrtc::ConvertYV12ToI420, 3, 3},
    {webrtc::ConvertI420ToYV12, 3, 3},
    {SrcDstStride{webrtc::ConvertI420ToI420}, 3, 3},
    {webrtc::ConvertI420ToNV12, 3, 3},
    {webrtc::ConvertI420ToNV21, 3, 3},
    {webrtc::ConvertNV12ToI420, 3, 3},
    {webrtc::ConvertNV21ToI420, 3, 3},
    {webrtc::ConvertI420ToYUY2, 3, 4},
    {webrtc::ConvertI420ToUYVY, 3, 4},
    {SizeSrcDst{webrtc::ConvertYUY2ToI420}, 4, 3},
    {SizeSrcDst{webrtc::ConvertUYVYToI420}, 4, 3},
    {SizeSrcDst{webrtc::ConvertRGB24ToI420}, 6, 3},
    {webrtc::ConvertARGBMacToI420, 8, 3},
    {webrtc::ConvertRGB565ToI420, 4, 3},
    {webrtc::ConvertNV12ToI420AndRotateClockwise, 3, 3},
    {webrtc::ConvertNV12ToI420AndRotateAntiClockwise, 3, 3},
    {webrtc::ConvertNV12ToI420AndRotate180, 3, 3},
    {webrtc::ConvertNV21ToI420AndRotateClockwise, 3, 3},
    {webrtc::ConvertNV21ToI420AndRotateAntiClockwise, 3, 3},
    {webrtc::ConvertNV21ToI420AndRotate180, 3, 3},
    {webrtc::MirrorI420UpDown, 3, 3},
    {webrtc::MirrorI420LeftRight, 3, 3},
};

void oneSize(Input& input) {
  const OneSize& chosen = input.data().PickValueInArray(kOneSize);
  const unsigned width = input.size();
  const unsigned height = input.size();
  const bool hasStride = std::holds_alternative<SrcDstStride>(chosen.function);
  const unsigned stride = hasStride ? input.stride(width) : 0;
  if (isOneLongLine(std::max(stride, width), height)) return;
  run(input, frameBytes(width, height, chosen.srcHalf),
      frameBytes(std::max(stride, width), height, chosen.dstHalf), [&](const Byte* src, Byte* dst) {
        if (const auto* plain = std::get_if<SrcDst>(&chosen.function))
          return (*plain)(src, dst, width, height);
        if (const auto* first = std::get_if<SizeSrcDst>(&chosen.function))
          return (*first)(width, height, src, dst);
        if (const auto* middle = std::get_if<SrcSizeDst>(&chosen.function))
          return (*middle)(src, width, height, dst);
        return std::get<SrcDstStride>(chosen.function)(src, dst, width, height, stride);
      });
}

// --- Two sizes --------------------------------------------------------------------------------------------

using Centred = int (*)(const Byte*, unsigned, unsigned, Byte*, unsigned, unsigned);
struct TwoSizes {
  Centred function;
  unsigned srcHalf;
};
const TwoSizes kTwoSizes[] = {
    {webrtc::ConvertI420ToI420, 3},
    {webrtc::ConvertYUY2ToI420, 4},
    {webrtc::ConvertUYVYToI420, 4},
    {webrtc::ConvertYUY2ToI420interlaced, 4},
    {webrtc::ConvertUYVYToI420interlaced, 4},
    {webrtc::ConvertRGB24ToI420, 6},
    {[](const Byte* src, unsigned srcWidth, unsigned srcHeight, Byte* dst, unsigned dstWidth,
        unsigned dstHeight) {
       return webrtc::PadI420Frame(src, dst, srcWidth, srcHeight, dstWidth, dstHeight);
     },
     3},
};

void twoSizes(Input& input) {
  const TwoSizes& chosen = input.data().PickValueInArray(kTwoSizes);
  const unsigned width = input.size();
  const unsigned height = input.size();
  const unsigned dstWidth = input.size();
  const unsigned dstHeight = input.size();
  if (isOneLongLine(dstWidth, dstHeight)) return;
  run(input, frameBytes(width, height, chosen.srcHalf), frameBytes(dstWidth, dstHeight, 3),
      [&](const Byte* src, Byte* dst) {
        return chosen.function(src, width, height, dst, dstWidth, dstHeight);
      });
}

// --- The rest ---------------------------------------------------------------------------------------------

void turn(Input& input) {
  const unsigned width = input.size();
  const unsigned height = input.size();
  const bool fits = input.data().ConsumeIntegralInRange(0, 7) != 0;
  const unsigned dstWidth = fits ? height : input.size();
  const unsigned dstHeight = fits ? width : input.size();
  const auto type = static_cast<webrtc::VideoType>(input.data().ConsumeIntegralInRange(0, 15));
  const unsigned which = input.data().ConsumeIntegralInRange<unsigned>(0, 2);
  const uint64_t bytes = frameBytes(width, height, 3);
  run(input, bytes, bytes, [&](const Byte* src, Byte* dst) {
    if (which == 0) return webrtc::ConvertToI420AndMirrorUpDown(src, dst, width, height, type);
    const auto function =
        which == 1 ? webrtc::ConvertToI420AndRotateClockwise : webrtc::ConvertToI420AndRotateAntiClockwise;
    return function(src, width, height, dst, dstWidth, dstHeight, type);
  });
}

unsigned halfBytes(uint32_t type) {
  switch (type) {
    case webrtc::kRGB24:
      return 6;
    case webrtc::kARGB:
    case webrtc::kUnsupported32:
      return 8;
    case webrtc::kARGB4444:
    case webrtc::kRGB565:
    case webrtc::kARGB1555:
    case webrtc::kYUY2:
    case webrtc::kUYVY:
      return 4;
    default:
      return 3;
  }
}

void dispatch(Input& input) {
  const uint32_t type = input.data().ConsumeIntegralInRange<uint32_t>(0, 15);
  const unsigned width = input.size();
  const unsigned height = input.size();
  const bool interlaced = input.data().ConsumeBool();
  const int turns[] = {0, 90, -90, 180, 45};
  const auto rotation = static_cast<webrtc::VideoRotationMode>(input.data().PickValueInArray(turns));
  const auto kind = static_cast<webrtc::VideoType>(type);
  const uint64_t other = frameBytes(width, height, halfBytes(type));
  const uint64_t planar = frameBytes(width, height, 3);
  if (input.data().ConsumeBool()) {
    run(input, other, planar, [&](const Byte* src, Byte* dst) {
      return webrtc::ConvertToI420(kind, src, width, height, dst, interlaced, rotation);
    });
  } else {
    run(input, planar, other, [&](const Byte* src, Byte* dst) {
      return webrtc::ConvertFromI420(kind, src, width, height, dst, interlaced, rotation);
    });
  }
}

void crop(Input& input) {
  const auto number = [&] { return static_cast<int>(input.size()); };
  const int stride = number();
  const int height = number();
  const int left = number();
  const int top = number();
  const int right = number();
  const int bottom = number();
  const bool inside = stride > 0 && height > 0 && left >= 0 && top >= 0 && left <= right && top <= bottom &&
                      right < stride && bottom < height;
  const uint64_t columns = inside ? static_cast<uint64_t>(right) - static_cast<uint64_t>(left) + 1 : 0;
  const uint64_t rows = inside ? static_cast<uint64_t>(bottom) - static_cast<uint64_t>(top) + 1 : 0;
  const uint64_t chromaRows = inside ? static_cast<uint64_t>(bottom / 2 - top / 2 + 1) : 0;
  const uint64_t source = inside ? static_cast<uint64_t>(stride) *
                                       (static_cast<uint64_t>(height) + static_cast<uint64_t>(height) / 2)
                                 : 0;
  run(input, source, columns * (rows + chromaRows), [&](const Byte* src, Byte* dst) {
    return webrtc::ConvertNV12ToNV12(src, stride, height, left, top, right, bottom, dst);
  });
}

void inPlace(Input& input) {
  const unsigned which = input.data().ConsumeIntegralInRange<unsigned>(0, 4);
  const unsigned width = input.size();
  const unsigned height = input.size();
  const unsigned toWidth = input.size();
  const unsigned toHeight = input.size();
  const int rows = static_cast<int>(input.size());
  const uint64_t frame = frameBytes(width, height, 3);
  if (which == 3 && frame > kLargestBuffer) return;  // what is cut out may be small
  const uint64_t capacity =
      which == 4 ? input.data().ConsumeIntegralInRange<uint64_t>(0, kLargestBuffer) : frame;
  run(input, 1, capacity, [&](const Byte* /*src*/, Byte* buffer) {
    unsigned outSize = 0;
    switch (which) {
      case 0:
        return webrtc::ScaleI420UpHalfFrame(width, height, buffer);
      case 1:
        return webrtc::ScaleI420DownHalfFrame(width, height, buffer);
      case 2:
        return webrtc::ScaleI420FrameQuarter(width, height, buffer);
      case 3:
        return webrtc::CutI420Frame(buffer, width, height, toWidth, toHeight);
      default:
        if (frame > capacity) return -1;  // the caller's error
        return webrtc::PadI420BottomRows(buffer, static_cast<unsigned>(capacity), width, height, rows,
                                         outSize);
    }
  });
}

void growing(Input& input) {
  using Growing = int (*)(unsigned, unsigned, Byte*&, unsigned, unsigned&, unsigned&);
  const Growing functions[] = {webrtc::ScaleI420Down1_3, webrtc::ScaleI420Up3_2, webrtc::ScaleI420Up2};
  const Growing function = input.data().PickValueInArray(functions);
  const unsigned width = input.size();
  const unsigned height = input.size();
  const uint64_t frame = frameBytes(width, height, 3);
  const uint64_t size =
      frame <= kLargestBuffer ? frame + input.data().ConsumeIntegralInRange<unsigned>(0, 64) : 1;
  Byte* buffer = new Byte[size]();
  unsigned outWidth = 0;
  unsigned outHeight = 0;
  const int result = function(width, height, buffer, static_cast<unsigned>(size), outWidth, outHeight);
  if (result > 0) {
    const auto made = static_cast<unsigned>(result);
    require(made <= std::max<uint64_t>(size, frameBytes(outWidth, outHeight, 3)));
    require(std::count(buffer, buffer + made, 1) <= result);  // reads them all
  }
  delete[] buffer;
}

void bilinear(Input& input) {
  const unsigned width = input.size();
  const unsigned height = input.size();
  const unsigned dstWidth = input.size();
  const unsigned dstHeight = input.size();
  const uint64_t frame = frameBytes(width, height, 3) + (width % 2 != 0 ? height : 0);
  if (frame > kLargestBuffer || uint64_t{dstWidth} * dstHeight > kLargestBuffer) return;
  Buffer source(frame, input.fill());
  unsigned size = input.data().ConsumeIntegralInRange<unsigned>(0, 40000);
  Byte* destination = input.data().ConsumeBool() ? new Byte[size] : nullptr;
  webrtc::interpolator scaler;
  if (scaler.Set(width, height, dstWidth, dstHeight, webrtc::kI420, webrtc::kRGB24, webrtc::kBilinear) == 0) {
    const int result = scaler.Interpolate(source.get(), destination, size);
    require(result == -1 || (result == static_cast<int>(dstHeight) && destination != nullptr));
  }
  delete[] destination;
}

void padByBytes(Input& input) {
  const unsigned sizes[] = {115200, 28800, 0, 1000};
  const unsigned size = input.data().PickValueInArray(sizes);
  const bool block = input.data().ConsumeBool();
  run(input, size, size == 115200 ? 152064 : 38016,
      [&](const Byte* src, Byte* dst) { return webrtc::PadI420Frame(size, src, dst, block); });
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size);
extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  Input input(data, size);
  using Family = void (*)(Input&);
  const Family families[] = {oneSize, oneSize, oneSize, twoSizes, turn,      dispatch,
                             crop,    inPlace, growing, bilinear, padByBytes};
  input.data().PickValueInArray(families)(input);
  return 0;
}
