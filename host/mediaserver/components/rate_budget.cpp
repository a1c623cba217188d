#include "host/mediaserver/components/rate_budget.h"

#include <algorithm>

namespace mediaserver {

namespace {

constexpr double kSettlingTime = 1.0;    // seconds after a change
constexpr double kSettlingBuffer = 0.1;  // seconds
constexpr double kLeastPictures = 2.0;   // in a buffer; below, every picture has to fill it exactly
constexpr double kRepayment = 0.5;       // seconds in which what was saved is given out again
constexpr double kMostSaved = 0.25;      // seconds' worth: older sins are forgotten
constexpr double kLargestFactor = 1.5;   // between what is asked and the rate itself
constexpr double kLeastRequest = 1000;   // bits per second: the library counts in thousands
constexpr double kLargestRequest = 4e8;  // ... and keeps its products in words

}  // namespace

void RateBudget::set(double bitsPerSecond, double framesPerSecond) {
  if (bitsPerSecond == _bitsPerSecond && framesPerSecond == _framesPerSecond) return;
  // The library opens with the first rates, and has nothing to forget.
  if (_bitsPerSecond > 0) _settling = kSettlingTime;
  _bitsPerSecond = bitsPerSecond;
  _framesPerSecond = framesPerSecond;
  _saved = 0;
}

RateBudget::Request RateBudget::next() const {
  const double wanted = std::clamp(_bitsPerSecond + _saved / kRepayment, _bitsPerSecond / kLargestFactor,
                                   _bitsPerSecond * kLargestFactor);
  const double seconds =
      std::max(_settling > 0 ? kSettlingBuffer : _buffered, kLeastPictures / _framesPerSecond);
  return {std::clamp(wanted * _openedAt / _framesPerSecond, kLeastRequest, kLargestRequest),
          std::clamp(_bitsPerSecond * seconds, kLeastRequest, kLargestRequest)};
}

void RateBudget::spent(double bits) {
  const double most = kMostSaved * _bitsPerSecond;
  _saved = std::clamp(_saved + _bitsPerSecond / _framesPerSecond - bits, -most, most);
  _settling = std::max(0.0, _settling - 1 / _framesPerSecond);
}

}  // namespace mediaserver
