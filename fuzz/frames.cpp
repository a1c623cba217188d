// The frame functions with any sizes, strides and flags, on buffers that end exactly where the headers say:
// the sanitizers see every byte too far. What is refused must leave the destination alone, everything else is
// as the tests state it.
#include <fuzzer/FuzzedDataProvider.h>

#include <algorithm>
#include <cstdint>
#include <cstdlib>

#include "tests/frames/functions.h"

namespace {

using namespace frames_test;

// Buffers above this are not made; a call that needs more than the library can do has to be refused.
constexpr uint64_t kLargestBuffer = 1U << 22;
// Results are at most 2147483647 bytes, and some count an odd row less than the frame has.
constexpr uint64_t kSurelyTooMuch = uint64_t{2} << 31;

void require(bool holds) {
  if (!holds) std::abort();
}

class Input {
 public:
  Input(const uint8_t* data, size_t size) : _data(data, size) {}

  FuzzedDataProvider& data() { return _data; }
  // Mostly a size at which pictures can be made, and now and then any number.
  unsigned size() { return number(0, 15) == 0 ? _data.ConsumeIntegral<unsigned>() : number(0, 160); }
  unsigned number(unsigned low, unsigned high) { return _data.ConsumeIntegralInRange(low, high); }
  unsigned stride(unsigned width) {
    const unsigned kind = number(0, 3);
    return kind == 3 ? size() : kind == 2 ? width + number(0, 40) : kind == 1 ? width : 0;
  }
  Size frame() { return {size(), size()}; }
  // At least one: an address is never null.
  Bytes bytes(uint64_t size) {
    Bytes result(std::max<uint64_t>(size, 1));
    const auto first = _data.ConsumeIntegral<uint8_t>();
    for (uint64_t i = 0; i < result.size(); ++i) result[i] = static_cast<uint8_t>(first + i * 7);
    return result;
  }

 private:
  FuzzedDataProvider _data;
};

// Calls with buffers of these sizes; where the result is beyond all bounds with tiny ones, which is right
// only if the call is refused. `check` looks at a frame that was made.
template <typename Call, typename Check>
void run(Input& input, uint64_t srcBytes, uint64_t dstBytes, Call call, Check check) {
  const bool refused = dstBytes > kSurelyTooMuch;
  if (!refused && (srcBytes > kLargestBuffer || dstBytes > kLargestBuffer)) return;
  const Bytes src = input.bytes(refused ? 1 : srcBytes);
  const Bytes before = input.bytes(refused ? 1 : dstBytes);
  Bytes dst = before;
  const int result = call(src.data(), dst.data());
  require(result >= -1 && (!refused || result <= 0));  // 0: some take a width of 0
  if (result == -1) require(dst == before);
  if (result > 0) check(src, before, dst);
}
void unchecked(const Bytes& /*src*/, const Bytes& /*before*/, const Bytes& /*after*/) {}

void conversion(Input& input) {
  static const std::vector<Function> all = functions();
  const Function& function = all[input.number(0, static_cast<unsigned>(all.size()) - 1)];
  const Shape shape = function.call.shape;
  const bool dispatch = function.dispatched && input.data().ConsumeBool();
  const Size from = input.frame();
  const Size to = shape == Shape::kTight || shape == Shape::kStrided || dispatch ? from : input.frame();
  const unsigned stride = shape == Shape::kStrided && !dispatch ? input.stride(to.width) : 0;
  const Size result{std::max(stride, to.width), to.height};
  // Beyond all buffers, and yet a result of 0 where an odd row or column does not count.
  if (std::min(result.width, result.height) == 1 && result.area() > kLargestBuffer / 8) return;
  run(
      input, from.area() * function.srcHalves / 2, result.area() * function.dstHalves / 2,
      [&](In src, Out dst) {
        return (dispatch ? *function.dispatched : function.call).run(src, dst, from, to, stride);
      },
      [&](const Bytes& src, Bytes expected, const Bytes& dst) {
        function.reference(src, expected, from, to, result.width);
        require(dst == expected);
      });
}

void crop(Input& input) {
  int numbers[6];
  for (int& number : numbers) number = static_cast<int>(input.size());
  const auto& [stride, height, left, top, right, bottom] = numbers;
  const bool inside = stride > 0 && height > 0 && left >= 0 && top >= 0 && left <= right && top <= bottom &&
                      right < stride && bottom < height;
  const int64_t rows = int64_t{bottom} - top + 1 + bottom / 2 - top / 2 + 1;
  const int64_t source = inside ? int64_t{stride} * (int64_t{height} + height / 2) : 0;
  const int64_t result = inside ? (int64_t{right} - left + 1) * rows : 0;
  const auto call = [&](In src, Out dst) {
    return ConvertNV12ToNV12(src, numbers[0], numbers[1], numbers[2], numbers[3], numbers[4], numbers[5],
                             dst);
  };
  run(input, static_cast<uint64_t>(source), static_cast<uint64_t>(result), call, unchecked);
}

void withinABuffer(Input& input) {
  const bool cut = input.data().ConsumeBool();
  const Size s = input.frame(), to = input.frame();
  const int rows = static_cast<int>(input.size());
  if (s.i420() > kLargestBuffer) return;  // what is cut out may be small
  const size_t capacity = cut ? s.i420() : s.i420() + input.number(0, kLargestBuffer / 2);
  const auto call = [&](In, Out buffer) {
    unsigned outSize = 0;
    if (cut) return CutI420Frame(buffer, s.width, s.height, to.width, to.height);
    return PadI420BottomRows(buffer, static_cast<unsigned>(capacity), s.width, s.height, rows, outSize);
  };
  run(input, 1, capacity, call, unchecked);
}

void growing(Input& input) {
  using Growing = int (*)(unsigned, unsigned, Out&, unsigned, unsigned&, unsigned&);
  const Growing functions[] = {ScaleI420Down1_3, ScaleI420Up3_2, ScaleI420Up2};
  const Growing function = input.data().PickValueInArray(functions);
  const Size s = input.frame();
  const size_t size = s.i420() <= kLargestBuffer ? s.i420() + input.number(0, 64) : 1;
  Out buffer = new uint8_t[size]();
  Size out{};
  const int result = function(s.width, s.height, buffer, static_cast<unsigned>(size), out.width, out.height);
  require(result <= 0 || static_cast<size_t>(result) <= std::max(size, out.i420()));
  require(std::count(buffer, buffer + std::max(result, 0), 1) <= std::max(result, 0));  // reads them all
  delete[] buffer;
}

void bilinear(Input& input) {
  const Size from = input.frame(), to = input.frame();
  if (from.i420() > kLargestBuffer || to.area() > kLargestBuffer) return;
  const Bytes source = input.bytes(from.i420());
  unsigned size = input.number(0, 40000);
  Out destination = input.data().ConsumeBool() ? new uint8_t[size] : nullptr;
  interpolator scaler;
  if (scaler.Set(from.width, from.height, to.width, to.height, kI420, kRGB24, kBilinear) == 0) {
    const int result = scaler.Interpolate(source.data(), destination, size);
    require(result == -1 || (result == static_cast<int>(to.height) && destination != nullptr));
  }
  delete[] destination;
}

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size);
extern "C" int LLVMFuzzerTestOneInput(const uint8_t* data, size_t size) {
  Input input(data, size);
  using Family = void (*)(Input&);
  const Family families[] = {conversion, conversion,    conversion, conversion,
                             crop,       withinABuffer, growing,    bilinear};
  input.data().PickValueInArray(families)(input);
  return 0;
}
