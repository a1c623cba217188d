#include "tools/video/layout.h"

#include <algorithm>
#include <array>

#include "omxbridge/frames.h"

namespace tool {

namespace {

using Bytes = const uint8_t*;
using Out = uint8_t*;
using Side = unsigned int;

template <webrtc::VideoType type>
void read(Bytes raw, Side width, Side height, Out i420) {
  webrtc::ConvertToI420(type, raw, width, height, i420, false, webrtc::kRotateNone);
}

template <webrtc::VideoType type>
void write(Bytes i420, Side width, Side height, Out raw) {
  webrtc::ConvertFromI420(type, i420, width, height, raw, false, webrtc::kRotateNone);
}

// Where the dispatcher writes from bottom to top, the functions themselves can do otherwise.
constexpr std::array kLayouts{
    Layout{"i420", 12, read<webrtc::kI420>, write<webrtc::kI420>},
    Layout{"yv12", 12, read<webrtc::kYV12>, write<webrtc::kYV12>},
    Layout{"nv12", 12, read<webrtc::kNV12>,
           [](Bytes i420, Side width, Side height, Out raw) {
             webrtc::ConvertI420ToNV12(i420, raw, width, height);
           }},
    Layout{"nv21", 12, read<webrtc::kNV21>,
           [](Bytes i420, Side width, Side height, Out raw) {
             webrtc::ConvertI420ToNV21(i420, raw, width, height);
           }},
    Layout{"yuy2", 16, read<webrtc::kYUY2>, write<webrtc::kYUY2>},
    Layout{"uyvy", 16, read<webrtc::kUYVY>, write<webrtc::kUYVY>},
    Layout{"bgr24", 24, read<webrtc::kRGB24>,
           [](Bytes i420, Side width, Side height, Out raw) {
             webrtc::ConvertI420ToRGB24_EX(i420, raw, width, height);
           }},
    Layout{"bgra", 32, nullptr, write<webrtc::kARGB>},
    Layout{"rgb565", 16, read<webrtc::kRGB565>,
           [](Bytes i420, Side width, Side height, Out raw) {
             webrtc::ConvertI420ToRGB565_EX(i420, raw, width, height);
           }},
    Layout{"argb4444", 16, nullptr,
           [](Bytes i420, Side width, Side height, Out raw) {
             webrtc::ConvertI420ToARGB4444_EX(i420, raw, width, height);
           }},
    Layout{"argb1555", 16, nullptr,
           [](Bytes i420, Side width, Side height, Out raw) {
             webrtc::ConvertI420ToARGB1555_EX(i420, raw, width, height);
           }},
};

template <typename Wanted>
std::vector<std::string> namesWhere(Wanted wanted) {
  std::vector<std::string> names;
  for (const Layout& layout : kLayouts) {
    if (wanted(layout)) names.emplace_back(layout.name);
  }
  return names;
}

}  // namespace

std::span<const Layout> layouts() {
  return kLayouts;
}

const Layout* findLayout(std::string_view name) {
  const auto* const found = std::find_if(kLayouts.begin(), kLayouts.end(),
                                         [name](const Layout& each) { return each.name == name; });
  return found != kLayouts.end() ? found : nullptr;
}

std::vector<std::string> readableLayouts() {
  return namesWhere([](const Layout& layout) { return layout.read != nullptr; });
}

std::vector<std::string> writableLayouts() {
  return namesWhere([](const Layout& layout) { return layout.write != nullptr; });
}

}  // namespace tool
