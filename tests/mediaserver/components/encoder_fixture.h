#pragma once
// An encoder component at work: pictures in, access units out, and what they are.

#include <cstdint>
#include <optional>
#include <vector>

#include <OMX_Video.h>

#include "host/mediaserver/components/sequence_set.h"
#include "tests/mediaserver/components/component_client.h"

namespace componenttest {

class EncoderRun : public ComponentClient {
 public:
  explicit EncoderRun(const char* device) : ComponentClient(device, Kind::Encoder) {}

  // Both ports, as wrappers do it.
  void setSize(uint32_t width, uint32_t height, uint32_t framesPerSecond = 25);
  void setBitRate(uint32_t bitsPerSecond, OMX_VIDEO_CONTROLRATETYPE mode = OMX_Video_ControlRateVariable);
  // Changes the AVC record as it is.
  android::status_t setAvc(const std::function<void(OMX_VIDEO_PARAM_AVCTYPE&)>& change);
  OMX_VIDEO_PARAM_AVCTYPE avc();

  // Configurations, on the port that wrappers use.
  android::status_t changeBitRate(uint32_t bitsPerSecond);
  android::status_t changeFrameRate(uint32_t framesPerSecond);
  android::status_t requestKey();
  android::status_t rotate(int32_t degrees);

  // One picture in the device's layout, and its access unit.
  Output& encode(const Picture& picture);
  // Pictures of the scene from where it was.
  void encodeScene(uint32_t width, uint32_t height, uint32_t count);

  // Where in the outputs the key frames are, by their flags.
  std::vector<size_t> keyFrames() const;
  std::vector<Unit> units() const;
  // In bits, of outputs from `first` on.
  double bits(size_t first, size_t count) const;

 private:
  uint32_t _next = 0;
};

// The first sequence set in an access unit.
std::optional<mediaserver::SequenceSet> sequenceSet(const std::vector<uint8_t>& unit);
// The types of an access unit's NAL units.
std::vector<unsigned> nalTypes(const std::vector<uint8_t>& unit);

}  // namespace componenttest
