#include "frames/kernels/rgb_to_yuv.h"

#include "frames/kernels/targets.h"
#include "frames/pixels.h"

// clang-format off
#undef HWY_TARGET_INCLUDE
#define HWY_TARGET_INCLUDE "frames/kernels/rgb_to_yuv.cpp"
#include <hwy/foreach_target.h>
#include <hwy/highway.h>
#include "frames/kernels/run-inl.h"
#include "frames/kernels/lanes-inl.h"
// clang-format on

HWY_BEFORE_NAMESPACE();
namespace webrtc::detail::HWY_NAMESPACE {
namespace {
namespace hn = hwy::HWY_NAMESPACE;

// The components of the pixels at even or odd columns, times 256, one a lane of 16 bits.
template <class V>
struct Components {
  V r, g, b;
};

template <class D, class V>
HWY_INLINE void splitColumns(D d16, V r, V g, V b, Components<hn::Vec<D>>& even,
                             Components<hn::Vec<D>>& odd) {
  even = {evenBytes(d16, r), evenBytes(d16, g), evenBytes(d16, b)};
  odd = {oddBytes(d16, r), oddBytes(d16, g), oddBytes(d16, b)};
}

template <class D, class V>
HWY_INLINE void loadPixels(Bgr24, D d16, const std::uint8_t* from, Components<V>& even, Components<V>& odd) {
  const hn::Repartition<std::uint8_t, D> d8;
  hn::Vec<decltype(d8)> b, g, r;
  hn::LoadInterleaved3(d8, from, b, g, r);
  splitColumns(d16, r, g, b, even, odd);
}

template <class D, class V>
HWY_INLINE void loadPixels(Argb, D d16, const std::uint8_t* from, Components<V>& even, Components<V>& odd) {
  const hn::Repartition<std::uint8_t, D> d8;
  hn::Vec<decltype(d8)> ignored, r, g, b;
  hn::LoadInterleaved4(d8, from, ignored, r, g, b);
  splitColumns(d16, r, g, b, even, odd);
}

template <class D, class V>
HWY_INLINE void loadPixels(Rgb565, D d16, const std::uint8_t* from, Components<V>& even, Components<V>& odd) {
  const hn::Repartition<std::uint8_t, D> d8;
  const V front = hn::BitCast(d16, hn::LoadU(d8, from));
  const V back = hn::BitCast(d16, hn::LoadU(d8, from + hn::Lanes(d8)));
  const auto widen = [d16](V words) HWY_ATTR {
    return Components<V>{hn::And(words, hn::Set(d16, 0xF800)),
                         hn::And(hn::ShiftLeft<5>(words), hn::Set(d16, 0xFC00)), hn::ShiftLeft<11>(words)};
  };
  even = widen(ConcatEven(d16, back, front));
  odd = widen(ConcatOdd(d16, back, front));
}

template <class Layout, bool kChroma>
struct Row {
  using Lane = std::uint16_t;  // a unit is a pair of pixels
  const std::uint8_t* src;
  std::uint8_t *y, *u, *v;

  // The sums fit 16 bits, those of chroma with a sign. The offset of the results is added before the upper
  // byte is taken: what wraps then would not be part of it.
  template <class D>
  HWY_INLINE void operator()(D d16, std::size_t i) const {
    const hn::Repartition<std::uint8_t, D> d8;
    Components<hn::Vec<D>> even, odd;
    loadPixels(Layout{}, d16, src + 2 * i * Layout::kBytes, even, odd);
    hn::StoreU(upperBytes(luma(even), luma(odd)), d8, y + 2 * i);
    if constexpr (kChroma) {
      const auto offset = hn::Set(d16, 128 * 256 + 128);
      const auto cb =
          hn::Sub(hn::Add(times<112>(even.b), offset), hn::Add(times<38>(even.r), times<74>(even.g)));
      const auto cr =
          hn::Sub(hn::Add(times<112>(even.r), offset), hn::Add(times<94>(even.g), times<18>(even.b)));
      const hn::Half<decltype(d8)> half;
      const auto both = ConcatOdd(d8, hn::BitCast(d8, cr), hn::BitCast(d8, cb));
      hn::StoreU(LowerHalf(half, both), half, u + i);
      hn::StoreU(UpperHalf(half, both), half, v + i);
    }
  }

  template <class V>
  static HWY_INLINE V luma(const Components<V>& c) {
    const V offset = hn::Set(hn::DFromV<V>(), 16 * 256 + 128);
    return hn::Add(hn::Add(times<66>(c.r), times<129>(c.g)), hn::Add(times<25>(c.b), offset));
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
