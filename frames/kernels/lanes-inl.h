// Bytes in lanes of 16 bits, times 256 or in the upper half. Compiled once per instruction set.
#if defined(OMXBRIDGE_FRAMES_KERNELS_LANES_INL) == defined(HWY_TARGET_TOGGLE)
#ifdef OMXBRIDGE_FRAMES_KERNELS_LANES_INL
#undef OMXBRIDGE_FRAMES_KERNELS_LANES_INL
#else
#define OMXBRIDGE_FRAMES_KERNELS_LANES_INL
#endif

#include <hwy/highway.h>

#include <cstddef>
#include <cstdint>

HWY_BEFORE_NAMESPACE();
namespace webrtc::detail::HWY_NAMESPACE {
namespace hn = hwy::HWY_NAMESPACE;

// The even and the odd bytes of a vector, times 256. d: of 16 bits without a sign, as all below.
template <class D, class V>
HWY_INLINE hn::Vec<D> evenBytes(D d, V bytes) {
  return hn::ShiftLeft<8>(hn::BitCast(d, bytes));
}
template <class D, class V>
HWY_INLINE hn::Vec<D> oddBytes(D d, V bytes) {
  return hn::And(hn::BitCast(d, bytes), hn::Set(d, 0xFF00));
}

// kFactor, below 256, times the byte of which each lane of v is 256 times. The high half of the product of
// two multiples of 256: compilers replace a plain product with a constant by shifts and additions, and there
// are too many products here for that to be faster.
template <unsigned kFactor, class V>
HWY_INLINE V times(V v) {
  return hn::MulHigh(v, hn::Set(hn::DFromV<V>(), static_cast<std::uint16_t>(kFactor * 256)));
}

// Bytes in the order of memory from the upper bytes of lanes.
template <class V>
HWY_INLINE auto upperBytes(V even, V odd) {
  const hn::DFromV<V> d;
  const hn::Repartition<std::uint8_t, decltype(d)> d8;
  return hn::BitCast(d8, hn::OrAnd(hn::ShiftRight<8>(even), odd, hn::Set(d, 0xFF00)));
}

}  // namespace webrtc::detail::HWY_NAMESPACE
HWY_AFTER_NAMESPACE();

#endif
