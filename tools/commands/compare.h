// How much the pictures of two files differ, one by one and in the mean.
#pragma once

#include <stdint.h>

#include <stop_token>
#include <string>
#include <vector>

#include "tools/files/frame_source.h"

namespace tool {

struct PictureDifference {
  double psnrY = 0;  // dB
  double psnrU = 0;
  double psnrV = 0;
  double ssimY = 0;
};

struct CompareReport {
  std::vector<PictureDifference> pictures;
  PictureDifference mean;
  uint64_t surplusOne = 0;  // pictures that the other file has no partner for
  uint64_t surplusOther = 0;
  Outcome inputFailure;  // an input broke off; what there was is compared
};

// `enough` ends it early, as in runCall(). Fails where the sizes differ.
Result<CompareReport> runCompare(FrameSource& one, FrameSource& other, std::stop_source& enough);

// `perPicture`: a line for each picture before the mean.
std::string compareSummary(const CompareReport& report, bool perPicture);
std::string compareJson(const CompareReport& report, bool interrupted);

}  // namespace tool
