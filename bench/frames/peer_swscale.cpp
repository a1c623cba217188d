#include "bench/frames/peers.h"

#if BENCH_HAS_SWSCALE
#include <array>

extern "C" {
#include <libavutil/imgutils.h>
#include <libavutil/log.h>
#include <libswscale/swscale.h>
}
#endif

namespace bench {

#if BENCH_HAS_SWSCALE
namespace {

AVPixelFormat pixelFormat(Format format) {
  switch (format) {
    case Format::kI420:
    case Format::kYv12:
      return AV_PIX_FMT_YUV420P;
    case Format::kNv12:
      return AV_PIX_FMT_NV12;
    case Format::kNv21:
      return AV_PIX_FMT_NV21;
    case Format::kYuy2:
      return AV_PIX_FMT_YUYV422;
    case Format::kUyvy:
      return AV_PIX_FMT_UYVY422;
    case Format::kBgr24:
      return AV_PIX_FMT_BGR24;
    case Format::kBgra:
      return AV_PIX_FMT_BGRA;
    case Format::kRgba:
      return AV_PIX_FMT_RGBA;
    case Format::kArgb:
      return AV_PIX_FMT_ARGB;
    case Format::kRgb565:
      return AV_PIX_FMT_RGB565LE;
    case Format::kRgb444:
      return AV_PIX_FMT_RGB444LE;
    case Format::kRgb555:
      return AV_PIX_FMT_RGB555LE;
  }
  return AV_PIX_FMT_NONE;
}

struct Picture {
  Picture(Format format, Size s, std::uint8_t* memory, bool bottomUp) {
    av_image_fill_arrays(data.data(), pitch.data(), memory, pixelFormat(format), static_cast<int>(s.width),
                         static_cast<int>(s.height), 1);
    if (format == Format::kYv12) std::swap(data[1], data[2]);
    if (!bottomUp) return;
    data[0] += static_cast<std::ptrdiff_t>(s.height - 1) * pitch[0];
    pitch[0] = -pitch[0];
  }
  std::array<std::uint8_t*, 4> data{};
  std::array<int, 4> pitch{};
};

}  // namespace

Contenders swscale(Format from, Size fromSize, Format to, Size toSize, const Buffers& buffers,
                   bool bottomUp) {
  Contenders result;
  av_log_set_level(AV_LOG_ERROR);  // it warns of conversions that it has in plain C only
  const auto add = [&](const char* name, int flags) {
    std::shared_ptr<SwsContext> context(
        sws_getContext(static_cast<int>(fromSize.width), static_cast<int>(fromSize.height), pixelFormat(from),
                       static_cast<int>(toSize.width), static_cast<int>(toSize.height), pixelFormat(to),
                       flags, nullptr, nullptr, nullptr),
        sws_freeContext);
    if (context == nullptr) return;
    const Picture src(from, fromSize, buffers.src(), false), dst(to, toSize, buffers.dst(), bottomUp);
    result.push_back({name, [context, src, dst, fromSize] {
                        sws_scale(context.get(), src.data.data(), src.pitch.data(), 0,
                                  static_cast<int>(fromSize.height), dst.data.data(), dst.pitch.data());
                      }});
  };
  add("swscale", SWS_FAST_BILINEAR);
  if (fromSize.area() != toSize.area()) {
    add("swscale bilinear", SWS_BILINEAR);
    add("swscale area", SWS_AREA);
  }
  return result;
}

#else

Contenders swscale(Format, Size, Format, Size, const Buffers&, bool) {
  return {};
}

#endif

Contenders operator+(Contenders a, const Contenders& b) {
  a.insert(a.end(), b.begin(), b.end());
  return a;
}

}  // namespace bench
