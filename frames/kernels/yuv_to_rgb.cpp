#include "frames/kernels/yuv_to_rgb.h"

#include "frames/kernels/targets.h"
#include "frames/pixels.h"

// clang-format off
#undef HWY_TARGET_INCLUDE
#define HWY_TARGET_INCLUDE "frames/kernels/yuv_to_rgb.cpp"
#include <hwy/foreach_target.h>
#include <hwy/highway.h>
#include "frames/kernels/run-inl.h"
#include "frames/kernels/lanes-inl.h"
// clang-format on

HWY_BEFORE_NAMESPACE();
namespace webrtc::detail::HWY_NAMESPACE {
namespace {
namespace hn = hwy::HWY_NAMESPACE;

// A component of the pixels in even columns, or in odd ones, one a lane: 8 bits and 8 bits of fraction,
// clamped, with the highest bit inverted. One Xor sets a whole pixel right.
template <class V>
struct Components {
  V r, g, b;
};

template <class D, class V>
HWY_INLINE V wordsOf(Rgb565, D d, const Components<V>& c) {
  const V lower = hn::OrAnd(hn::ShiftRight<11>(c.b), hn::ShiftRight<5>(c.g), hn::Set(d, 0x07E0));
  return hn::Xor(hn::OrAnd(lower, c.r, hn::Set(d, 0xF800)), hn::Set(d, 0x8410));
}

template <class D, class V>
HWY_INLINE V wordsOf(Argb4444, D d, const Components<V>& c) {
  const V lower = hn::OrAnd(hn::ShiftRight<12>(c.b), hn::ShiftRight<8>(c.g), hn::Set(d, 0x00F0));
  return hn::Xor(hn::OrAnd(lower, hn::ShiftRight<4>(c.r), hn::Set(d, 0x0F00)), hn::Set(d, 0xF888));
}

template <class D, class V>
HWY_INLINE V wordsOf(Argb1555, D d, const Components<V>& c) {
  const V lower = hn::OrAnd(hn::ShiftRight<11>(c.b), hn::ShiftRight<5>(c.g), hn::Set(d, 0x07C0));
  return hn::Xor(hn::OrAnd(lower, hn::ShiftLeft<2>(c.r), hn::Set(d, 0xE000)), hn::Set(d, 0x8410));
}

// 16-bit words.
template <class Layout, class D, class V>
HWY_INLINE void storePixels(Layout layout, D d16, const Components<V>& even, const Components<V>& odd,
                            std::uint8_t* to) {
  const hn::Repartition<std::uint8_t, D> d8;
  const V evenWords = wordsOf(layout, d16, even), oddWords = wordsOf(layout, d16, odd);
  hn::StoreU(hn::BitCast(d8, InterleaveLower(d16, evenWords, oddWords)), d8, to);
  hn::StoreU(hn::BitCast(d8, InterleaveUpper(d16, evenWords, oddWords)), d8, to + hn::Lanes(d8));
}

// The bytes of a component in the order of the columns.
template <class V>
HWY_INLINE auto bytesInOrder(V even, V odd) {
  const auto bytes = upperBytes(even, odd);
  return hn::Xor(bytes, hn::Set(hn::DFromV<decltype(bytes)>(), 0x80));
}

template <class D, class V>
HWY_INLINE void storePixels(Bgr24, D /*d16*/, const Components<V>& even, const Components<V>& odd,
                            std::uint8_t* to) {
  const hn::Repartition<std::uint8_t, D> d8;
  hn::StoreInterleaved3(bytesInOrder(even.b, odd.b), bytesInOrder(even.g, odd.g), bytesInOrder(even.r, odd.r),
                        d8, to);
}

template <std::size_t kR, std::size_t kG, std::size_t kB, class D, class V>
HWY_INLINE void storePixels(FourBytes<kR, kG, kB>, D d16, const Components<V>& even, const Components<V>& odd,
                            std::uint8_t* to) {
  const hn::Repartition<std::uint8_t, D> d8;
  const std::size_t lanes = hn::Lanes(d8);
  hn::Vec<decltype(d8)> place[4] = {};
  place[kR] = bytesInOrder(even.r, odd.r);
  place[kG] = bytesInOrder(even.g, odd.g);
  place[kB] = bytesInOrder(even.b, odd.b);
  place[6 - kR - kG - kB] = hn::Set(d8, 255);
  const auto front0 = hn::BitCast(d16, InterleaveLower(d8, place[0], place[1]));
  const auto front1 = hn::BitCast(d16, InterleaveUpper(d8, place[0], place[1]));
  const auto back0 = hn::BitCast(d16, InterleaveLower(d8, place[2], place[3]));
  const auto back1 = hn::BitCast(d16, InterleaveUpper(d8, place[2], place[3]));
  hn::StoreU(hn::BitCast(d8, InterleaveLower(d16, front0, back0)), d8, to);
  hn::StoreU(hn::BitCast(d8, InterleaveUpper(d16, front0, back0)), d8, to + lanes);
  hn::StoreU(hn::BitCast(d8, InterleaveLower(d16, front1, back1)), d8, to + 2 * lanes);
  hn::StoreU(hn::BitCast(d8, InterleaveUpper(d16, front1, back1)), d8, to + 3 * lanes);
}

// Interleaving works within blocks of 16 bytes. The layouts above whose blocks it fills with whole pixels
// store vectors and not blocks in the order of the columns; for them the samples are put into this order
// beforehand, which takes fewer steps. kVectors: stored for each vector of bytes.
template <std::size_t kVectors, std::size_t kLanes>
struct BlockOrder {
  alignas(64) std::uint32_t group[kLanes] = {};  // of four bytes
  constexpr BlockOrder() {
    constexpr std::size_t kBlocks = kLanes / 4, kGroups = 4 / kVectors;
    for (std::size_t i = 0; i < kLanes; ++i) {
      const std::size_t block = i / 4, vector = i % 4 / kGroups;
      group[i] = static_cast<std::uint32_t>((vector * kBlocks + block) * kGroups + i % kGroups);
    }
  }
};

template <class Layout, class D>
HWY_INLINE hn::Vec<D> inStoredOrder(Layout, D d, hn::Vec<D> v) {
  const hn::Repartition<std::uint32_t, D> d32;
  constexpr std::size_t kLanes = hn::MaxLanes(d32);
  if constexpr (Layout::kBytes == 3 || kLanes <= 4) {
    return v;
  } else {
    static constexpr BlockOrder<Layout::kBytes, kLanes> kOrder;
    return hn::BitCast(d, TableLookupLanes(hn::BitCast(d32, v), SetTableIndices(d32, kOrder.group)));
  }
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

// All in 16-bit lanes, exact. Half of a sum and of the shift loses nothing: luma and the coefficients of blue
// and green are even, and of red's odd one the half is rounded down as the shift would. What is left,
//   149 (y - 16) + 64 + chroma, 0 to 32767 of it being 0 to 255,
// is moved down by 16384, so that adding saturates far outside of that range only. Doubled, the range is that
// of a 16-bit number, and the saturation is the clamp.
inline constexpr std::int16_t kLumaOffset = 64 - 149 * 16 - 16384;

template <class Chroma, class Layout>
struct RowPair {
  using Lane = std::uint16_t;  // a unit is a block of 2 x 2 pixels
  const std::uint8_t *y0, *y1, *u, *v;
  std::uint8_t *dst0, *dst1;

  template <class D>
  HWY_INLINE void operator()(D, std::size_t i) const {
    const hn::Repartition<std::int16_t, D> d16;
    using V = hn::Vec<decltype(d16)>;
    V cb, cr;
    Chroma::load(d16, u + i * Chroma::kStep, v + i * Chroma::kStep, cb, cr);
    const V middle = hn::Set(d16, 128);
    cb = hn::Sub(inStoredOrder(Layout{}, d16, cb), middle);
    cr = hn::Sub(inStoredOrder(Layout{}, d16, cr), middle);
    const V green = hn::Add(hn::Mul(cb, hn::Set(d16, -50)), hn::Mul(cr, hn::Set(d16, -104)));
    // 409 / 2; and half of blue's, whose range takes two additions.
    const V red = hn::Add(hn::Mul(cr, hn::Set(d16, 204)), hn::ShiftRight<1>(cr));
    const Components<V> chroma{red, green, hn::Mul(cb, hn::Set(d16, 129))};
    row(d16, y0 + 2 * i, chroma, dst0 + 2 * i * Layout::kBytes);
    row(d16, y1 + 2 * i, chroma, dst1 + 2 * i * Layout::kBytes);
  }

  template <class D, class V>
  static HWY_INLINE void row(D d16, const std::uint8_t* y, const Components<V>& chroma, std::uint8_t* to) {
    const hn::Repartition<std::uint8_t, D> d8;
    const hn::RebindToUnsigned<D> du16;
    const auto luma = hn::BitCast(du16, inStoredOrder(Layout{}, d8, hn::LoadU(d8, y)));
    const auto even = components(d16, hn::BitCast(d16, hn::And(luma, hn::Set(du16, 0xFF))), chroma);
    const auto odd = components(d16, hn::BitCast(d16, hn::ShiftRight<8>(luma)), chroma);
    storePixels(Layout{}, du16, even, odd, to);
  }

  template <class D, class V>
  static HWY_INLINE auto components(D d16, V luma, const Components<V>& chroma) {
    const hn::RebindToUnsigned<D> du16;
    const auto doubled = [du16](V x) HWY_ATTR { return hn::BitCast(du16, hn::SaturatedAdd(x, x)); };
    const V sum = hn::Add(hn::Mul(luma, hn::Set(d16, 149)), hn::Set(d16, kLumaOffset));
    return Components<hn::Vec<decltype(du16)>>{
        doubled(hn::SaturatedAdd(sum, chroma.r)), doubled(hn::SaturatedAdd(sum, chroma.g)),
        doubled(hn::SaturatedAdd(hn::SaturatedAdd(sum, chroma.b), chroma.b))};
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
    hn::StoreInterleaved4(b, g, r, hn::Set(d, 255), d, dst + 4 * i);
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
