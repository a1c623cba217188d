#include "frames/kernels/yuv_to_rgb.h"

#include "frames/kernels/targets.h"
#include "frames/pixels.h"

// clang-format off
#undef HWY_TARGET_INCLUDE
#define HWY_TARGET_INCLUDE "frames/kernels/yuv_to_rgb.cpp"
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
HWY_INLINE void storePixels(Bgr24, D d, V r, V g, V b, std::uint8_t* to) {
  hn::StoreInterleaved3(b, g, r, d, to);
}

template <std::size_t kR, std::size_t kG, std::size_t kB, class D, class V>
HWY_INLINE void storePixels(FourBytes<kR, kG, kB>, D d, V r, V g, V b, std::uint8_t* to) {
  V place[4] = {};
  place[kR] = r;
  place[kG] = g;
  place[kB] = b;
  place[6 - kR - kG - kB] = hn::Set(d, 255);
  hn::StoreInterleaved4(place[0], place[1], place[2], place[3], d, to);
}

template <class D, class V>
HWY_INLINE void storePixels(Rgb565, D d, V r, V g, V b, std::uint8_t* to) {
  const V low = hn::Or(hn::ShiftLeft<3>(hn::And(g, hn::Set(d, 0x1C))), hn::ShiftRight<3>(b));
  const V high = hn::Or(hn::And(r, hn::Set(d, 0xF8)), hn::ShiftRight<5>(g));
  hn::StoreInterleaved2(low, high, d, to);
}

template <class D, class V>
HWY_INLINE void storePixels(Argb4444, D d, V r, V g, V b, std::uint8_t* to) {
  const V upper = hn::Set(d, 0xF0);
  hn::StoreInterleaved2(hn::Or(hn::And(g, upper), hn::ShiftRight<4>(b)), hn::Or(upper, hn::ShiftRight<4>(r)),
                        d, to);
}

template <class D, class V>
HWY_INLINE void storePixels(Argb1555, D d, V r, V g, V b, std::uint8_t* to) {
  const V low = hn::Or(hn::ShiftLeft<3>(hn::And(g, hn::Set(d, 0x18))), hn::ShiftRight<3>(b));
  const V red = hn::Xor(hn::ShiftLeft<2>(hn::And(r, hn::Set(d, 0x38))), hn::Set(d, 0x80));
  hn::StoreInterleaved2(low, hn::Or(red, hn::ShiftRight<5>(g)), d, to);
}

struct Planar {
  static constexpr std::size_t kStep = 1;
  template <class D, class V>
  static HWY_INLINE void load(D d16, const std::uint8_t* u, const std::uint8_t* v, V& u16, V& v16) {
    const hn::Rebind<std::uint8_t, D> d8;
    u16 = hn::PromoteTo(d16, hn::LoadU(d8, u));
    v16 = hn::PromoteTo(d16, hn::LoadU(d8, v));
  }
};

struct SemiPlanar {
  static constexpr std::size_t kStep = 2;
  template <class D, class V>
  static HWY_INLINE void load(D d16, const std::uint8_t* u, const std::uint8_t* /*v*/, V& u16, V& v16) {
    const hn::RebindToUnsigned<D> du16;
    const hn::Repartition<std::uint8_t, D> d8;
    const auto pairs = hn::BitCast(du16, hn::LoadU(d8, u));
    u16 = hn::BitCast(d16, hn::And(pairs, hn::Set(du16, 0xFF)));
    v16 = hn::BitCast(d16, hn::ShiftRight<8>(pairs));
  }
};

// All in 16-bit lanes, exact: 298 = 256 + 42, and the other coefficients are split in the same way into a
// multiple of 256, added after the shift, and a rest with which the sum before it stays within 16 bits.
//   R = y + (v - 16 - 128) + ((42 y + 153 (v - 128) + 128 - 672) >> 8)
// and so on; 672 = 42 * 16. Values are biased so that the additions saturate at 255 (kBias + 255 is the
// largest 16-bit value) and one unsigned subtraction saturates at 0.
inline constexpr std::int16_t kBias = 0x7FFF - 255;

template <class Chroma, class Layout>
struct RowPair {
  using Lane = std::uint16_t;  // a unit is a block of 2 x 2 pixels
  const std::uint8_t *y0, *y1, *u, *v;
  std::uint8_t *dst0, *dst1;

  // What a chroma pair adds before and after the shift.
  template <class V>
  struct Terms {
    V rLow, rHigh, gLow, gHigh, bLow, bHigh;
  };

  template <class D>
  HWY_INLINE void operator()(D, std::size_t i) const {
    const hn::Repartition<std::int16_t, D> d16;
    using V = hn::Vec<decltype(d16)>;
    V cb, cr;
    Chroma::load(d16, u + i * Chroma::kStep, v + i * Chroma::kStep, cb, cr);
    const V middle = hn::Set(d16, 128);
    cb = hn::Sub(cb, middle);
    cr = hn::Sub(cr, middle);

    const V round = hn::Set(d16, 128 - 672);
    const V bias = hn::Set(d16, kBias - 16);
    Terms<V> t;
    t.rLow = hn::Add(hn::Mul(cr, hn::Set(d16, 153)), round);
    t.rHigh = hn::Add(cr, bias);
    t.gLow = hn::Add(hn::Add(hn::Mul(cb, hn::Set(d16, -100)), hn::Mul(cr, hn::Set(d16, 48))), round);
    t.gHigh = hn::Sub(bias, cr);
    t.bLow = hn::Add(hn::ShiftLeft<2>(cb), round);
    t.bHigh = hn::Add(hn::ShiftLeft<1>(cb), bias);
    row(d16, y0 + 2 * i, t, dst0 + 2 * i * Layout::kBytes);
    row(d16, y1 + 2 * i, t, dst1 + 2 * i * Layout::kBytes);
  }

  template <class D, class V>
  static HWY_INLINE void row(D d16, const std::uint8_t* y, const Terms<V>& t, std::uint8_t* to) {
    const hn::Repartition<std::uint8_t, D> d8;
    const hn::RebindToUnsigned<D> du16;
    const auto luma = hn::BitCast(du16, hn::LoadU(d8, y));
    const V even = hn::BitCast(d16, hn::And(luma, hn::Set(du16, 0xFF)));
    const V odd = hn::BitCast(d16, hn::ShiftRight<8>(luma));
    const V coefficient = hn::Set(d16, 42);
    const V evenLow = hn::Mul(even, coefficient);
    const V oddLow = hn::Mul(odd, coefficient);
    const auto r = component(d16, even, odd, evenLow, oddLow, t.rLow, t.rHigh);
    const auto g = component(d16, even, odd, evenLow, oddLow, t.gLow, t.gHigh);
    const auto b = component(d16, even, odd, evenLow, oddLow, t.bLow, t.bHigh);
    storePixels(Layout{}, d8, r, g, b, to);
  }

  template <class D, class V>
  static HWY_INLINE auto component(D d16, V even, V odd, V evenLow, V oddLow, V low, V high) {
    const hn::Repartition<std::uint8_t, D> d8;
    const auto e = sample(d16, even, evenLow, low, high);
    const auto o = sample(d16, odd, oddLow, low, high);
    return hn::BitCast(d8, hn::Or(e, hn::ShiftLeft<8>(o)));
  }

  template <class D, class V>
  static HWY_INLINE auto sample(D, V luma, V lumaLow, V low, V high) {
    const hn::RebindToUnsigned<D> du16;
    // The last addend is not negative: where the first addition saturates the sum does as well.
    const V sum = hn::SaturatedAdd(hn::SaturatedAdd(hn::ShiftRight<8>(hn::Add(lumaLow, low)), high), luma);
    return hn::SaturatedSub(hn::BitCast(du16, sum), hn::Set(du16, kBias));
  }

  void plain(std::size_t begin, std::size_t end) const {
    for (std::size_t i = begin; i < end; ++i) {
      const int cb = u[i * Chroma::kStep], cr = v[i * Chroma::kStep];
      for (std::size_t x = 2 * i; x < 2 * i + 2; ++x) {
        Layout::store(dst0 + x * Layout::kBytes, rgbOf(y0[x], cb, cr));
        Layout::store(dst1 + x * Layout::kBytes, rgbOf(y1[x], cb, cr));
      }
    }
  }
};

template <class Chroma, class Layout>
void rowPair(const std::uint8_t* y0, const std::uint8_t* y1, const std::uint8_t* u, const std::uint8_t* v,
             std::uint8_t* dst0, std::uint8_t* dst1, std::size_t pairs) {
  run(RowPair<Chroma, Layout>{y0, y1, u, v, dst0, dst1}, pairs);
}

struct AppendAlpha {
  using Lane = std::uint8_t;
  const std::uint8_t* src;
  std::uint8_t* dst;

  template <class D>
  HWY_INLINE void operator()(D d, std::size_t i) const {
    hn::Vec<D> b, g, r;
    hn::LoadInterleaved3(d, src + 3 * i, b, g, r);
    storePixels(Bgra{}, d, r, g, b, dst + 4 * i);
  }

  void plain(std::size_t begin, std::size_t end) const {
    for (std::size_t i = begin; i < end; ++i) Bgra::store(dst + 4 * i, Bgr24::load(src + 3 * i));
  }
};

void appendAlpha(const std::uint8_t* src, std::uint8_t* dst, std::size_t pixels) {
  run(AppendAlpha{src, dst}, pixels);
}

}  // namespace

const YuvToRgbKernels& yuvToRgbTable() {
  static constexpr YuvToRgbKernels kTable = {
      .bgr24 = rowPair<Planar, Bgr24>,
      .bgra = rowPair<Planar, Bgra>,
      .rgba = rowPair<Planar, Rgba>,
      .argb = rowPair<Planar, Argb>,
      .rgb565 = rowPair<Planar, Rgb565>,
      .argb4444 = rowPair<Planar, Argb4444>,
      .argb1555 = rowPair<Planar, Argb1555>,
      .semiPlanarRgb565 = rowPair<SemiPlanar, Rgb565>,
      .bgr24ToBgra = appendAlpha,
  };
  return kTable;
}

}  // namespace webrtc::detail::HWY_NAMESPACE
HWY_AFTER_NAMESPACE();

#if HWY_ONCE
namespace webrtc::detail {

HWY_EXPORT(yuvToRgbTable);

const YuvToRgbKernels& yuvToRgbKernels() {
  return HWY_DYNAMIC_DISPATCH(yuvToRgbTable)();
}

}  // namespace webrtc::detail
#endif
