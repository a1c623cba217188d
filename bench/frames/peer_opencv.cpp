#include "bench/frames/peers.h"

#if BENCH_HAS_OPENCV
#include <array>
#include <opencv2/core.hpp>
#include <opencv2/core/utility.hpp>
#include <opencv2/imgproc.hpp>
#endif

namespace bench {

#if BENCH_HAS_OPENCV
namespace {

cv::Mat matrix(std::uint8_t* memory, Size s, int type = CV_8UC1) {
  return {static_cast<int>(s.height), static_cast<int>(s.width), type, memory};
}

std::array<cv::Mat, 3> planes(std::uint8_t* memory, Size s) {
  const Size half{s.width / 2, s.height / 2};
  return {matrix(memory, s), matrix(memory + s.area(), half), matrix(memory + s.area() + half.area(), half)};
}

// Runs operation(src, dst) on each plane.
template <class Operation>
Contenders onPlanes(const char* name, Size from, Size to, const Buffers& buffers,
                    const Operation& operation) {
  cv::setNumThreads(1);
  return {{name, [src = planes(buffers.src(), from), dst = planes(buffers.dst(), to), operation]() mutable {
             for (std::size_t k = 0; k < 3; ++k) operation(src[k], dst[k]);
           }}};
}

struct Colour {
  Format from, to;
  int code;
};

constexpr Colour kColours[] = {
    {Format::kI420, Format::kBgr24, cv::COLOR_YUV2BGR_I420},
    {Format::kI420, Format::kBgra, cv::COLOR_YUV2BGRA_I420},
    {Format::kI420, Format::kRgba, cv::COLOR_YUV2RGBA_I420},
    {Format::kYv12, Format::kBgra, cv::COLOR_YUV2BGRA_YV12},
    {Format::kBgr24, Format::kBgra, cv::COLOR_BGR2BGRA},
    {Format::kBgr24, Format::kI420, cv::COLOR_BGR2YUV_I420},
    {Format::kArgb, Format::kI420, cv::COLOR_RGBA2YUV_I420},
};

int typeOf(Format format) {
  switch (format) {
    case Format::kBgr24:
      return CV_8UC3;
    case Format::kBgra:
    case Format::kRgba:
    case Format::kArgb:
      return CV_8UC4;
    case Format::kRgb565:
      return CV_8UC2;
    default:
      return CV_8UC1;
  }
}

cv::Mat frame(std::uint8_t* memory, Format format, Size s) {
  const int type = typeOf(format);
  return matrix(memory, type == CV_8UC1 ? Size{s.width, s.height / 2 * 3} : s, type);
}

}  // namespace

Contenders opencvColour(Format from, Format to, Size size, const Buffers& buffers) {
  cv::setNumThreads(1);
  const cv::Mat src = frame(buffers.src(), from, size);
  cv::Mat dst = frame(buffers.dst(), to, size);
  if (from == Format::kRgb565 && to == Format::kI420) {
    return {{"OpenCV", [src, dst, bgr = cv::Mat()]() mutable {
               cv::cvtColor(src, bgr, cv::COLOR_BGR5652BGR);
               cv::cvtColor(bgr, dst, cv::COLOR_BGR2YUV_I420);
             }}};
  }
  for (const Colour& colour : kColours) {
    if (colour.from != from || colour.to != to) continue;
    return {{"OpenCV", [src, dst, code = colour.code]() mutable { cv::cvtColor(src, dst, code); }}};
  }
  return {};
}

Contenders opencvTurn(OpencvTurn turn, Size size, const Buffers& buffers) {
  const bool quarter = turn == OpencvTurn::kClockwise || turn == OpencvTurn::kAntiClockwise;
  const Size to = quarter ? Size{size.height, size.width} : size;
  return onPlanes("OpenCV", size, to, buffers, [turn](const cv::Mat& src, cv::Mat& dst) {
    switch (turn) {
      case OpencvTurn::kClockwise:
        return cv::rotate(src, dst, cv::ROTATE_90_CLOCKWISE);
      case OpencvTurn::kAntiClockwise:
        return cv::rotate(src, dst, cv::ROTATE_90_COUNTERCLOCKWISE);
      case OpencvTurn::kHalf:
        return cv::flip(src, dst, -1);
      case OpencvTurn::kUpDown:
        return cv::flip(src, dst, 0);
      case OpencvTurn::kLeftRight:
        return cv::flip(src, dst, 1);
    }
  });
}

Contenders opencvResize(bool area, Size from, Size to, const Buffers& buffers) {
  const int how = area ? cv::INTER_AREA : cv::INTER_LINEAR;
  return onPlanes(area ? "OpenCV area" : "OpenCV bilinear", from, to, buffers,
                  [how](const cv::Mat& src, cv::Mat& dst) { cv::resize(src, dst, dst.size(), 0, 0, how); });
}

Contenders opencvPad(Size from, Size to, const Buffers& buffers) {
  return onPlanes("OpenCV", from, to, buffers, [](const cv::Mat& src, cv::Mat& dst) {
    const int x = dst.cols - src.cols, y = dst.rows - src.rows;
    cv::copyMakeBorder(src, dst, y / 2, y - y / 2, x / 2, x - x / 2, cv::BORDER_CONSTANT);
  });
}

Contenders opencvCut(Size from, Size to, const Buffers& buffers) {
  return onPlanes("OpenCV", from, to, buffers, [](const cv::Mat& src, cv::Mat& dst) {
    const int x = src.cols - dst.cols, y = src.rows - dst.rows;
    src(cv::Rect(x / 2, y / 2, dst.cols, dst.rows)).copyTo(dst);
  });
}

#else

Contenders opencvColour(Format, Format, Size, const Buffers&) {
  return {};
}
Contenders opencvTurn(OpencvTurn, Size, const Buffers&) {
  return {};
}
Contenders opencvResize(bool, Size, Size, const Buffers&) {
  return {};
}
Contenders opencvPad(Size, Size, const Buffers&) {
  return {};
}
Contenders opencvCut(Size, Size, const Buffers&) {
  return {};
}

#endif

}  // namespace bench
