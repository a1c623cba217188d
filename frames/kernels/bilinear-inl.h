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
#include <cstring>

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

// kNear: eight neighbouring outputs take their samples from 16 bytes that lie together, so one byte look-up
// fetches them. Otherwise they are collected one by one.
template <bool kNear>
struct Resample {
  using Lane = std::uint16_t;  // a unit is a byte of the output
  const std::uint8_t* src;
  const std::uint16_t *at, *fraction;
  std::uint8_t* dst;

  template <class D>
  HWY_INLINE void operator()(D d, std::size_t i) const {
    const hn::Rebind<std::uint8_t, D> half;
    const hn::RebindToSigned<D> di;
    const auto pairs = samples(d, i);
    const auto left = hn::And(pairs, hn::Set(d, 0xFF));
    const auto weight = hn::LoadU(d, fraction + i);
    // With step = right - left, the sum is left * 65536 + step * weight - left.
    const auto step = hn::Sub(hn::ShiftRight<8>(pairs), left);
    const auto negative = hn::BitCast(d, hn::ShiftRight<15>(hn::BitCast(di, step)));
    const auto high = hn::Sub(hn::MulHigh(step, weight), hn::And(weight, negative));
    const auto borrow = hn::Min(hn::SaturatedSub(left, hn::Mul(step, weight)), hn::Set(d, 1));
    const auto result = hn::Sub(hn::Add(left, high), borrow);
    hn::StoreU(hn::DemoteTo(half, hn::BitCast(di, result)), half, dst + i);
  }

  // Each lane: the left sample in the low byte, the right one in the high byte.
  template <class D>
  HWY_INLINE hn::Vec<D> samples(D d, std::size_t i) const {
    const hn::Repartition<std::uint8_t, D> d8;
    if constexpr (kNear) {
      alignas(16) static constexpr std::uint8_t kFirstLane[16] = {0, 1, 0, 1, 0, 1, 0, 1,
                                                                  0, 1, 0, 1, 0, 1, 0, 1};
      const auto positions = hn::LoadU(d, at + i);
      const auto first = hn::TableLookupBytes(positions, LoadDup128(d8, kFirstLane));
      const auto offset = hn::Sub(positions, hn::BitCast(d, first));
      const auto lookUp = hn::Add(hn::Mul(offset, hn::Set(d, 0x0101)), hn::Set(d, 0x0100));
      return hn::BitCast(d, hn::TableLookupBytes(windows(d8, at + i), hn::BitCast(d8, lookUp)));
    } else {
      alignas(64) std::uint8_t collected[hn::MaxLanes(D()) * 2];
      for (std::size_t k = 0; k < hn::MaxLanes(D()); ++k) std::memcpy(collected + 2 * k, src + at[i + k], 2);
      return hn::BitCast(d, hn::Load(d8, collected));
    }
  }

  // Block k: the 16 bytes from the position of output 8 * k on.
  template <class D8>
  HWY_INLINE hn::Vec<D8> windows(D8 d8, const std::uint16_t* positions) const {
    if constexpr (hn::MaxLanes(D8()) <= 16) {
      return hn::LoadU(d8, src + positions[0]);
    } else {
      const hn::Half<D8> half;
      return Combine(d8, windows(half, positions + hn::MaxLanes(half) / 2), windows(half, positions));
    }
  }

  void plain(std::size_t begin, std::size_t end) const {
    for (std::size_t i = begin; i < end; ++i) {
      const std::uint32_t right = fraction[i], left = 65535 - right;
      dst[i] = static_cast<std::uint8_t>((src[at[i] + 1] * right + src[at[i]] * left) / 65536);
    }
  }
};

}  // namespace
}  // namespace webrtc::detail::HWY_NAMESPACE
HWY_AFTER_NAMESPACE();

#endif
