#include "frames/kernels/scale.h"

#include "frames/kernels/targets.h"

// clang-format off
#undef HWY_TARGET_INCLUDE
#define HWY_TARGET_INCLUDE "frames/kernels/scale.cpp"
#include <hwy/foreach_target.h>
#include <hwy/highway.h>
#include "frames/kernels/run-inl.h"
#include "frames/kernels/averages-inl.h"
#include "frames/kernels/bilinear-inl.h"
// clang-format on

HWY_BEFORE_NAMESPACE();
namespace webrtc::detail::HWY_NAMESPACE {
namespace {
namespace hn = hwy::HWY_NAMESPACE;

// Averages of two neighbours in one row, or of four in two rows.
template <std::size_t kRows>
struct Shrink {
  using Lane = std::uint8_t;  // a unit is a byte of the output
  const std::uint8_t *row0, *row1;
  std::uint8_t* dst;

  template <class D>
  HWY_INLINE void operator()(D d, std::size_t i) const {
    const auto first = average(d, 2 * i);
    const auto second = average(d, 2 * i + hn::Lanes(d));
    hn::StoreU(ConcatEven(d, second, first), d, dst + i);
  }

  template <class D>
  HWY_INLINE hn::Vec<D> average(D d, std::size_t from) const {
    if constexpr (kRows == 1) {
      return hn::BitCast(d, hn::ShiftRight<1>(sumOfPairs(d, row0 + from)));
    } else {
      return hn::BitCast(d,
                         hn::ShiftRight<2>(hn::Add(sumOfPairs(d, row0 + from), sumOfPairs(d, row1 + from))));
    }
  }

  template <class D>
  static HWY_INLINE auto sumOfPairs(D d, const std::uint8_t* from) {
    const hn::Repartition<std::uint16_t, D> d16;
    const auto pairs = hn::BitCast(d16, hn::LoadU(d, from));
    return hn::Add(hn::And(pairs, hn::Set(d16, 0xFF)), hn::ShiftRight<8>(pairs));
  }

  void plain(std::size_t begin, std::size_t end) const {
    for (std::size_t i = begin; i < end; ++i) {
      unsigned sum = static_cast<unsigned>(row0[2 * i]) + row0[2 * i + 1];
      if constexpr (kRows == 2) sum += static_cast<unsigned>(row1[2 * i]) + row1[2 * i + 1];
      dst[i] = static_cast<std::uint8_t>(sum / (2 * kRows));
    }
  }
};

struct Third {
  using Lane = std::uint8_t;  // a unit is a byte of the output
  const std::uint8_t *row0, *row1;
  std::uint8_t* dst;

  template <class D>
  HWY_INLINE void operator()(D d, std::size_t i) const {
    hn::Vec<D> a, b, c, e, unused;
    hn::LoadInterleaved3(d, row0 + 3 * i, a, b, unused);
    hn::LoadInterleaved3(d, row1 + 3 * i, c, e, unused);
    hn::StoreU(averageDown(a, b, c, e), d, dst + i);
  }

  void plain(std::size_t begin, std::size_t end) const {
    for (std::size_t i = begin; i < end; ++i) {
      dst[i] = static_cast<std::uint8_t>((row0[3 * i] + row0[3 * i + 1] + row1[3 * i] + row1[3 * i + 1]) / 4);
    }
  }
};

// One output row: groups of kGroup samples with an average behind each. kInsert: the row between two.
template <std::size_t kGroup, bool kInsert>
struct Expand {
  using Lane = std::uint8_t;  // a unit is a group
  const std::uint8_t *above, *below;
  std::uint8_t* dst;

  template <class D>
  HWY_INLINE void operator()(D d, std::size_t i) const {
    hn::Vec<D> first, last, next;
    load(d, above + kGroup * i, first, last, next);
    hn::Vec<D> inserted = averageDown(last, next);
    if constexpr (kInsert) {
      hn::Vec<D> firstBelow, lastBelow, nextBelow;
      load(d, below + kGroup * i, firstBelow, lastBelow, nextBelow);
      inserted = averageDown(last, next, lastBelow, nextBelow);
      first = averageDown(first, firstBelow);
      last = averageDown(last, lastBelow);
    }
    if constexpr (kGroup == 1) {
      hn::StoreInterleaved2(first, inserted, d, dst + 2 * i);
    } else {
      hn::StoreInterleaved3(first, last, inserted, d, dst + 3 * i);
    }
  }

  // The first and last sample of each group, and the first of the next.
  template <class D, class V>
  static HWY_INLINE void load(D d, const std::uint8_t* from, V& first, V& last, V& next) {
    if constexpr (kGroup == 1) {
      first = last = hn::LoadU(d, from);
      next = hn::LoadU(d, from + 1);
    } else {
      V unused;
      hn::LoadInterleaved2(d, from, first, last);
      hn::LoadInterleaved2(d, from + 2, next, unused);
    }
  }

  void plain(std::size_t begin, std::size_t end) const {
    for (std::size_t i = begin; i < end; ++i) {
      const std::uint8_t *a = above + kGroup * i, *b = (kInsert ? below : above) + kGroup * i;
      std::uint8_t* to = dst + (kGroup + 1) * i;
      for (std::size_t k = 0; k < kGroup; ++k) to[k] = static_cast<std::uint8_t>((a[k] + b[k]) / 2);
      const int sum = a[kGroup - 1] + a[kGroup] + b[kGroup - 1] + b[kGroup];
      to[kGroup] = static_cast<std::uint8_t>(sum / 4);
    }
  }
};

void halve(const std::uint8_t* src, std::uint8_t* dst, std::size_t n) {
  runInPlace(Shrink<1>{src, nullptr, dst}, n);
}

void quarter(const std::uint8_t* row0, const std::uint8_t* row1, std::uint8_t* dst, std::size_t n) {
  runInPlace(Shrink<2>{row0, row1, dst}, n);
}

void third(const std::uint8_t* row0, const std::uint8_t* row1, std::uint8_t* dst, std::size_t n) {
  runInPlace(Third{row0, row1, dst}, n);
}

#if HWY_TARGET != HWY_SCALAR

// Doubles the bytes from i on, i + Lanes(d) being the end, while there is a byte before them. Output lies
// behind all input that is still needed, but over the vectors just loaded.
template <class D>
HWY_INLINE std::size_t doubleWhole(D d, std::uint8_t* buffer, std::size_t end) {
  for (; end > hn::Lanes(d); end -= hn::Lanes(d)) {
    const std::size_t i = end - hn::Lanes(d);
    const auto samples = hn::LoadU(d, buffer + i);
    const auto before = hn::LoadU(d, buffer + i - 1);
    hn::StoreInterleaved2(averageDown(before, samples), samples, d, buffer + 2 * i);
  }
  return end;
}

#endif

void doubleInPlace(std::uint8_t* buffer, std::size_t n) {
  if (n == 0) return;
#if HWY_TARGET != HWY_SCALAR
  n = doubleWhole(hn::ScalableTag<std::uint8_t>(), buffer, n);
  n = doubleWhole(hn::Full128<std::uint8_t>(), buffer, n);
#endif
  for (std::size_t i = n - 1; i > 0; --i) {
    const std::uint8_t sample = buffer[i];
    buffer[2 * i] = static_cast<std::uint8_t>((buffer[i - 1] + sample) / 2);
    buffer[2 * i + 1] = sample;
  }
  buffer[1] = buffer[0];
}

template <std::size_t kGroup>
void expandKeep(const std::uint8_t* src, std::uint8_t* dst, std::size_t n) {
  run(Expand<kGroup, false>{src, nullptr, dst}, n);
}

template <std::size_t kGroup>
void expandInsert(const std::uint8_t* above, const std::uint8_t* below, std::uint8_t* dst, std::size_t n) {
  run(Expand<kGroup, true>{above, below, dst}, n);
}

void blend(const std::uint8_t* row0, const std::uint8_t* row1, unsigned fraction, std::uint8_t* dst,
           std::size_t n) {
  if (fraction == 128) {
    run(BlendHalves{row0, row1, dst}, n);
  } else {
    run(Blend{row0, row1, static_cast<std::uint16_t>(fraction), dst}, n);
  }
}

// Forward only: windows are those of whole groups of columns.
template <bool kNear>
void resample(const std::uint8_t* src, const ResamplePlan& plan, std::uint8_t* dst, std::size_t n) {
  runInPlace(Resample<kNear>{src, plan, dst}, n);
}

void resampleToHalf(const std::uint8_t* src, const ResamplePlan& /*plan*/, std::uint8_t* dst, std::size_t n) {
  run(ResampleToHalf{src, dst}, n);
}

void resampleToTwice(const std::uint8_t* src, const ResamplePlan& /*plan*/, std::uint8_t* dst,
                     std::size_t n) {
  run(ResampleToTwice{src, dst}, n / 2);
}

}  // namespace

const ScaleKernels& scaleTable() {
  static constexpr ScaleKernels kTable = {
      .halve = halve,
      .quarter = quarter,
      .third = third,
      .doubleInPlace = doubleInPlace,
      .byThreeHalves = {.keep = expandKeep<2>, .insert = expandInsert<2>},
      .byTwo = {.keep = expandKeep<1>, .insert = expandInsert<1>},
      .blend = blend,
      .resampleNear = resample<true>,
      .resampleFar = resample<false>,
      .resampleToHalf = resampleToHalf,
      .resampleToTwice = resampleToTwice,
  };
  return kTable;
}

}  // namespace webrtc::detail::HWY_NAMESPACE
HWY_AFTER_NAMESPACE();

#if HWY_ONCE
namespace webrtc::detail {

HWY_EXPORT(scaleTable);

const ScaleKernels& scaleKernels() {
  return HWY_DYNAMIC_DISPATCH(scaleTable)();
}

}  // namespace webrtc::detail
#endif
