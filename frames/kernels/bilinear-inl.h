// The two steps of bilinear scaling as kernels (see run-inl.h): blending rows and resampling a row.
// Compiled once per instruction set.
#if defined(OMXBRIDGE_FRAMES_KERNELS_BILINEAR_INL) == defined(HWY_TARGET_TOGGLE)
#ifdef OMXBRIDGE_FRAMES_KERNELS_BILINEAR_INL
#undef OMXBRIDGE_FRAMES_KERNELS_BILINEAR_INL
#else
#define OMXBRIDGE_FRAMES_KERNELS_BILINEAR_INL
#endif

#include <hwy/highway.h>

#include <cstddef>
#include <cstdint>

HWY_BEFORE_NAMESPACE();
namespace webrtc::detail::HWY_NAMESPACE {
namespace {
namespace hn = hwy::HWY_NAMESPACE;

struct Blend {
  using Lane = std::uint8_t;
  const std::uint8_t *row0, *row1;
  std::uint16_t fraction;
  std::uint8_t* dst;

  template <class D>
  HWY_INLINE void operator()(D d, std::size_t i) const {
    const hn::Repartition<std::uint16_t, D> d16;
    const auto low = hn::Set(d16, 0xFF);
    const auto weight = hn::Set(d16, fraction);
    const auto a = hn::BitCast(d16, hn::LoadU(d, row0 + i));
    const auto b = hn::BitCast(d16, hn::LoadU(d, row1 + i));
    // a * 256 + (b - a) * weight is the weighted sum and fits 16 bits, so that wrapping before does not
    // matter.
    const auto aOdd = hn::ShiftRight<8>(a);
    const auto evenStep = hn::Mul(hn::Sub(hn::And(b, low), hn::And(a, low)), weight);
    const auto oddStep = hn::Mul(hn::Sub(hn::ShiftRight<8>(b), aOdd), weight);
    const auto even = hn::Add(hn::ShiftLeft<8>(a), evenStep);
    const auto odd = hn::Add(hn::AndNot(low, a), oddStep);
    hn::StoreU(hn::BitCast(d, hn::Or(hn::ShiftRight<8>(even), hn::AndNot(low, odd))), d, dst + i);
  }

  void plain(std::size_t begin, std::size_t end) const {
    for (std::size_t i = begin; i < end; ++i) {
      dst[i] = static_cast<std::uint8_t>((row1[i] * fraction + row0[i] * (256 - fraction)) / 256);
    }
  }
};

// The same with a fraction of 128.
struct BlendHalves {
  using Lane = std::uint8_t;
  const std::uint8_t *row0, *row1;
  std::uint8_t* dst;

  template <class D>
  HWY_INLINE void operator()(D d, std::size_t i) const {
    hn::StoreU(averageDown(hn::LoadU(d, row0 + i), hn::LoadU(d, row1 + i)), d, dst + i);
  }

  void plain(std::size_t begin, std::size_t end) const {
    for (std::size_t i = begin; i < end; ++i) dst[i] = static_cast<std::uint8_t>((row0[i] + row1[i]) / 2);
  }
};

// kNear: one byte look-up in the 16 bytes of a window fetches what its eight columns need. Otherwise the
// samples are collected one by one.
template <bool kNear>
struct Resample {
  using Lane = std::uint8_t;
  const std::uint8_t* src;
  ResamplePlan plan;
  std::uint8_t* dst;

  template <class D>
  HWY_INLINE void operator()(D d, std::size_t i) const {
    const hn::Repartition<std::uint16_t, D> d16;
    const auto first = hn::BitCast(d, columns(d16, i));
    const auto second = hn::BitCast(d, columns(d16, i + hn::Lanes(d16)));
    hn::StoreU(ConcatEven(d, second, first), d, dst + i);
  }

  template <class D>
  HWY_INLINE hn::Vec<D> columns(D d16, std::size_t i) const {
    const hn::RebindToSigned<D> di16;
    const auto pairs = samples(d16, i);
    const auto closer = hn::And(pairs, hn::Set(d16, 0xFF));
    const auto weight = hn::LoadU(d16, plan.weight + i);
    // With step = other - closer, the sum is closer * 65536 + step * weight - closer. Neither factor reaches
    // the sign's bit, so the high half of the product is rounded down as the sum's is; subtracting the last
    // term borrows from it where the low half is smaller.
    const auto step = hn::Sub(hn::ShiftRight<8>(pairs), closer);
    const auto high = hn::BitCast(d16, hn::MulHigh(hn::BitCast(di16, step), hn::BitCast(di16, weight)));
    const auto borrow = hn::Min(hn::SaturatedSub(closer, hn::Mul(step, weight)), hn::Set(d16, 1));
    return hn::Sub(hn::Add(closer, high), borrow);
  }

  // Each lane: the closer sample in the low byte, the other one in the high byte.
  template <class D>
  HWY_INLINE hn::Vec<D> samples(D d16, std::size_t i) const {
    const hn::Repartition<std::uint8_t, D> d8;
    if constexpr (kNear) {
      const auto pick = hn::BitCast(d8, hn::LoadU(d16, plan.pick + i));
      return hn::BitCast(d16, hn::TableLookupBytes(windows(d8, plan.window + i), pick));
    } else {
      alignas(64) std::uint8_t collected[hn::MaxLanes(d8)];
      for (std::size_t k = 0; k < hn::MaxLanes(d16); ++k) {
        collected[2 * k] = closerAt(i + k);
        collected[2 * k + 1] = otherAt(i + k);
      }
      return hn::BitCast(d16, hn::Load(d8, collected));
    }
  }

  // Block k: the window of columns 8 * k to 8 * k + 7.
  template <class D8>
  HWY_INLINE hn::Vec<D8> windows(D8 d8, const std::uint16_t* window) const {
    if constexpr (hn::MaxLanes(D8()) <= 16) {
      return hn::LoadU(d8, src + window[0]);
    } else {
      const hn::Half<D8> half;
      return Combine(d8, windows(half, window + hn::MaxLanes(half) / 2), windows(half, window));
    }
  }

  HWY_INLINE std::uint8_t closerAt(std::size_t i) const {
    return src[plan.window[i] + (plan.pick[i] & 0xFF)];
  }
  HWY_INLINE std::uint8_t otherAt(std::size_t i) const { return src[plan.window[i] + (plan.pick[i] >> 8)]; }

  void plain(std::size_t begin, std::size_t end) const {
    for (std::size_t i = begin; i < end; ++i) {
      const std::uint32_t other = plan.weight[i], closer = 65535 - other;
      dst[i] = static_cast<std::uint8_t>((otherAt(i) * other + closerAt(i) * closer) / 65536);
    }
  }
};

// The two ratios for which nothing but 0 and one half comes up as a fraction: the closer sample's 65535 /
// 65536 are the sample less one, unless that is 0, and averages are those of two such bytes.

struct ResampleToHalf {
  using Lane = std::uint8_t;  // a unit is a byte of the output
  const std::uint8_t* src;
  std::uint8_t* dst;

  template <class D>
  HWY_INLINE void operator()(D d, std::size_t i) const {
    const auto first = hn::LoadU(d, src + 2 * i), second = hn::LoadU(d, src + 2 * i + hn::Lanes(d));
    hn::StoreU(hn::SaturatedSub(ConcatEven(d, second, first), hn::Set(d, 1)), d, dst + i);
  }

  void plain(std::size_t begin, std::size_t end) const {
    for (std::size_t i = begin; i < end; ++i) dst[i] = lessOne(src[2 * i]);
  }

  static std::uint8_t lessOne(std::uint8_t sample) {
    return static_cast<std::uint8_t>(sample - (sample != 0 ? 1 : 0));
  }
};

struct ResampleToTwice {
  using Lane = std::uint8_t;  // a unit is a byte of the input
  const std::uint8_t* src;
  std::uint8_t* dst;

  template <class D>
  HWY_INLINE void operator()(D d, std::size_t i) const {
    const auto left = hn::SaturatedSub(hn::LoadU(d, src + i), hn::Set(d, 1));
    hn::StoreInterleaved2(left, averageDown(left, hn::LoadU(d, src + i + 1)), d, dst + 2 * i);
  }

  void plain(std::size_t begin, std::size_t end) const {
    for (std::size_t i = begin; i < end; ++i) {
      dst[2 * i] = ResampleToHalf::lessOne(src[i]);
      dst[2 * i + 1] = static_cast<std::uint8_t>((dst[2 * i] + src[i + 1]) / 2);
    }
  }
};

}  // namespace
}  // namespace webrtc::detail::HWY_NAMESPACE
HWY_AFTER_NAMESPACE();

#endif
