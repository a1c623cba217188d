#include "tools/media/png.h"

#include <png.h>

#include "omxbridge/frames.h"

namespace tool {

std::optional<std::vector<uint8_t>> toPng(const Picture& picture) {
  png_image image{};
  image.version = PNG_IMAGE_VERSION;
  image.width = static_cast<png_uint_32>(picture.size.width);
  image.height = static_cast<png_uint_32>(picture.size.height);
  image.format = PNG_FORMAT_BGR;
  std::vector<uint8_t> pixels(PNG_IMAGE_SIZE(image));
  webrtc::ConvertI420ToRGB24_EX(picture.bytes.data(), pixels.data(), image.width, image.height);

  std::vector<uint8_t> bytes(PNG_IMAGE_PNG_SIZE_MAX(image));
  png_alloc_size_t size = bytes.size();
  if (png_image_write_to_memory(&image, bytes.data(), &size, 0, pixels.data(), 0, nullptr) == 0) {
    return std::nullopt;
  }
  bytes.resize(size);
  return bytes;
}

}  // namespace tool
