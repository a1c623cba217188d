// How the lists of cases are written.
#pragma once

#include <functional>
#include <string>
#include <vector>

#include "bench/frames/measure.h"
#include "bench/frames/peers.h"

namespace bench {

using Ours = std::function<void(const Buffers& buffers)>;
using Peers = std::function<Contenders(const Buffers& buffers)>;

inline void add(std::vector<Case>& cases, const std::string& function, const std::string& size,
                std::size_t bytesRead, std::size_t bytesWritten, Ours ours, const Peers& peers = {},
                Goal goal = {}) {
  const auto buffers = std::make_shared<Buffers>(bytesRead, bytesWritten);
  cases.push_back({function, size, bytesRead, bytesWritten, buffers,
                   [ours = std::move(ours), buffers] { ours(*buffers); },
                   peers ? peers(*buffers) : Contenders{}, goal});
}

inline std::string text(Size s) {
  return std::to_string(s.width) + "x" + std::to_string(s.height);
}

// The goals are set for the larger size.
inline Goal at(Size s, Goal goal) {
  return s.area() == kHd.area() ? goal : Goal{};
}

inline std::size_t bytesOf(Format format, Size s) {
  switch (format) {
    case Format::kBgr24:
      return s.area() * 3;
    case Format::kBgra:
    case Format::kRgba:
    case Format::kArgb:
      return s.area() * 4;
    case Format::kYuy2:
    case Format::kUyvy:
    case Format::kRgb565:
    case Format::kRgb444:
    case Format::kRgb555:
      return s.area() * 2;
    default:
      return s.i420();
  }
}

// Between two tightly packed frames of a size, as the frame functions take them.
using Tight = int (*)(const unsigned char* src, unsigned char* dst, unsigned width, unsigned height);

inline Ours tight(Tight function, Size s) {
  return [=](const Buffers& b) { function(b.src(), b.dst(), s.width, s.height); };
}

}  // namespace bench
