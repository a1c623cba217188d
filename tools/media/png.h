// PNG pictures.
#pragma once

#include <stdint.h>

#include <optional>
#include <vector>

#include "tools/video/picture.h"

namespace tool {

// Nothing where memory is short.
std::optional<std::vector<uint8_t>> toPng(const Picture& picture);

}  // namespace tool
