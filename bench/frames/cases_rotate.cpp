#include "bench/frames/cases.h"
#include "omxbridge/frames.h"

namespace bench {
namespace {

constexpr Goal kQuarterGoal{2.5, 2.7}, kHalfGoal{1.0, 1.3};

struct Rotation {
  const char* name;
  Tight function;
  Format from;
  OpencvTurn turn;
  const char* chain;
  Goal goal;
};

template <auto kFunction, webrtc::VideoType kType>
int turned(const unsigned char* src, unsigned char* dst, unsigned width, unsigned height) {
  return kFunction(src, width, height, dst, height, width, kType);
}

int half(const unsigned char* src, unsigned char* dst, unsigned width, unsigned height) {
  return webrtc::ConvertToI420AndMirrorUpDown(src, dst, width, height, webrtc::kI420);
}

const Rotation kRotations[] = {
    {"ConvertToI420AndRotateClockwise", turned<webrtc::ConvertToI420AndRotateClockwise, webrtc::kI420>,
     Format::kI420, OpencvTurn::kClockwise, "transpose=clock", kQuarterGoal},
    {"ConvertToI420AndRotateAntiClockwise",
     turned<webrtc::ConvertToI420AndRotateAntiClockwise, webrtc::kI420>, Format::kI420,
     OpencvTurn::kAntiClockwise, "transpose=cclock", kQuarterGoal},
    {"ConvertToI420AndMirrorUpDown", half, Format::kI420, OpencvTurn::kHalf, "hflip,vflip", kHalfGoal},
    {"ConvertNV12ToI420AndRotateClockwise", webrtc::ConvertNV12ToI420AndRotateClockwise, Format::kNv12,
     OpencvTurn::kClockwise, "format=yuv420p,transpose=clock", kQuarterGoal},
    {"ConvertNV12ToI420AndRotateAntiClockwise", webrtc::ConvertNV12ToI420AndRotateAntiClockwise,
     Format::kNv12, OpencvTurn::kAntiClockwise, "format=yuv420p,transpose=cclock", kQuarterGoal},
    {"ConvertNV12ToI420AndRotate180", webrtc::ConvertNV12ToI420AndRotate180, Format::kNv12, OpencvTurn::kHalf,
     "format=yuv420p,hflip,vflip", kHalfGoal},
    {"ConvertNV21ToI420AndRotateClockwise", webrtc::ConvertNV21ToI420AndRotateClockwise, Format::kNv21,
     OpencvTurn::kClockwise, "format=yuv420p,transpose=clock", kQuarterGoal},
    {"ConvertNV21ToI420AndRotateAntiClockwise", webrtc::ConvertNV21ToI420AndRotateAntiClockwise,
     Format::kNv21, OpencvTurn::kAntiClockwise, "format=yuv420p,transpose=cclock", kQuarterGoal},
    {"ConvertNV21ToI420AndRotate180", webrtc::ConvertNV21ToI420AndRotate180, Format::kNv21, OpencvTurn::kHalf,
     "format=yuv420p,hflip,vflip", kHalfGoal},
    // libavfilter turns a frame upside down by writing down other addresses; nothing is moved.
    {"MirrorI420UpDown", webrtc::MirrorI420UpDown, Format::kI420, OpencvTurn::kUpDown, nullptr, {}},
    {"MirrorI420LeftRight", webrtc::MirrorI420LeftRight, Format::kI420, OpencvTurn::kLeftRight, "hflip", {}},
};

}  // namespace

void addRotateCases(std::vector<Case>& cases) {
  for (const Size s : {kVga, kHd}) {
    for (const Rotation& c : kRotations) {
      const auto peers = [&](const Buffers& b) {
        return (c.chain == nullptr ? Contenders{} : avfilter(c.chain, c.from, s)) +
               (c.from == Format::kI420 ? opencvTurn(c.turn, s, b) : Contenders{});
      };
      add(cases, c.name, text(s), s.i420(), s.i420(), tight(c.function, s), peers, at(s, c.goal));
    }
  }
}

}  // namespace bench
