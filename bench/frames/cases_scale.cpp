#include <algorithm>

#include "bench/frames/cases.h"
#include "omxbridge/frames.h"

namespace bench {
namespace {

Peers resizing(bool area, Size from, Size to) {
  return [=](const Buffers& b) {
    return swscale(Format::kI420, from, Format::kI420, to, b) + opencvResize(area, from, to, b);
  };
}

using Growing = int (*)(unsigned, unsigned, unsigned char*&, unsigned, unsigned&, unsigned&);

// The buffer is large enough from the start.
Ours growing(Growing function, Size s) {
  return [=](const Buffers& b) {
    unsigned char* buffer = b.src();
    unsigned width = 0, height = 0;
    function(s.width, s.height, buffer, 0x7FFFFFFF, width, height);
  };
}

void addFixed(std::vector<Case>& cases, Size s) {
  const Size narrow{s.width / 2, s.height}, quarter{s.width / 2, s.height / 2};
  const Size third{s.width / 3 + s.width / 3 % 2, s.height / 3}, more{s.width / 2 * 3, s.height / 2 * 3};
  const Size twice{s.width * 2, s.height * 2};
  const auto inPlace = [&](const char* name, Size from, Size to, bool area, const Ours& ours,
                           Goal goal = {}) {
    const std::size_t larger = std::max(from.i420(), to.i420());
    add(cases, name, text(from) + " to " + text(to), larger, larger, ours, resizing(area, from, to), goal);
    cases.back().bytesRead = from.i420();
    cases.back().bytesWritten = to.i420();
  };
  inPlace("ScaleI420UpHalfFrame", narrow, s, false,
          [s](const Buffers& b) { webrtc::ScaleI420UpHalfFrame(s.width, s.height, b.src()); });
  inPlace("ScaleI420DownHalfFrame", s, narrow, true,
          [s](const Buffers& b) { webrtc::ScaleI420DownHalfFrame(s.width, s.height, b.src()); });
  inPlace(
      "ScaleI420FrameQuarter", s, quarter, true,
      [s](const Buffers& b) { webrtc::ScaleI420FrameQuarter(s.width, s.height, b.src()); }, at(s, {2, 1.3}));
  inPlace("ScaleI420Down1_3", s, third, true, growing(webrtc::ScaleI420Down1_3, s));
  inPlace("ScaleI420Up3_2", s, more, false, growing(webrtc::ScaleI420Up3_2, s));
  inPlace("ScaleI420Up2", s, twice, false, growing(webrtc::ScaleI420Up2, s));
}

void addBilinear(std::vector<Case>& cases, Size from, Size to, Goal goal) {
  const auto scale = [=](const Buffers& b) {
    unsigned char* destination = b.dst();
    auto size = static_cast<unsigned>(to.i420());
    webrtc::ScaleBilinear(b.src(), destination, from.width, from.height, to.width, to.height, size);
  };
  add(cases, "ScaleBilinear", text(from) + " to " + text(to), from.i420(), to.i420(), scale,
      resizing(false, from, to), goal);
}

void addPadding(std::vector<Case>& cases, Size s) {
  const Size middle{s.width / 2, s.height / 2};
  add(
      cases, "PadI420Frame", text(middle) + " to " + text(s), middle.i420(), s.i420(),
      [=](const Buffers& b) {
        webrtc::PadI420Frame(b.src(), b.dst(), middle.width, middle.height, s.width, s.height);
      },
      [=](const Buffers& b) { return opencvPad(middle, s, b); });
  // In place, like the next: chroma is moved, nothing else but the new rows is written.
  const unsigned rows = 16;
  const Size longer{s.width, s.height + rows};
  add(cases, "PadI420BottomRows", text(s) + " to " + text(longer), longer.i420(), longer.i420(),
      [=](const Buffers& b) {
        unsigned size = 0;
        webrtc::PadI420BottomRows(b.src(), static_cast<unsigned>(longer.i420()), s.width, s.height, rows,
                                  size);
      });
  cases.back().bytesRead = s.area() / 2;
  cases.back().bytesWritten = longer.area() / 2 + std::size_t{rows} * s.width;
  add(
      cases, "CutI420Frame", text(s) + " to " + text(middle), s.i420(), middle.i420(),
      [=](const Buffers& b) {
        webrtc::CutI420Frame(b.src(), s.width, s.height, middle.width, middle.height);
      },
      [=](const Buffers& b) { return opencvCut(s, middle, b); });
  cases.back().bytesRead = middle.i420();
}

}  // namespace

void addScaleCases(std::vector<Case>& cases) {
  for (const Size s : {kVga, kHd}) addFixed(cases, s);
  addBilinear(cases, {1280, 720}, {640, 360}, {1, 0});
  addBilinear(cases, kVga, {352, 288}, {2, 0});
  addBilinear(cases, {640, 360}, {1280, 720}, {2, 0});
  addBilinear(cases, kVga, {320, 240}, {});
  addBilinear(cases, kHd, {1280, 720}, {});
  addBilinear(cases, {1280, 720}, kHd, {});
  for (const Size s : {kVga, kHd}) addPadding(cases, s);
  const Size small{320, 240}, padded{352, 288};
  add(
      cases, "PadI420Frame (fixed)", text(small) + " to " + text(padded), small.i420(), padded.i420(),
      [=](const Buffers& b) {
        webrtc::PadI420Frame(static_cast<unsigned>(small.i420()), b.src(), b.dst(), true);
      },
      [=](const Buffers& b) { return opencvPad(small, padded, b); });
}

}  // namespace bench
