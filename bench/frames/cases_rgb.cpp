#include "bench/frames/cases.h"
#include "omxbridge/frames.h"

namespace bench {
namespace {

struct ToRgb {
  const char* name;
  Tight function;
  Format from, to;
  bool bottomUp = false;
};

template <int (*kFunction)(const unsigned char*, unsigned char*, unsigned, unsigned, unsigned)>
int unpadded(const unsigned char* src, unsigned char* dst, unsigned width, unsigned height) {
  return kFunction(src, dst, width, height, 0);
}

// Beside the 16-bit words with four or five bits of a component: the peers' nearest ones.
const ToRgb kToRgb[] = {
    {"ConvertI420ToRGB24", webrtc::ConvertI420ToRGB24, Format::kI420, Format::kBgr24, true},
    {"ConvertI420ToRGB24_EX", webrtc::ConvertI420ToRGB24_EX, Format::kI420, Format::kBgr24},
    {"ConvertI420ToARGB", unpadded<webrtc::ConvertI420ToARGB>, Format::kI420, Format::kBgra},
    {"ConvertI420ToARGBMac", unpadded<webrtc::ConvertI420ToARGBMac>, Format::kYv12, Format::kBgra},
    {"ConvertI420ToRGBAMac", unpadded<webrtc::ConvertI420ToRGBAMac>, Format::kYv12, Format::kArgb},
    {"ConvertI420ToRGBAIPhone", unpadded<webrtc::ConvertI420ToRGBAIPhone>, Format::kI420, Format::kRgba,
     true},
    {"ConvertI420ToARGB4444", unpadded<webrtc::ConvertI420ToARGB4444>, Format::kI420, Format::kRgb444, true},
    {"ConvertI420ToARGB4444_EX", unpadded<webrtc::ConvertI420ToARGB4444_EX>, Format::kI420, Format::kRgb444},
    {"ConvertI420ToRGB565", webrtc::ConvertI420ToRGB565, Format::kI420, Format::kRgb565, true},
    {"ConvertI420ToRGB565_EX", webrtc::ConvertI420ToRGB565_EX, Format::kI420, Format::kRgb565},
    {"ConvertI420ToRGB565Android", webrtc::ConvertI420ToRGB565Android, Format::kI420, Format::kRgb565},
    {"ConvertI420ToARGB1555", unpadded<webrtc::ConvertI420ToARGB1555>, Format::kI420, Format::kRgb555, true},
    {"ConvertI420ToARGB1555_EX", unpadded<webrtc::ConvertI420ToARGB1555_EX>, Format::kI420, Format::kRgb555},
    {"ConvertNV12ToRGB565", webrtc::ConvertNV12ToRGB565, Format::kNv12, Format::kRgb565, true},
};

}  // namespace

void addRgbCases(std::vector<Case>& cases) {
  for (const Size s : {kVga, kHd}) {
    for (const ToRgb& c : kToRgb) {
      const auto peers = [&](const Buffers& b) {
        return swscale(c.from, s, c.to, s, b, c.bottomUp) +
               (c.bottomUp ? Contenders{} : opencvColour(c.from, c.to, s, b));
      };
      add(cases, c.name, text(s), bytesOf(c.from, s), bytesOf(c.to, s), tight(c.function, s), peers,
          at(s, {2.5, 2.0}));
    }

    // With a stride of twice the width the rows stand one above the other, in memory a width apart.
    add(
        cases, "ConvertRGB24ToARGB", text(s), bytesOf(Format::kBgr24, s), 2 * bytesOf(Format::kBgra, s),
        [s](const Buffers& b) {
          webrtc::ConvertRGB24ToARGB(b.src(), b.dst(), s.width, s.height, 2 * s.width);
        },
        [s](const Buffers& b) {
          return swscale(Format::kBgr24, s, Format::kBgra, s, b, true) +
                 opencvColour(Format::kBgr24, Format::kBgra, s, b);
        });
    cases.back().bytesWritten /= 2;

    const auto toI420 = [&](const char* name, Format from, Goal goal, const Ours& ours) {
      const auto peers = [&](const Buffers& b) {
        return swscale(from, s, Format::kI420, s, b) + opencvColour(from, Format::kI420, s, b);
      };
      add(cases, name, text(s), bytesOf(from, s), s.i420(), ours, peers, at(s, goal));
    };
    toI420("ConvertRGB24ToI420", Format::kBgr24, {4, 2.5},
           [s](const Buffers& b) { webrtc::ConvertRGB24ToI420(s.width, s.height, b.src(), b.dst()); });
    toI420("ConvertRGB24ToI420 (six)", Format::kBgr24, {4, 2.5}, [s](const Buffers& b) {
      webrtc::ConvertRGB24ToI420(b.src(), s.width, s.height, b.dst(), s.width, s.height);
    });
    toI420("ConvertARGBMacToI420", Format::kArgb, {},
           [s](const Buffers& b) { webrtc::ConvertARGBMacToI420(s.width, s.height, b.src(), b.dst()); });
    toI420("ConvertRGB565ToI420", Format::kRgb565, {8, 2.5},
           [s](const Buffers& b) { webrtc::ConvertRGB565ToI420(b.src(), s.width, s.height, b.dst()); });
  }
}

}  // namespace bench
