// Vectors put together from blocks of 16 bytes that lie apart in memory. Compiled once per instruction set.
#if defined(OMXBRIDGE_FRAMES_KERNELS_BLOCKS_INL) == defined(HWY_TARGET_TOGGLE)
#ifdef OMXBRIDGE_FRAMES_KERNELS_BLOCKS_INL
#undef OMXBRIDGE_FRAMES_KERNELS_BLOCKS_INL
#else
#define OMXBRIDGE_FRAMES_KERNELS_BLOCKS_INL
#endif

#include <hwy/highway.h>

#include <cstddef>
#include <cstdint>

HWY_BEFORE_NAMESPACE();
namespace webrtc::detail::HWY_NAMESPACE {
namespace hn = hwy::HWY_NAMESPACE;

#if HWY_TARGET != HWY_SCALAR

// Block k is load(Full128 tag, from + k * distance).
template <class D, class Load>
HWY_INLINE hn::Vec<D> loadBlocks(D d, const Load& load, const std::uint8_t* from, std::ptrdiff_t distance) {
  if constexpr (hn::MaxLanes(D()) == 16) {
    return load(d, from);
  } else {
    const hn::Half<D> half;
    constexpr auto kBlocks = static_cast<std::ptrdiff_t>(hn::MaxLanes(half) / 16);
    return hn::Combine(d, loadBlocks(half, load, from + kBlocks * distance, distance),
                       loadBlocks(half, load, from, distance));
  }
}

#endif

}  // namespace webrtc::detail::HWY_NAMESPACE
HWY_AFTER_NAMESPACE();

#endif
