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

using namespace webrtc;
using Byte = unsigned char;
struct Size {
  unsigned width, height;
};

// Buffers above this are not made; a call that needs more than the library can do has to be refused.
constexpr uint64_t kLargestBuffer = 1U << 22;
// Results are at most 2147483647 bytes, and some count an odd row less than the frame has.
constexpr uint64_t kSurelyTooMuch = uint64_t{2} << 31;

void require(bool holds) {
  if (!holds) std::abort();
}

// Beyond all buffers, and yet a result of 0 where an odd row or column does not count.
bool isOneLongLine(Size s) {
  return std::min(s.width, s.height) == 1 && std::max(s.width, s.height) > kLargestBuffer / 8;
}

// `half` counts half bytes per pixel: 3 for 4:2:0.
uint64_t frameBytes(Size s, unsigned half = 3) {
  return uint64_t{s.width} * s.height * half / 2;
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
    const unsigned kind = _data.ConsumeIntegralInRange<unsigned>(0, 3);
    if (kind == 3) return size();
    if (kind == 2) return width + _data.ConsumeIntegralInRange<unsigned>(0, 40);
    return kind == 1 ? width : 0;
  }
  Size frame() { return {size(), size()}; }
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

using Function = std::variant<SrcDst, SrcDstStride, SizeSrcDst, SrcSizeDst>;

struct OneSize {
  Function function;
  unsigned srcHalf, dstHalf;  // half bytes per pixel
};

const std::vector<OneSize> kOneSize = [] {
  std::vector<OneSize> all;
  const auto add = [&](unsigned srcHalf, unsigned dstHalf, std::initializer_list<Function> functions) {
    for (const Function& function : functions) all.push_back({function, srcHalf, dstHalf});
  };
  add(3, 6, {ConvertI420ToRGB24, ConvertI420ToRGB24_EX});
  add(3, 8, {ConvertI420ToARGB, ConvertI420ToARGBMac, ConvertI420ToRGBAMac, ConvertI420ToRGBAIPhone});
  add(3, 4,
      {ConvertI420ToARGB4444, ConvertI420ToARGB4444_EX, ConvertI420ToRGB565, ConvertI420ToRGB565_EX,
       ConvertI420ToRGB565Android, ConvertI420ToARGB1555, ConvertI420ToARGB1555_EX, ConvertNV12ToRGB565});
  add(6, 8, {ConvertRGB24ToARGB});
  add(3, 3,
      {ConvertYV12ToI420, ConvertI420ToYV12, SrcDstStride{ConvertI420ToI420}, ConvertI420ToNV12,
       ConvertI420ToNV21, ConvertNV12ToI420, ConvertNV21ToI420});
  add(3, 4, {ConvertI420ToYUY2, ConvertI420ToUYVY});
  add(4, 3, {SizeSrcDst{ConvertYUY2ToI420}, SizeSrcDst{ConvertUYVYToI420}});
  add(6, 3, {SizeSrcDst{ConvertRGB24ToI420}});
  add(8, 3, {ConvertARGBMacToI420});
  add(4, 3, {ConvertRGB565ToI420});
  add(3, 3,
      {ConvertNV12ToI420AndRotateClockwise, ConvertNV12ToI420AndRotateAntiClockwise,
       ConvertNV12ToI420AndRotate180, ConvertNV21ToI420AndRotateClockwise,
       ConvertNV21ToI420AndRotateAntiClockwise, ConvertNV21ToI420AndRotate180, MirrorI420UpDown,
       MirrorI420LeftRight});
  return all;
}();

void oneSize(Input& input) {
  const OneSize& chosen = kOneSize[input.data().ConsumeIntegralInRange<size_t>(0, kOneSize.size() - 1)];
  const Size s = input.frame();
  const bool hasStride = std::holds_alternative<SrcDstStride>(chosen.function);
  const unsigned stride = hasStride ? input.stride(s.width) : 0;
  const Size result{std::max(stride, s.width), s.height};
  if (isOneLongLine(result)) return;
  run(input, frameBytes(s, chosen.srcHalf), frameBytes(result, chosen.dstHalf),
      [&](const Byte* src, Byte* dst) {
        if (const auto* plain = std::get_if<SrcDst>(&chosen.function))
          return (*plain)(src, dst, s.width, s.height);
        if (const auto* first = std::get_if<SizeSrcDst>(&chosen.function))
          return (*first)(s.width, s.height, src, dst);
        if (const auto* middle = std::get_if<SrcSizeDst>(&chosen.function))
          return (*middle)(src, s.width, s.height, dst);
        return std::get<SrcDstStride>(chosen.function)(src, dst, s.width, s.height, stride);
      });
}

// --- Two sizes --------------------------------------------------------------------------------------------

struct TwoSizes {
  int (*function)(const Byte* src, unsigned width, unsigned height, Byte* dst, unsigned toWidth,
                  unsigned toHeight);
  unsigned srcHalf;
};
const TwoSizes kTwoSizes[] = {
    {ConvertI420ToI420, 3},
    {ConvertYUY2ToI420, 4},
    {ConvertUYVYToI420, 4},
    {ConvertYUY2ToI420interlaced, 4},
    {ConvertUYVYToI420interlaced, 4},
    {ConvertRGB24ToI420, 6},
    {[](const Byte* src, unsigned width, unsigned height, Byte* dst, unsigned toWidth, unsigned toHeight) {
       return PadI420Frame(src, dst, width, height, toWidth, toHeight);
     },
     3}};

void twoSizes(Input& input) {
  const TwoSizes& chosen = input.data().PickValueInArray(kTwoSizes);
  const Size from = input.frame();
  const Size to = input.frame();
  if (isOneLongLine(to)) return;
  run(input, frameBytes(from, chosen.srcHalf), frameBytes(to), [&](const Byte* src, Byte* dst) {
    return chosen.function(src, from.width, from.height, dst, to.width, to.height);
  });
}

// --- The rest ---------------------------------------------------------------------------------------------

void turn(Input& input) {
  const Size s = input.frame();
  const bool fits = input.data().ConsumeIntegralInRange(0, 7) != 0;
  const Size to = fits ? Size{s.height, s.width} : input.frame();
  const auto type = static_cast<VideoType>(input.data().ConsumeIntegralInRange(0, 15));
  const unsigned which = input.data().ConsumeIntegralInRange<unsigned>(0, 2);
  run(input, frameBytes(s), frameBytes(s), [&](const Byte* src, Byte* dst) {
    if (which == 0) return ConvertToI420AndMirrorUpDown(src, dst, s.width, s.height, type);
    const auto function = which == 1 ? ConvertToI420AndRotateClockwise : ConvertToI420AndRotateAntiClockwise;
    return function(src, s.width, s.height, dst, to.width, to.height, type);
  });
}

void dispatch(Input& input) {
  static constexpr unsigned kHalfBytes[] = {3, 3, 3, 6, 8, 4, 4, 4, 4, 3, 4, 8, 3, 3, 3, 3};  // by type
  const auto type = static_cast<VideoType>(input.data().ConsumeIntegralInRange<uint32_t>(0, 15));
  const Size s = input.frame();
  const bool interlaced = input.data().ConsumeBool();
  const int turns[] = {0, 90, -90, 180, 45};
  const auto rotation = static_cast<VideoRotationMode>(input.data().PickValueInArray(turns));
  const bool toPlanar = input.data().ConsumeBool();
  const auto function = toPlanar ? ConvertToI420 : ConvertFromI420;
  const uint64_t bytes[] = {frameBytes(s), frameBytes(s, kHalfBytes[type])};
  run(input, bytes[toPlanar ? 1 : 0], bytes[toPlanar ? 0 : 1], [&](const Byte* src, Byte* dst) {
    return function(type, src, s.width, s.height, dst, interlaced, rotation);
  });
}

void crop(Input& input) {
  int numbers[6];
  for (int& number : numbers) number = static_cast<int>(input.size());
  const int64_t stride = numbers[0], height = numbers[1], left = numbers[2], top = numbers[3];
  const int64_t right = numbers[4], bottom = numbers[5];
  const bool inside = stride > 0 && height > 0 && left >= 0 && top >= 0 && left <= right && top <= bottom &&
                      right < stride && bottom < height;
  const int64_t rows = bottom - top + 1 + bottom / 2 - top / 2 + 1;
  const int64_t source = inside ? stride * (height + height / 2) : 0;
  const int64_t result = inside ? (right - left + 1) * rows : 0;
  run(input, static_cast<uint64_t>(source), static_cast<uint64_t>(result), [&](const Byte* src, Byte* dst) {
    return ConvertNV12ToNV12(src, numbers[0], numbers[1], numbers[2], numbers[3], numbers[4], numbers[5],
                             dst);
  });
}

void inPlace(Input& input) {
  using Scaler = int (*)(unsigned width, unsigned height, Byte* buffer);
  static constexpr Scaler kScalers[] = {ScaleI420UpHalfFrame, ScaleI420DownHalfFrame, ScaleI420FrameQuarter};
  const unsigned which = input.data().ConsumeIntegralInRange<unsigned>(0, 4);
  const Size s = input.frame();
  const Size to = input.frame();
  const int rows = static_cast<int>(input.size());
  const uint64_t frame = frameBytes(s);
  if (which == 3 && frame > kLargestBuffer) return;  // what is cut out may be small
  const uint64_t capacity =
      which == 4 ? input.data().ConsumeIntegralInRange<uint64_t>(0, kLargestBuffer) : frame;
  run(input, 1, capacity, [&](const Byte* /*src*/, Byte* buffer) {
    unsigned outSize = 0;
    if (which < 3) return kScalers[which](s.width, s.height, buffer);
    if (which == 3) return CutI420Frame(buffer, s.width, s.height, to.width, to.height);
    if (frame > capacity) return -1;  // the caller's error
    return PadI420BottomRows(buffer, static_cast<unsigned>(capacity), s.width, s.height, rows, outSize);
  });
}

void growing(Input& input) {
  using Growing = int (*)(unsigned, unsigned, Byte*&, unsigned, unsigned&, unsigned&);
  const Growing functions[] = {ScaleI420Down1_3, ScaleI420Up3_2, ScaleI420Up2};
  const Growing function = input.data().PickValueInArray(functions);
  const Size s = input.frame();
  const uint64_t frame = frameBytes(s);
  const uint64_t size =
      frame <= kLargestBuffer ? frame + input.data().ConsumeIntegralInRange<unsigned>(0, 64) : 1;
  Byte* buffer = new Byte[size]();
  Size out{};
  const int result = function(s.width, s.height, buffer, static_cast<unsigned>(size), out.width, out.height);
  if (result > 0) {
    const auto made = static_cast<unsigned>(result);
    require(made <= std::max<uint64_t>(size, frameBytes(out)));
    require(std::count(buffer, buffer + made, 1) <= result);  // reads them all
  }
  delete[] buffer;
}

void bilinear(Input& input) {
  const Size from = input.frame();
  const Size to = input.frame();
  const uint64_t frame = frameBytes(from) + (from.width % 2 != 0 ? from.height : 0);
  if (frame > kLargestBuffer || uint64_t{to.width} * to.height > kLargestBuffer) return;
  Buffer source(frame, input.fill());
  unsigned size = input.data().ConsumeIntegralInRange<unsigned>(0, 40000);
  Byte* destination = input.data().ConsumeBool() ? new Byte[size] : nullptr;
  interpolator scaler;
  if (scaler.Set(from.width, from.height, to.width, to.height, kI420, kRGB24, kBilinear) == 0) {
    const int result = scaler.Interpolate(source.get(), destination, size);
    require(result == -1 || (result == static_cast<int>(to.height) && destination != nullptr));
  }
  delete[] destination;
}

void padByBytes(Input& input) {
  const unsigned sizes[] = {115200, 28800, 0, 1000};
  const unsigned size = input.data().PickValueInArray(sizes);
  const bool block = input.data().ConsumeBool();
  run(input, size, size == 115200 ? 152064 : 38016,
      [&](const Byte* src, Byte* dst) { return PadI420Frame(size, src, dst, block); });
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
