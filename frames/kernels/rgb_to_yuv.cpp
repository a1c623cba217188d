#include "frames/kernels/rgb_to_yuv.h"

#include "frames/kernels/targets.h"
#include "frames/pixels.h"

// clang-format off
#undef HWY_TARGET_INCLUDE
#define HWY_TARGET_INCLUDE "frames/kernels/rgb_to_yuv.cpp"
#include <hwy/foreach_target.h>
#include <hwy/highway.h>
#include "frames/kernels/run-inl.h"
// clang-format on

HWY_BEFORE_NAMESPACE();
namespace webrtc::detail::HWY_NAMESPACE {
namespace {
namespace hn = hwy::HWY_NAMESPACE;

// The layouts for whole vectors of components, one byte per pixel.

template <class D, class V>
HWY_INLINE void loadPixels(Bgr24, D d, const std::uint8_t* from, V& r, V& g, V& b) {
  hn::LoadInterleaved3(d, from, b, g, r);
}

template <class D, class V>
HWY_INLINE void loadPixels(Argb, D d, const std::uint8_t* from, V& r, V& g, V& b) {
  V ignored;
  hn::LoadInterleaved4(d, from, ignored, r, g, b);
}

template <class D, class V>
HWY_INLINE void loadPixels(Rgb565, D d, const std::uint8_t* from, V& r, V& g, V& b) {
  V low, high;
  hn::LoadInterleaved2(d, from, low, high);
  r = hn::And(high, hn::Set(d, 0xF8));
  g = hn::And(hn::Or(hn::ShiftLeft<5>(high), hn::ShiftRight<3>(low)), hn::Set(d, 0xFC));
  b = hn::ShiftLeft<3>(low);
}

template <class Layout, bool kChroma>
struct Row {
  using Lane = std::uint16_t;  // a unit is a pair of pixels
  const std::uint8_t* src;
  std::uint8_t *y, *u, *v;

  template <class D>
  HWY_INLINE void operator()(D d16, std::size_t i) const {
    const hn::Repartition<std::uint8_t, D> d8;
    hn::Vec<decltype(d8)> r, g, b;
    loadPixels(Layout{}, d8, src + 2 * i * Layout::kBytes, r, g, b);

    // The sums of luma fit 16 bits without a sign: at most 220 * 255 + 128.
    const auto low = hn::Set(d16, 0xFF);
    const auto r16 = hn::BitCast(d16, r), g16 = hn::BitCast(d16, g), b16 = hn::BitCast(d16, b);
    const auto rEven = hn::And(r16, low), gEven = hn::And(g16, low), bEven = hn::And(b16, low);
    const auto even = hn::ShiftRight<8>(luma(d16, rEven, gEven, bEven));
    const auto odd = luma(d16, hn::ShiftRight<8>(r16), hn::ShiftRight<8>(g16), hn::ShiftRight<8>(b16));
    const auto sum = hn::BitCast(d8, hn::Or(even, hn::AndNot(low, odd)));
    hn::StoreU(hn::Add(sum, hn::Set(d8, 16)), d8, y + 2 * i);
    if constexpr (kChroma) {
      storeChroma(d16, rEven, gEven, bEven, -38, -74, 112, u + i);
      storeChroma(d16, rEven, gEven, bEven, 112, -94, -18, v + i);
    }
  }

  template <class D, class V>
  static HWY_INLINE V luma(D d16, V r, V g, V b) {
    const V red = hn::Mul(r, hn::Set(d16, 66));
    const V green = hn::Mul(g, hn::Set(d16, 129));
    const V blue = hn::Mul(b, hn::Set(d16, 25));
    return hn::Add(hn::Add(red, green), hn::Add(blue, hn::Set(d16, 128)));
  }

  // The sums fit 16 bits with their sign: at most 112 * 255 + 128 either way.
  template <class D, class V>
  static HWY_INLINE void storeChroma(D, V r, V g, V b, std::int16_t cr, std::int16_t cg, std::int16_t cb,
                                     std::uint8_t* to) {
    const hn::RebindToSigned<D> di16;
    const hn::Rebind<std::uint8_t, D> d8;
    const auto red = hn::Mul(hn::BitCast(di16, r), hn::Set(di16, cr));
    const auto green = hn::Mul(hn::BitCast(di16, g), hn::Set(di16, cg));
    const auto blue = hn::Mul(hn::BitCast(di16, b), hn::Set(di16, cb));
    const auto sum = hn::Add(hn::Add(red, green), hn::Add(blue, hn::Set(di16, 128)));
    hn::StoreU(hn::DemoteTo(d8, hn::Add(hn::ShiftRight<8>(sum), hn::Set(di16, 128))), d8, to);
  }

  void plain(std::size_t begin, std::size_t end) const {
    for (std::size_t i = begin; i < end; ++i) {
      const Rgb left = Layout::load(src + 2 * i * Layout::kBytes);
      y[2 * i] = lumaOf(left);
      y[2 * i + 1] = lumaOf(Layout::load(src + (2 * i + 1) * Layout::kBytes));
      if constexpr (kChroma) {
        u[i] = cbOf(left);
        v[i] = crOf(left);
      }
    }
  }
};

template <class Layout>
void luma(const std::uint8_t* src, std::uint8_t* y, std::size_t pairs) {
  run(Row<Layout, false>{src, y, nullptr, nullptr}, pairs);
}

template <class Layout>
void lumaAndChroma(const std::uint8_t* src, std::uint8_t* y, std::uint8_t* u, std::uint8_t* v,
                   std::size_t pairs) {
  run(Row<Layout, true>{src, y, u, v}, pairs);
}

template <class Layout>
constexpr RgbToYuvRows rows() {
  return {.luma = luma<Layout>, .lumaAndChroma = lumaAndChroma<Layout>, .bytesPerPixel = Layout::kBytes};
}

}  // namespace

const RgbToYuvKernels& rgbToYuvTable() {
  static constexpr RgbToYuvKernels kTable = {
      .bgr24 = rows<Bgr24>(), .argb = rows<Argb>(), .rgb565 = rows<Rgb565>()};
  return kTable;
}

}  // namespace webrtc::detail::HWY_NAMESPACE
HWY_AFTER_NAMESPACE();

#if HWY_ONCE
namespace webrtc::detail {

HWY_EXPORT(rgbToYuvTable);

const RgbToYuvKernels& rgbToYuvKernels() {
  return HWY_DYNAMIC_DISPATCH(rgbToYuvTable)();
}

}  // namespace webrtc::detail
#endif
