// What encoder and decoder components grant their clients alike. Pure functions.
#pragma once

#include <algorithm>
#include <cstdint>

#include "host/mediaserver/components/avc_level.h"

namespace mediaserver {

// The picture size of fresh ports.
constexpr uint32_t kFirstWidth = 176;
constexpr uint32_t kFirstHeight = 144;

constexpr uint32_t kShortestSide = 16;  // pixels
constexpr uint32_t kLongestSide = 4096;
constexpr uint32_t kMostBuffers = 64;
constexpr uint32_t kLargestBuffer = 64 * 1024 * 1024;

struct PictureSize {
  uint32_t width;
  uint32_t height;

  PictureSize turned() const { return {height, width}; }
};

// `largest` in macroblocks.
inline bool fits(const PictureSize& size, uint32_t largest) {
  const auto [shorter, longer] = std::minmax(size.width, size.height);
  return shorter >= kShortestSide && longer <= kLongestSide &&
         macroblocks(size.width, size.height) <= largest;
}

// The buffer size that a port gets whose client wishes for `wanted` bytes and whose component needs `needed`.
inline uint32_t grantBufferSize(uint32_t wanted, uint32_t needed) {
  return std::max(std::min(wanted, kLargestBuffer), needed);
}

}  // namespace mediaserver
