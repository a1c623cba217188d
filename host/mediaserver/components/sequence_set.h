// The sequence parameter set of H.264, as far as the components need it: what a decoder has to know about
// picture order before the first picture, and the profile that an encoder declares. Pure functions.
#pragma once

#include <cstdint>
#include <optional>

#include "host/mediaserver/components/annex_b.h"

namespace mediaserver {

enum ProfileIdc : int {
  kProfileBaseline = 66,
  kProfileMain = 77,
  kProfileHigh = 100,
};

struct SequenceSet {
  int profileIdc = 0;
  int levelIdc = 0;
  uint32_t referenceFrames = 0;
  uint32_t pictureOrderType = 0;
  uint32_t macroblocks = 0;  // of a frame
  // How many pictures can come before one that is displayed earlier, where the stream says so.
  std::optional<uint32_t> reorderFrames = std::nullopt;

  bool operator==(const SequenceSet&) const = default;
};

// `nal` without start code. Nothing for one that is damaged.
std::optional<SequenceSet> readSequenceSet(Bytes nal);

// How many pictures a decoder has to hold back for their display order. What the stream says counts; where it
// says nothing, only the level limits it. Baseline has no B pictures, and order type 2 knows no other order.
uint32_t reorderDepth(const SequenceSet& set);

// Appends the set with its start code, and with `profileIdc` declared where the set declares a lower one.
// Encoders declare the least profile that their tools need; clients expect the one that they asked for.
// The streams of a lower one of these profiles (without its rarities, which nobody makes) belong to the
// higher.
void appendSequenceSet(Bytes nal, int profileIdc, std::vector<uint8_t>* stream);

}  // namespace mediaserver
