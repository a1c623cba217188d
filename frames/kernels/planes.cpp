#include "frames/kernels/planes.h"

#include "frames/kernels/targets.h"

// clang-format off
#undef HWY_TARGET_INCLUDE
#define HWY_TARGET_INCLUDE "frames/kernels/planes.cpp"
#include <hwy/foreach_target.h>
#include <hwy/cache_control.h>
#include <hwy/highway.h>
#include "frames/kernels/run-inl.h"
#include "frames/kernels/blocks-inl.h"
// clang-format on

HWY_BEFORE_NAMESPACE();
namespace webrtc::detail::HWY_NAMESPACE {
namespace {
namespace hn = hwy::HWY_NAMESPACE;

struct Interleave {
  using Lane = std::uint8_t;  // a unit is a pair of bytes
  const std::uint8_t *first, *second;
  std::uint8_t* dst;

  template <class D>
  HWY_INLINE void operator()(D d, std::size_t i) const {
    hn::StoreInterleaved2(hn::LoadU(d, first + i), hn::LoadU(d, second + i), d, dst + 2 * i);
  }

  void plain(std::size_t begin, std::size_t end) const {
    for (std::size_t i = begin; i < end; ++i) {
      dst[2 * i] = first[i];
      dst[2 * i + 1] = second[i];
    }
  }
};

struct Split {
  using Lane = std::uint8_t;  // a unit is a pair of bytes
  const std::uint8_t* src;
  std::uint8_t *first, *second;

  template <class D>
  HWY_INLINE void operator()(D d, std::size_t i) const {
    hn::Vec<D> a, b;
    hn::LoadInterleaved2(d, src + 2 * i, a, b);
    hn::StoreU(a, d, first + i);
    hn::StoreU(b, d, second + i);
  }

  void plain(std::size_t begin, std::size_t end) const {
    for (std::size_t i = begin; i < end; ++i) {
      first[i] = src[2 * i];
      second[i] = src[2 * i + 1];
    }
  }
};

template <class D>
HWY_INLINE hn::Vec<D> reversed(D d, hn::Vec<D> v) {
  alignas(16) static constexpr std::uint8_t kLastFirst[16] = {15, 14, 13, 12, 11, 10, 9, 8,
                                                              7,  6,  5,  4,  3,  2,  1, 0};
  return hn::ReverseBlocks(d, hn::TableLookupBytes(v, LoadDup128(d, kLastFirst)));
}

struct Reverse {
  using Lane = std::uint8_t;
  const std::uint8_t* src;
  std::uint8_t* dst;
  std::size_t n;

  template <class D>
  HWY_INLINE void operator()(D d, std::size_t i) const {
    hn::StoreU(reversed(d, hn::LoadU(d, src + n - hn::Lanes(d) - i)), d, dst + i);
  }

  void plain(std::size_t begin, std::size_t end) const {
    for (std::size_t i = begin; i < end; ++i) dst[i] = src[n - 1 - i];
  }
};

struct SplitReversed {
  using Lane = std::uint8_t;  // a unit is a pair of bytes
  const std::uint8_t* src;
  std::uint8_t *first, *second;
  std::size_t n;

  template <class D>
  HWY_INLINE void operator()(D d, std::size_t i) const {
    hn::Vec<D> a, b;
    hn::LoadInterleaved2(d, src + 2 * (n - hn::Lanes(d) - i), a, b);
    hn::StoreU(reversed(d, a), d, first + i);
    hn::StoreU(reversed(d, b), d, second + i);
  }

  void plain(std::size_t begin, std::size_t end) const {
    for (std::size_t i = begin; i < end; ++i) {
      first[i] = src[2 * (n - 1 - i)];
      second[i] = src[2 * (n - 1 - i) + 1];
    }
  }
};

void interleave(const std::uint8_t* first, const std::uint8_t* second, std::uint8_t* dst, std::size_t n) {
  run(Interleave{first, second, dst}, n);
}

void split(const std::uint8_t* src, std::uint8_t* first, std::uint8_t* second, std::size_t n) {
  run(Split{src, first, second}, n);
}

void reverse(const std::uint8_t* src, std::uint8_t* dst, std::size_t n) {
  run(Reverse{src, dst, n}, n);
}

void splitReversed(const std::uint8_t* src, std::uint8_t* first, std::uint8_t* second, std::size_t n) {
  run(SplitReversed{src, first, second, n}, n);
}

// Which samples of the source a transposition takes.
enum class Samples { kAll, kFirst, kSecond };

#if HWY_TARGET == HWY_SCALAR

constexpr std::size_t kTileRows = kSmallTile;
constexpr std::size_t kTileColumns = kSmallTile;

template <Samples kSamples>
void transposeSmall(const std::uint8_t* src, std::ptrdiff_t srcPitch, std::uint8_t* dst,
                    std::ptrdiff_t dstPitch) {
  constexpr std::size_t kStep = kSamples == Samples::kAll ? 1 : 2;
  constexpr std::size_t kOffset = kSamples == Samples::kSecond ? 1 : 0;
  for (std::size_t r = 0; r < kSmallTile; ++r, src += srcPitch, ++dst) {
    std::uint8_t* to = dst;
    for (std::size_t c = 0; c < kSmallTile; ++c, to += dstPitch) *to = src[c * kStep + kOffset];
  }
}

template <Samples kSamples>
constexpr Transposition transposition() {
  return {.large = transposeSmall<kSamples>, .small = transposeSmall<kSamples>};
}

#else

// Vectors as long as the processor has them, so that whole cache lines of the destination are written, and as
// many columns, so that whole lines of the source are read.
constexpr std::size_t kTileRows = HWY_LANES(std::uint8_t);
constexpr std::size_t kTileColumns = 64;

template <Samples kSamples>
struct SampleLoader {
  using D = hn::Full128<std::uint8_t>;
  HWY_INLINE hn::Vec<D> operator()(D d, const std::uint8_t* from) const {
    if constexpr (kSamples == Samples::kAll) {
      return hn::LoadU(d, from);
    } else if constexpr (kSamples == Samples::kFirst) {
      return hn::ConcatEven(d, hn::LoadU(d, from + 16), hn::LoadU(d, from));
    } else {
      return hn::ConcatOdd(d, hn::LoadU(d, from + 16), hn::LoadU(d, from));
    }
  }
};

// 16 columns of as many rows as the vector has lanes. Each block of 16 lanes holds another 16 rows.
template <Samples kSamples, class D>
HWY_INLINE void transposeColumns(D d, const std::uint8_t* src, std::ptrdiff_t srcPitch, std::uint8_t* dst,
                                 std::ptrdiff_t dstPitch) {
  using V = hn::Vec<D>;
  // Unrolled whole: only then do the arrays stay in registers.
  V a[16], b[16];
  HWY_UNROLL(16)
  for (std::ptrdiff_t r = 0; r < 16; ++r) {
    a[r] = loadBlocks(d, SampleLoader<kSamples>{}, src + r * srcPitch, 16 * srcPitch);
  }
  // Interleaving the two halves of the rows moves one bit of the row number into the column number; four
  // times, and they have changed places.
  const auto exchange = [d](const V* from, V* to) HWY_ATTR {
    HWY_UNROLL(8)
    for (std::size_t i = 0; i < 8; ++i) {
      to[2 * i] = hn::InterleaveLower(d, from[i], from[i + 8]);
      to[2 * i + 1] = hn::InterleaveUpper(d, from[i], from[i + 8]);
    }
  };
  exchange(a, b);
  exchange(b, a);
  exchange(a, b);
  exchange(b, a);
  HWY_UNROLL(16)
  for (std::ptrdiff_t c = 0; c < 16; ++c) hn::StoreU(a[c], d, dst + c * dstPitch);
}

template <Samples kSamples>
void transposeSmall(const std::uint8_t* src, std::ptrdiff_t srcPitch, std::uint8_t* dst,
                    std::ptrdiff_t dstPitch) {
  transposeColumns<kSamples>(hn::Full128<std::uint8_t>(), src, srcPitch, dst, dstPitch);
}

template <Samples kSamples>
void transposeLarge(const std::uint8_t* src, std::ptrdiff_t srcPitch, std::uint8_t* dst,
                    std::ptrdiff_t dstPitch) {
  constexpr std::size_t kStep = kSamples == Samples::kAll ? 1 : 2;
  for (std::size_t c = 0; c < kTileColumns; c += 16) {
    // More rows are open at once than the processor looks ahead on by itself: fetch for the tile below, 16
    // rows of the source at a time, and behind those of the destination. Nothing depends on what is there.
    for (std::size_t k = c; k < c + 16; ++k) {
      const std::uint8_t* next = src + static_cast<std::ptrdiff_t>(kTileRows + k) * srcPitch;
      if (k < kTileRows) hwy::Prefetch(next);
      if (k < kTileRows && kStep == 2) hwy::Prefetch(next + kTileColumns);
      hwy::Prefetch(dst + static_cast<std::ptrdiff_t>(k) * dstPitch + 2 * kTileRows - 1);
    }
    transposeColumns<kSamples>(hn::ScalableTag<std::uint8_t>(), src + c * kStep, srcPitch,
                               dst + static_cast<std::ptrdiff_t>(c) * dstPitch, dstPitch);
  }
}

template <Samples kSamples>
constexpr Transposition transposition() {
  return {.large = transposeLarge<kSamples>, .small = transposeSmall<kSamples>};
}

#endif

}  // namespace

const PlaneKernels& planeTable() {
  static constexpr PlaneKernels kTable = {
      .interleave = interleave,
      .split = split,
      .reverse = reverse,
      .splitReversed = splitReversed,
      .transpose = transposition<Samples::kAll>(),
      .transposeFirst = transposition<Samples::kFirst>(),
      .transposeSecond = transposition<Samples::kSecond>(),
      .largeRows = kTileRows,
      .largeColumns = kTileColumns,
  };
  return kTable;
}

}  // namespace webrtc::detail::HWY_NAMESPACE
HWY_AFTER_NAMESPACE();

#if HWY_ONCE
namespace webrtc::detail {

HWY_EXPORT(planeTable);

const PlaneKernels& planeKernels() {
  return HWY_DYNAMIC_DISPATCH(planeTable)();
}

}  // namespace webrtc::detail
#endif
