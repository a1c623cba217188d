#include "bench/frames/measure.h"

// clang-format off
#undef HWY_TARGET_INCLUDE
#define HWY_TARGET_INCLUDE "bench/frames/limit.cpp"
#include <hwy/foreach_target.h>
#include <hwy/highway.h>
// clang-format on

HWY_BEFORE_NAMESPACE();
namespace bench::HWY_NAMESPACE {
namespace {
namespace hn = hwy::HWY_NAMESPACE;

void copy(const std::uint8_t* src, std::uint8_t* dst, std::size_t bytes) {
  const hn::ScalableTag<std::uint8_t> d;
  std::size_t i = 0;
  for (; i + hn::Lanes(d) <= bytes; i += hn::Lanes(d)) hn::StoreU(hn::LoadU(d, src + i), d, dst + i);
  for (; i < bytes; ++i) dst[i] = src[i];
}

}  // namespace
}  // namespace bench::HWY_NAMESPACE
HWY_AFTER_NAMESPACE();

#if HWY_ONCE
namespace bench {

HWY_EXPORT(copy);

void copyByVectors(const std::uint8_t* src, std::uint8_t* dst, std::size_t bytes) {
  HWY_DYNAMIC_DISPATCH(copy)(src, dst, bytes);
}

}  // namespace bench
#endif
