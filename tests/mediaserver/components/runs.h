#pragma once
// A decoder and an encoder component at work, and what their tests have in common.

#include <gtest/gtest.h>

#include <cstdint>
#include <optional>
#include <type_traits>
#include <vector>

#include <media/stagefright/MediaErrors.h>

#include "host/mediaserver/components/sequence_set.h"
#include "host/mediaserver/components/vendor_records.h"
#include "tests/mediaserver/components/component_client.h"

namespace componenttest {

using mediaserver::kInputPort;
using mediaserver::kOutputPort;
using mediaserver::QcomOrder;
using mediaserver::QcomPacking;
using Options = std::map<std::string, std::string>;
using Errors = std::vector<std::string>;
using NalTypes = std::vector<unsigned>;

constexpr auto kUnknownError = static_cast<android::status_t>(android::UNKNOWN_ERROR);
constexpr auto kUnsupported = static_cast<android::status_t>(android::ERROR_UNSUPPORTED);

// Those that have components.
constexpr const char* kDevices[] = {"msm7x30", "msm8x55", "msm8x60", "msm8960", "omap4", "msm-unknown"};

class DecoderRun : public ComponentClient {
 public:
  explicit DecoderRun(const char* device) : ComponentClient(device, Kind::Decoder) {}
  DecoderRun(const char* device, QcomOrder order) : DecoderRun(device) {
    EXPECT_EQ(setOrder(order), android::OK);
  }

  android::status_t setOrder(QcomOrder order);
  android::status_t setPacking(QcomPacking packing);
  // 0: the size stays.
  void setInput(OMX_VIDEO_CODINGTYPE coding, uint32_t width = 0, uint32_t height = 0);
  // One buffer a unit.
  void sendAll(const std::vector<Unit>& units);
};

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
  android::status_t changeBitRate(uint32_t bitsPerSecond) {
    return change(OMX_IndexConfigVideoBitrate, &OMX_VIDEO_CONFIG_BITRATETYPE::nEncodeBitrate, bitsPerSecond);
  }
  android::status_t changeFrameRate(uint32_t framesPerSecond) {
    return change(OMX_IndexConfigVideoFramerate, &OMX_CONFIG_FRAMERATETYPE::xEncodeFramerate,
                  framesPerSecond << 16, isTi() ? kInputPort : kOutputPort);
  }
  android::status_t requestKey() {
    return change(OMX_IndexConfigVideoIntraVOPRefresh, &OMX_CONFIG_INTRAREFRESHVOPTYPE::IntraRefreshVOP,
                  OMX_TRUE);
  }
  android::status_t rotate(int32_t degrees) {
    return change(OMX_IndexConfigCommonRotate, &OMX_CONFIG_ROTATIONTYPE::nRotation, degrees);
  }

  // One picture in the device's layout, and its access unit.
  Output& encode(const Picture& picture);
  // Pictures of the scene from where it was.
  void encodeScene(uint32_t width, uint32_t height, uint32_t count);

  // Where in the outputs the key frames are, by their flags.
  std::vector<size_t> keyFrames() const;
  std::vector<Unit> units() const;
  // Of `count` outputs from `first` on.
  double bits(size_t first, size_t count) const;

 private:
  template <typename Record, typename Value>
  android::status_t change(OMX_INDEXTYPE index, Value Record::*field, std::type_identity_t<Value> value,
                           OMX_U32 port = kOutputPort) {
    Record record = makeRecord<Record>(port);
    record.*field = value;
    return setConfig(index, record);
  }

  uint32_t _next = 0;
};

// Size, bytes and, unless told otherwise, time stamp of every picture.
void expectSame(const std::vector<Decoded>& got, const std::vector<Decoded>& wanted, bool timed = true);

// A stream's NAL units.
std::vector<std::vector<uint8_t>> nals(const std::vector<uint8_t>& stream);
NalTypes nalTypes(const std::vector<uint8_t>& unit);
// The first sequence set in an access unit; a stream without one is the test's failure.
mediaserver::SequenceSet sequenceSet(const std::vector<uint8_t>& unit);

}  // namespace componenttest
