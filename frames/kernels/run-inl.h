// Drives a kernel over a row: whole vectors while they fit, one more that ends at the row's end and overlaps
// the last, and the kernel's plain code for rows shorter than 128 bits.
//
// A kernel is a small object holding the row's pointers, with
//   using Lane                            uint8_t or uint16_t: one lane stands for one unit of the row
//   template <class D> void operator()(D d, size_t i) const     units i to i + Lanes(d) - 1
//   void plain(size_t begin, size_t end) const                  the same in plain C++
// Compiled once per instruction set, so no guard but Highway's.
#if defined(OMXBRIDGE_FRAMES_KERNELS_RUN_INL) == defined(HWY_TARGET_TOGGLE)
#ifdef OMXBRIDGE_FRAMES_KERNELS_RUN_INL
#undef OMXBRIDGE_FRAMES_KERNELS_RUN_INL
#else
#define OMXBRIDGE_FRAMES_KERNELS_RUN_INL
#endif

#include <hwy/highway.h>

#include <cstddef>
#include <cstdint>

HWY_BEFORE_NAMESPACE();
namespace webrtc::detail::HWY_NAMESPACE {
namespace hn = hwy::HWY_NAMESPACE;

#if HWY_TARGET == HWY_SCALAR

template <class Kernel>
void run(const Kernel& kernel, std::size_t n) {
  kernel.plain(0, n);
}

template <class Kernel>
void runInPlace(const Kernel& kernel, std::size_t n) {
  kernel.plain(0, n);
}

#else

template <class D, class Kernel>
HWY_INLINE std::size_t runWhole(D d, const Kernel& kernel, std::size_t i, std::size_t n) {
  for (; i + hn::Lanes(d) <= n; i += hn::Lanes(d)) kernel(d, i);
  return i;
}

template <class Kernel>
void run(const Kernel& kernel, std::size_t n) {
  const hn::ScalableTag<typename Kernel::Lane> wide;
  const hn::CappedTag<typename Kernel::Lane, 16 / sizeof(typename Kernel::Lane)> narrow;
  if (n >= hn::Lanes(wide)) {
    if (runWhole(wide, kernel, 0, n) != n) kernel(wide, n - hn::Lanes(wide));
  } else if (n >= hn::Lanes(narrow)) {
    if (runWhole(narrow, kernel, 0, n) != n) kernel(narrow, n - hn::Lanes(narrow));
  } else {
    kernel.plain(0, n);
  }
}

// For kernels whose output overwrites their input from the front: never returns to units already done.
template <class Kernel>
void runInPlace(const Kernel& kernel, std::size_t n) {
  const hn::ScalableTag<typename Kernel::Lane> wide;
  const hn::CappedTag<typename Kernel::Lane, 16 / sizeof(typename Kernel::Lane)> narrow;
  const std::size_t i = runWhole(narrow, kernel, runWhole(wide, kernel, 0, n), n);
  kernel.plain(i, n);
}

#endif

}  // namespace webrtc::detail::HWY_NAMESPACE
HWY_AFTER_NAMESPACE();

#endif
