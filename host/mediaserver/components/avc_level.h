// The levels of H.264: what pictures, rates and reference frames each holds. Pure arithmetic on a table.
#pragma once

#include <cstdint>

namespace mediaserver {

// What a stream asks of a level.
struct StreamNeeds {
  uint32_t width;  // pixels
  uint32_t height;
  double framesPerSecond;
  uint32_t bitRate;  // bits per second
  uint32_t referenceFrames;
  bool high;  // High profile: a quarter more bits per level
};

// The lowest level_idc, `atLeast` or above, that holds the stream; the highest there is when none does.
int levelFor(const StreamNeeds& needs, int atLeast);

// The level_idc of an OMX_VIDEO_AVCLEVELTYPE, or 0. Level 1b counts as 1.1: the two differ in a detail of the
// bit rate.
int levelIdc(uint32_t level);

// How many frames a decoder of that level keeps for pictures of that many macroblocks; at most 16, also for
// levels that nobody knows.
uint32_t decodedPictureBuffer(int levelIdc, uint32_t macroblocks);

inline uint32_t macroblocks(uint32_t width, uint32_t height) {
  return ((width + 15) / 16) * ((height + 15) / 16);
}

}  // namespace mediaserver
