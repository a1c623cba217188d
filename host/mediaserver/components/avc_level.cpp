#include "host/mediaserver/components/avc_level.h"

#include <algorithm>
#include <iterator>

#include <OMX_Video.h>

namespace mediaserver {

namespace {

constexpr uint32_t kMostFrames = 16;

struct Level {
  OMX_VIDEO_AVCLEVELTYPE omx;
  int idc;
  uint32_t macroblocksPerSecond;
  uint32_t macroblocksPerFrame;
  uint32_t macroblocksKept;  // in the decoded picture buffer
  uint32_t kilobits;         // per second
};

constexpr Level kLevels[] = {
    {OMX_VIDEO_AVCLevel1, 10, 1485, 99, 396, 64},
    {OMX_VIDEO_AVCLevel11, 11, 3000, 396, 900, 192},
    {OMX_VIDEO_AVCLevel12, 12, 6000, 396, 2376, 384},
    {OMX_VIDEO_AVCLevel13, 13, 11880, 396, 2376, 768},
    {OMX_VIDEO_AVCLevel2, 20, 11880, 396, 2376, 2000},
    {OMX_VIDEO_AVCLevel21, 21, 19800, 792, 4752, 4000},
    {OMX_VIDEO_AVCLevel22, 22, 20250, 1620, 8100, 4000},
    {OMX_VIDEO_AVCLevel3, 30, 40500, 1620, 8100, 10000},
    {OMX_VIDEO_AVCLevel31, 31, 108000, 3600, 18000, 14000},
    {OMX_VIDEO_AVCLevel32, 32, 216000, 5120, 20480, 20000},
    {OMX_VIDEO_AVCLevel4, 40, 245760, 8192, 32768, 20000},
    {OMX_VIDEO_AVCLevel41, 41, 245760, 8192, 32768, 50000},
    {OMX_VIDEO_AVCLevel42, 42, 522240, 8704, 34816, 50000},
    {OMX_VIDEO_AVCLevel5, 50, 589824, 22080, 110400, 135000},
    {OMX_VIDEO_AVCLevel51, 51, 983040, 36864, 184320, 240000},
};

bool holds(const Level& level, const StreamNeeds& needs) {
  const uint32_t columns = (needs.width + 15) / 16;
  const uint32_t rows = (needs.height + 15) / 16;
  const uint32_t frame = columns * rows;
  // Neither side may be longer than the square root of eight times the largest frame.
  const uint64_t longest = std::max(columns, rows);
  const uint64_t kilobits = needs.high ? level.kilobits * 5 / 4 : level.kilobits;
  return frame <= level.macroblocksPerFrame && longest * longest <= uint64_t{8} * level.macroblocksPerFrame &&
         frame * needs.framesPerSecond <= level.macroblocksPerSecond &&
         uint64_t{frame} * needs.referenceFrames <= level.macroblocksKept && needs.bitRate <= kilobits * 1000;
}

}  // namespace

int levelFor(const StreamNeeds& needs, int atLeast) {
  const auto* const found = std::find_if(std::begin(kLevels), std::end(kLevels), [&](const Level& level) {
    return level.idc >= atLeast && holds(level, needs);
  });
  return found != std::end(kLevels) ? found->idc : std::prev(std::end(kLevels))->idc;
}

int levelIdc(uint32_t level) {
  if (level == OMX_VIDEO_AVCLevel1b) level = OMX_VIDEO_AVCLevel11;
  const auto* const found = std::find_if(std::begin(kLevels), std::end(kLevels),
                                         [&](const Level& each) { return each.omx == level; });
  return found != std::end(kLevels) ? found->idc : 0;
}

uint32_t decodedPictureBuffer(int idc, uint32_t macroblocks) {
  const auto* const found = std::find_if(std::begin(kLevels), std::end(kLevels),
                                         [&](const Level& level) { return level.idc == idc; });
  if (found == std::end(kLevels) || macroblocks == 0) return kMostFrames;
  return std::min(found->macroblocksKept / macroblocks, kMostFrames);
}

}  // namespace mediaserver
