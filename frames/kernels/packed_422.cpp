#include "frames/kernels/packed_422.h"

#include "frames/kernels/targets.h"

// clang-format off
#undef HWY_TARGET_INCLUDE
#define HWY_TARGET_INCLUDE "frames/kernels/packed_422.cpp"
#include <hwy/foreach_target.h>
#include <hwy/highway.h>
#include "frames/kernels/run-inl.h"
#include "frames/kernels/averages-inl.h"
// clang-format on

HWY_BEFORE_NAMESPACE();
namespace webrtc::detail::HWY_NAMESPACE {
namespace {
namespace hn = hwy::HWY_NAMESPACE;

// The two byte orders: where luma and chroma stand in each pair of bytes.
struct Yuy2 {
  static constexpr std::size_t kLuma = 0, kChroma = 1;
};
struct Uyvy {
  static constexpr std::size_t kLuma = 1, kChroma = 0;
};

template <class Order>
struct Pack {
  using Lane = std::uint16_t;  // a unit is a pair of pixels
  const std::uint8_t *y, *u, *v;
  std::uint8_t* dst;

  template <class D>
  HWY_INLINE void operator()(D d16, std::size_t i) const {
    const hn::Repartition<std::uint8_t, D> d8;
    const hn::Rebind<std::uint8_t, D> half;
    const auto cb = hn::PromoteTo(d16, hn::LoadU(half, u + i));
    const auto cr = hn::PromoteTo(d16, hn::LoadU(half, v + i));
    const auto chroma = hn::BitCast(d8, hn::Or(cb, hn::ShiftLeft<8>(cr)));
    const auto luma = hn::LoadU(d8, y + 2 * i);
    if constexpr (Order::kLuma == 0) {
      hn::StoreInterleaved2(luma, chroma, d8, dst + 4 * i);
    } else {
      hn::StoreInterleaved2(chroma, luma, d8, dst + 4 * i);
    }
  }

  void plain(std::size_t begin, std::size_t end) const {
    for (std::size_t i = begin; i < end; ++i) {
      dst[4 * i + Order::kLuma] = y[2 * i];
      dst[4 * i + Order::kChroma] = u[i];
      dst[4 * i + 2 + Order::kLuma] = y[2 * i + 1];
      dst[4 * i + 2 + Order::kChroma] = v[i];
    }
  }
};

enum class Take { kLuma, kLumaOfTwo, kLumaAndChroma, kLumaAndChromaOfTwo };

template <class Order, Take kTake>
struct Unpack {
  using Lane = std::uint8_t;  // a unit is a pair of pixels
  static constexpr bool kHasChroma = kTake == Take::kLumaAndChroma || kTake == Take::kLumaAndChromaOfTwo;
  const std::uint8_t *src, *other;
  std::uint8_t *y, *u, *v;

  template <class D>
  HWY_INLINE void operator()(D d, std::size_t i) const {
    const std::size_t lanes = hn::Lanes(d);
    hn::Vec<D> luma0, luma1, chroma0, chroma1;
    load(d, src + 4 * i, luma0, chroma0);
    load(d, src + 4 * i + 2 * lanes, luma1, chroma1);
    if constexpr (kTake == Take::kLumaOfTwo || kTake == Take::kLumaAndChromaOfTwo) {
      hn::Vec<D> otherLuma0, otherLuma1, otherChroma0, otherChroma1;
      load(d, other + 4 * i, otherLuma0, otherChroma0);
      load(d, other + 4 * i + 2 * lanes, otherLuma1, otherChroma1);
      if constexpr (kTake == Take::kLumaOfTwo) {
        luma0 = averageDown(luma0, otherLuma0);
        luma1 = averageDown(luma1, otherLuma1);
      } else {
        chroma0 = hn::AverageRound(chroma0, otherChroma0);
        chroma1 = hn::AverageRound(chroma1, otherChroma1);
      }
    }
    hn::StoreU(luma0, d, y + 2 * i);
    hn::StoreU(luma1, d, y + 2 * i + lanes);
    if constexpr (kHasChroma) {
      hn::StoreU(ConcatEven(d, chroma1, chroma0), d, u + i);
      hn::StoreU(ConcatOdd(d, chroma1, chroma0), d, v + i);
    }
  }

  template <class D, class V>
  static HWY_INLINE void load(D d, const std::uint8_t* from, V& luma, V& chroma) {
    if constexpr (Order::kLuma == 0) {
      hn::LoadInterleaved2(d, from, luma, chroma);
    } else {
      hn::LoadInterleaved2(d, from, chroma, luma);
    }
  }

  void plain(std::size_t begin, std::size_t end) const {
    for (std::size_t i = begin; i < end; ++i) {
      const std::uint8_t* group = src + 4 * i;
      const std::uint8_t* second = other == nullptr ? group : other + 4 * i;
      for (std::size_t k = 0; k < 2; ++k) {
        const int sum = group[2 * k + Order::kLuma] + second[2 * k + Order::kLuma];
        y[2 * i + k] =
            kTake == Take::kLumaOfTwo ? static_cast<std::uint8_t>(sum / 2) : group[2 * k + Order::kLuma];
      }
      if constexpr (kHasChroma) {
        u[i] = static_cast<std::uint8_t>((group[Order::kChroma] + second[Order::kChroma] + 1) / 2);
        v[i] = static_cast<std::uint8_t>((group[2 + Order::kChroma] + second[2 + Order::kChroma] + 1) / 2);
      }
    }
  }
};

template <class Order>
void pack(const std::uint8_t* y, const std::uint8_t* u, const std::uint8_t* v, std::uint8_t* dst,
          std::size_t pairs) {
  run(Pack<Order>{y, u, v, dst}, pairs);
}

template <class Order>
void luma(const std::uint8_t* src, std::uint8_t* y, std::size_t pairs) {
  run(Unpack<Order, Take::kLuma>{src, nullptr, y, nullptr, nullptr}, pairs);
}

template <class Order>
void lumaOfTwo(const std::uint8_t* src, const std::uint8_t* other, std::uint8_t* y, std::size_t pairs) {
  run(Unpack<Order, Take::kLumaOfTwo>{src, other, y, nullptr, nullptr}, pairs);
}

template <class Order>
void lumaAndChroma(const std::uint8_t* src, std::uint8_t* y, std::uint8_t* u, std::uint8_t* v,
                   std::size_t pairs) {
  run(Unpack<Order, Take::kLumaAndChroma>{src, nullptr, y, u, v}, pairs);
}

template <class Order>
void lumaAndChromaOfTwo(const std::uint8_t* src, const std::uint8_t* other, std::uint8_t* y, std::uint8_t* u,
                        std::uint8_t* v, std::size_t pairs) {
  run(Unpack<Order, Take::kLumaAndChromaOfTwo>{src, other, y, u, v}, pairs);
}

template <class Order>
constexpr Packed422Rows rows() {
  return {.pack = pack<Order>,
          .luma = luma<Order>,
          .lumaOfTwo = lumaOfTwo<Order>,
          .lumaAndChroma = lumaAndChroma<Order>,
          .lumaAndChromaOfTwo = lumaAndChromaOfTwo<Order>};
}

}  // namespace

const Packed422Kernels& packed422Table() {
  static constexpr Packed422Kernels kTable = {.yuy2 = rows<Yuy2>(), .uyvy = rows<Uyvy>()};
  return kTable;
}

}  // namespace webrtc::detail::HWY_NAMESPACE
HWY_AFTER_NAMESPACE();

#if HWY_ONCE
namespace webrtc::detail {

HWY_EXPORT(packed422Table);

const Packed422Kernels& packed422Kernels() {
  return HWY_DYNAMIC_DISPATCH(packed422Table)();
}

}  // namespace webrtc::detail
#endif
