// Pixel layouts of raw files, to and from I420 by the library's frame functions. Rows go from top to bottom.
#pragma once

#include <stddef.h>
#include <stdint.h>

#include <span>
#include <string>
#include <string_view>
#include <vector>

#include "tools/video/picture.h"

namespace tool {

struct Layout {
  std::string_view name;
  unsigned int bitsPerPixel;
  // Null where there is no such function. Sizes are even; `raw` has rawBytes().
  void (*read)(const uint8_t* raw, unsigned int width, unsigned int height, uint8_t* i420);
  void (*write)(const uint8_t* i420, unsigned int width, unsigned int height, uint8_t* raw);

  size_t rawBytes(Size size) const {
    return static_cast<size_t>(size.width) * static_cast<size_t>(size.height) * bitsPerPixel / 8;
  }
};

std::span<const Layout> layouts();
// Null for an unknown name.
const Layout* findLayout(std::string_view name);
std::vector<std::string> readableLayouts();
std::vector<std::string> writableLayouts();

}  // namespace tool
