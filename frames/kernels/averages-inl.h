// Averages of bytes, rounded down, over whole vectors. Compiled once per instruction set.
#if defined(OMXBRIDGE_FRAMES_KERNELS_AVERAGES_INL) == defined(HWY_TARGET_TOGGLE)
#ifdef OMXBRIDGE_FRAMES_KERNELS_AVERAGES_INL
#undef OMXBRIDGE_FRAMES_KERNELS_AVERAGES_INL
#else
#define OMXBRIDGE_FRAMES_KERNELS_AVERAGES_INL
#endif

#include <hwy/highway.h>

#include <cstddef>
#include <cstdint>

HWY_BEFORE_NAMESPACE();
namespace webrtc::detail::HWY_NAMESPACE {
namespace hn = hwy::HWY_NAMESPACE;

template <class V>
HWY_INLINE V averageDown(V a, V b) {
  return hn::Add(hn::And(a, b), hn::ShiftRight<1>(hn::Xor(a, b)));
}

// In one step: the average of two averages would lose another half.
template <class V>
HWY_INLINE V averageDown(V a, V b, V c, V e) {
  const hn::DFromV<V> d8;
  const hn::Repartition<std::uint16_t, decltype(d8)> d16;
  const auto low = hn::Set(d16, 0xFF);
  const auto even = [&](V v) HWY_ATTR { return hn::And(hn::BitCast(d16, v), low); };
  const auto odd = [&](V v) HWY_ATTR { return hn::ShiftRight<8>(hn::BitCast(d16, v)); };
  const auto evenSum = hn::Add(hn::Add(even(a), even(b)), hn::Add(even(c), even(e)));
  const auto oddSum = hn::Add(hn::Add(odd(a), odd(b)), hn::Add(odd(c), odd(e)));
  return hn::BitCast(d8, hn::Or(hn::ShiftRight<2>(evenSum), hn::AndNot(low, hn::ShiftLeft<6>(oddSum))));
}

}  // namespace webrtc::detail::HWY_NAMESPACE
HWY_AFTER_NAMESPACE();

#endif
