#include "tools/video/device_layout.h"

#include <limits.h>
#include <string.h>

#include "omxbridge/frames.h"
#include "omxbridge/hardware_version.h"
#include "tools/base/text.h"

namespace tool {

namespace {

// Where MSM8x60 encoders look for chroma: at the next multiple of this, in bytes.
constexpr size_t kMsm8x60ChromaAlignment = 2048;

Failure badPicture(const std::string& problem) {
  return {ExitCode::Failed, "the decoder delivered a picture that cannot be: " + problem};
}

}  // namespace

size_t layOutForEncoder(const Picture& picture, int hardwareVersion, uint8_t* target) {
  const auto width = static_cast<unsigned int>(picture.size.width);
  const auto height = static_cast<unsigned int>(picture.size.height);
  webrtc::ConvertI420ToNV12(picture.bytes.data(), target, width, height);
  if (hardwareVersion != HW_VERSION_MSM8X60) return picture.bytes.size();

  const size_t luma = picture.lumaBytes();
  const size_t chroma = picture.bytes.size() - luma;
  const size_t chromaBegin =
      (luma + kMsm8x60ChromaAlignment - 1) / kMsm8x60ChromaAlignment * kMsm8x60ChromaAlignment;
  memmove(target + chromaBegin, target + luma, chroma);
  memset(target + luma, 0, chromaBegin - luma);
  return chromaBegin + chroma;
}

Outcome DecodedPictureReader::read(const DECODEDDATAINFO& info, std::span<const uint8_t> data,
                                   Picture& picture) {
  const uint64_t pixels = uint64_t{info.width} * info.height;
  if (pixels == 0 || info.width > kMaxSide || info.height > kMaxSide) {
    return badPicture(formatted("%ux%u", info.width, info.height));
  }
  const bool isRgb = info.dataType == DECODED_DATA_RGB565;
  const uint64_t needed = isRgb ? pixels * 2 : pixels * 3 / 2;
  if (data.size() < needed) {
    return badPicture(formatted("%zu bytes for %ux%u", data.size(), info.width, info.height));
  }
  if (info.dataType == DECODED_DATA_CROPPED) return readCropped(info, data.data(), picture);

  const Size size{static_cast<int>(info.width), static_cast<int>(info.height)};
  if (!isEven(size)) return badPicture(formatted("odd size %ux%u", info.width, info.height));
  picture.resize(size);
  if (isRgb) {
    webrtc::ConvertRGB565ToI420(data.data(), info.width, info.height, picture.bytes.data());
  } else {
    webrtc::ConvertNV12ToI420(data.data(), picture.bytes.data(), info.width, info.height);
  }
  return {};
}

Outcome DecodedPictureReader::readCropped(const DECODEDDATAINFO& info, const uint8_t* data,
                                          Picture& picture) {
  const std::string window = formatted("%ux%u at (%u, %u) of %ux%u", info.cropWidth, info.cropHeight,
                                       info.cropLeft, info.cropTop, info.width, info.height);
  // Each on its own and then together, so that no sum can wrap.
  const bool inside = info.cropWidth > 0 && info.cropHeight > 0 && info.cropWidth <= info.width &&
                      info.cropHeight <= info.height && info.cropLeft <= info.width - info.cropWidth &&
                      info.cropTop <= info.height - info.cropHeight;
  const Size size{static_cast<int>(info.cropWidth), static_cast<int>(info.cropHeight)};
  if (!inside || !isEven(size) || info.cropLeft % 2 != 0 || info.cropTop % 2 != 0) return badPicture(window);

  _visible.resize(pictureBytes(size));
  const auto left = static_cast<int>(info.cropLeft);
  const auto top = static_cast<int>(info.cropTop);
  if (webrtc::ConvertNV12ToNV12(data, static_cast<int>(info.width), static_cast<int>(info.height), left, top,
                                left + size.width - 1, top + size.height - 1, _visible.data()) != 0) {
    return badPicture(window);
  }
  picture.resize(size);
  webrtc::ConvertNV12ToI420(_visible.data(), picture.bytes.data(), info.cropWidth, info.cropHeight);
  return {};
}

}  // namespace tool
