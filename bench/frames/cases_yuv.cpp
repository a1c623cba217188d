#include "bench/frames/cases.h"
#include "omxbridge/frames.h"

namespace bench {
namespace {

constexpr Goal kCopyGoal{1.0, 1.2}, kPackGoal{1.8, 1.5}, kUnpackGoal{2.0, 1.6};

struct Plain {
  const char* name;
  Tight function;
  Format from, to;
  Goal goal;
};

template <int (*kFunction)(unsigned, unsigned, const unsigned char*, unsigned char*)>
int sizeFirst(const unsigned char* src, unsigned char* dst, unsigned width, unsigned height) {
  return kFunction(width, height, src, dst);
}

template <int (*kFunction)(const unsigned char*, unsigned, unsigned, unsigned char*, unsigned, unsigned)>
int sameSize(const unsigned char* src, unsigned char* dst, unsigned width, unsigned height) {
  return kFunction(src, width, height, dst, width, height);
}

template <int (*kFunction)(const unsigned char*, unsigned char*, unsigned, unsigned, unsigned)>
int unpadded(const unsigned char* src, unsigned char* dst, unsigned width, unsigned height) {
  return kFunction(src, dst, width, height, 0);
}

template <webrtc::VideoType kType>
int toI420(const unsigned char* src, unsigned char* dst, unsigned width, unsigned height) {
  return webrtc::ConvertToI420(kType, src, width, height, dst, false, webrtc::kRotateNone);
}

int fromI420(const unsigned char* src, unsigned char* dst, unsigned width, unsigned height) {
  return webrtc::ConvertFromI420(webrtc::kI420, src, width, height, dst, false, webrtc::kRotateNone);
}

const Plain kPlain[] = {
    {"ConvertToI420 (kI420)", toI420<webrtc::kI420>, Format::kI420, Format::kI420, kCopyGoal},
    {"ConvertFromI420 (kI420)", fromI420, Format::kI420, Format::kI420, kCopyGoal},
    {"ConvertYV12ToI420", toI420<webrtc::kYV12>, Format::kYv12, Format::kI420, kCopyGoal},
    {"ConvertI420ToYV12", unpadded<webrtc::ConvertI420ToYV12>, Format::kI420, Format::kYv12, kCopyGoal},
    {"ConvertI420ToNV12", webrtc::ConvertI420ToNV12, Format::kI420, Format::kNv12, kCopyGoal},
    {"ConvertI420ToNV21", webrtc::ConvertI420ToNV21, Format::kI420, Format::kNv21, kCopyGoal},
    {"ConvertNV12ToI420", webrtc::ConvertNV12ToI420, Format::kNv12, Format::kI420, kCopyGoal},
    {"ConvertNV21ToI420", webrtc::ConvertNV21ToI420, Format::kNv21, Format::kI420, kCopyGoal},
    {"ConvertI420ToYUY2", unpadded<webrtc::ConvertI420ToYUY2>, Format::kI420, Format::kYuy2, kPackGoal},
    {"ConvertI420ToUYVY", unpadded<webrtc::ConvertI420ToUYVY>, Format::kI420, Format::kUyvy, kPackGoal},
    {"ConvertYUY2ToI420", sizeFirst<webrtc::ConvertYUY2ToI420>, Format::kYuy2, Format::kI420, kUnpackGoal},
    {"ConvertUYVYToI420", sizeFirst<webrtc::ConvertUYVYToI420>, Format::kUyvy, Format::kI420, kUnpackGoal},
    {"ConvertYUY2ToI420 (six)", sameSize<webrtc::ConvertYUY2ToI420>, Format::kYuy2, Format::kI420,
     kUnpackGoal},
    {"ConvertUYVYToI420 (six)", sameSize<webrtc::ConvertUYVYToI420>, Format::kUyvy, Format::kI420,
     kUnpackGoal},
};

}  // namespace

void addYuvCases(std::vector<Case>& cases) {
  for (const Size s : {kVga, kHd}) {
    for (const Plain& c : kPlain) {
      add(
          cases, c.name, text(s), bytesOf(c.from, s), bytesOf(c.to, s), tight(c.function, s),
          [&](const Buffers& b) { return swscale(c.from, s, c.to, s, b); }, at(s, c.goal));
    }

    // Of interlaced frames only every second source row is read.
    add(cases, "ConvertYUY2ToI420interlaced", text(s), s.area() * 2, s.i420(),
        tight(sameSize<webrtc::ConvertYUY2ToI420interlaced>, s));
    add(cases, "ConvertUYVYToI420interlaced", text(s), s.area() * 2, s.i420(),
        tight(sameSize<webrtc::ConvertUYVYToI420interlaced>, s));

    const unsigned stride = s.width + 64;
    add(
        cases, "ConvertI420ToI420 (stride)", text(s), s.i420(), Size{stride, s.height}.i420(),
        [=](const Buffers& b) { webrtc::ConvertI420ToI420(b.src(), b.dst(), s.width, s.height, stride); },
        [=](const Buffers& b) { return swscale(Format::kI420, s, Format::kI420, s, b); });

    const Size middle{s.width / 2, s.height / 2};
    const auto centre = [&](const char* name, Size from, Size to, const Peers& peers) {
      add(
          cases, name, text(from) + " to " + text(to), from.i420(), to.i420(),
          [=](const Buffers& b) {
            webrtc::ConvertI420ToI420(b.src(), from.width, from.height, b.dst(), to.width, to.height);
          },
          peers);
    };
    centre("ConvertI420ToI420 (crop)", s, middle, [=](const Buffers& b) { return opencvCut(s, middle, b); });
    cases.back().bytesRead = middle.i420();
    centre("ConvertI420ToI420 (pad)", middle, s, [=](const Buffers& b) { return opencvPad(middle, s, b); });

    add(
        cases, "ConvertNV12ToNV12", text(s) + " to " + text(middle), s.i420(), middle.i420(),
        [s](const Buffers& b) {
          const auto w = static_cast<int>(s.width), h = static_cast<int>(s.height);
          webrtc::ConvertNV12ToNV12(b.src(), w, h, w / 4, h / 4, w / 4 * 3 - 1, h / 4 * 3 - 1, b.dst());
        },
        [=](const Buffers& b) { return opencvCut(s, middle, b); });
    cases.back().bytesRead = middle.i420();
  }
}

}  // namespace bench
