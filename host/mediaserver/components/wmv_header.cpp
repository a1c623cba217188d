#include "host/mediaserver/components/wmv_header.h"

#include <algorithm>
#include <iterator>

namespace mediaserver {

namespace {

constexpr uint8_t kSequenceStart[] = {0, 0, 1, 0x0F};
constexpr uint8_t kFrameStart[] = {0, 0, 1, 0x0D};
constexpr size_t kSequenceBytes = 4;

// The header of an RCV file: a count of frames and a mark, the sequence header with its size in front, the
// picture's size, and more that is of no use here.
constexpr size_t kRcvBytes = 36;
constexpr uint8_t kRcvMark = 0xC5;
constexpr size_t kRcvMarkAt = 3;
constexpr size_t kRcvSequenceSizeAt = 4;
constexpr size_t kRcvSequenceAt = 8;
constexpr size_t kRcvHeightAt = 12;
constexpr size_t kRcvWidthAt = 16;

uint32_t word(Bytes bytes, size_t at) {
  return bytes[at] | uint32_t{bytes[at + 1]} << 8 | uint32_t{bytes[at + 2]} << 16 |
         uint32_t{bytes[at + 3]} << 24;
}

}  // namespace

WmvHeader readWmvHeader(Bytes bytes, bool config, uint32_t width, uint32_t height) {
  WmvHeader header;
  if (bytes.size() >= std::size(kSequenceStart) &&
      std::equal(std::begin(kSequenceStart), std::end(kSequenceStart), bytes.begin())) {
    const auto end = std::search(bytes.begin(), bytes.end(), std::begin(kFrameStart), std::end(kFrameStart));
    header.known = header.advanced = true;
    header.extradata.assign(bytes.begin(), end);
  } else if (bytes.size() >= kRcvBytes && bytes[kRcvMarkAt] == kRcvMark &&
             word(bytes, kRcvSequenceSizeAt) == kSequenceBytes) {
    header.known = true;
    const Bytes sequence = bytes.subspan(kRcvSequenceAt, kSequenceBytes);
    header.extradata.assign(sequence.begin(), sequence.end());
    header.width = word(bytes, kRcvWidthAt);
    header.height = word(bytes, kRcvHeightAt);
    header.consumed = kRcvBytes;
  } else if (config && bytes.size() >= kSequenceBytes) {
    header.known = true;
    header.extradata.assign(bytes.begin(), bytes.end());
    header.width = width;
    header.height = height;
    header.consumed = bytes.size();
  }
  return header;
}

}  // namespace mediaserver
