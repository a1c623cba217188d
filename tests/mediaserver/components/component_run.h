#pragma once
// A device's decoder or encoder component at work, driven through IOMX the way our sessions do it: buffers go
// round, new output settings are answered by new buffers. One test thread. Waits have a limit; what goes
// wrong is the test's failure.

#include <gtest/gtest.h>

#include <cstdint>
#include <functional>
#include <string>
#include <type_traits>
#include <vector>

#include <omxhost/device.h>

#include "host/mediaserver/components/sequence_set.h"
#include "host/mediaserver/components/vendor_records.h"
#include "host/mediaserver/omx_server.h"
#include "tests/mediaserver/components/reference_codec.h"
#include "tests/support/omx_client.h"

namespace componenttest {

using mediaserver::kInputPort;
using mediaserver::kOutputPort;
using mediaserver::QcomOrder;
using mediaserver::QcomPacking;
using omxtest::kOk;
using omxtest::kUnknownError;
using omxtest::kUnsupported;
using omxtest::makeRecord;
using Errors = std::vector<std::string>;
using NalTypes = std::vector<unsigned>;

// Those that have components.
constexpr const char* kDevices[] = {"msm7x30", "msm8x55", "msm8x60", "msm8960", "omap4", "msm-unknown"};

// A filled output buffer, with the port and the rectangle as the client reads them when it gets it.
struct Output : Unit {
  OMX_U32 flags;
  mediaserver::PortDefinition definition;
  OMX_CONFIG_RECTTYPE crop;
};

class ComponentRun : public omxtest::OmxClient {
 public:
  ComponentRun(const omxhost::Device& device, const char* component, omxtest::Giving output);

  const omxhost::ComponentTraits& traits() const { return _traits; }
  bool isTi() const { return _traits.vendor == omxhost::Vendor::Ti; }

  // Defines a port's pictures; rate 0: as it is.
  android::status_t resize(OMX_U32 port, uint32_t width, uint32_t height, uint32_t framesPerSecond = 0);

  // Executing, with all output buffers given.
  void start();
  // Waits for a free input buffer.
  void send(const std::vector<uint8_t>& bytes, int64_t timestamp, OMX_U32 flags = OMX_BUFFERFLAG_ENDOFFRAME);
  // Sends the end mark and waits until it comes out.
  void finish();
  // Lets the component work until `count` outputs have come.
  void awaitOutputs(size_t count) {
    await([&] { return outputs.size() >= count; });
  }
  void awaitEnd() {
    await([this] { return _ended; });
  }

  std::vector<Output> outputs;  // those with bytes
  Errors errors;
  size_t reconfigurations = 0;

 private:
  void await(const std::function<bool()>& condition);
  bool handleNext();
  void onEvent(const android::omx_message& message);
  void onFilled(const android::omx_message& message);
  size_t indexOf(OMX_U32 port, android::IOMX::buffer_id id) const;

  const omxhost::ComponentTraits& _traits;
  size_t _handled = 0;  // messages
  std::vector<bool> _inputFree;
  size_t _outputsOut = 0;  // with the component
  bool _reconfiguring = false;
  bool _ending = false;
  bool _ended = false;
};

class DecoderRun : public ComponentRun {
 public:
  explicit DecoderRun(const char* device)
      : ComponentRun(*omxhost::findDevice(device), omxhost::findDevice(device)->decoderComponent,
                     omxtest::Giving::Backup) {}
  DecoderRun(const char* device, QcomOrder order) : DecoderRun(device) { EXPECT_EQ(setOrder(order), kOk); }

  android::status_t setOrder(QcomOrder order) {
    auto record = makeRecord<mediaserver::QcomPictureOrder>(kInputPort);
    record.eOutputPictureOrder = static_cast<OMX_U32>(order);
    return set(mediaserver::kQcomPictureOrderIndex, record);
  }
  android::status_t setPacking(QcomPacking packing) {
    auto record = makeRecord<mediaserver::QcomPortDefinition>(kInputPort);
    record.nFramePackingFormat = static_cast<OMX_U32>(packing);
    return set(mediaserver::kQcomPortDefinitionIndex, record);
  }
  // 0: the size stays.
  void setInput(OMX_VIDEO_CODINGTYPE coding, uint32_t width = 0, uint32_t height = 0);
  // One buffer a unit.
  void sendAll(const std::vector<Unit>& units) {
    for (const Unit& unit : units) send(unit.bytes, unit.timestamp);
  }
  // A whole life with these units.
  void run(const std::vector<Unit>& units) {
    start();
    sendAll(units);
    finish();
  }
  // The outputs.
  std::vector<Decoded> pictures() const;
};

class EncoderRun : public ComponentRun {
 public:
  explicit EncoderRun(const char* device)
      : ComponentRun(*omxhost::findDevice(device), omxhost::findDevice(device)->encoderComponent,
                     omxtest::Giving::Use) {}
  // Both ports have that size, as wrappers do it.
  EncoderRun(const char* device, uint32_t width, uint32_t height, uint32_t framesPerSecond = 25)
      : EncoderRun(device) {
    for (const OMX_U32 port : {kInputPort, kOutputPort})
      EXPECT_EQ(resize(port, width, height, framesPerSecond), kOk);
  }
  void setBitRate(uint32_t bitsPerSecond) {
    auto record = makeRecord<OMX_VIDEO_PARAM_BITRATETYPE>(kOutputPort);
    record.eControlRate = OMX_Video_ControlRateVariable;
    record.nTargetBitrate = bitsPerSecond;
    EXPECT_EQ(set(OMX_IndexParamVideoBitrate, record), kOk);
  }
  OMX_VIDEO_PARAM_AVCTYPE avc() {
    auto record = makeRecord<OMX_VIDEO_PARAM_AVCTYPE>(kOutputPort);
    EXPECT_EQ(get(OMX_IndexParamVideoAvc, &record), kOk);
    return record;
  }
  // Changes the record as it is.
  android::status_t setAvc(const std::function<void(OMX_VIDEO_PARAM_AVCTYPE&)>& change) {
    OMX_VIDEO_PARAM_AVCTYPE record = avc();
    change(record);
    return set(OMX_IndexParamVideoAvc, record);
  }

  // Configurations, on the port that wrappers use.
  template <typename Record, typename Value>
  android::status_t change(OMX_INDEXTYPE index, Value Record::*field, std::type_identity_t<Value> value) {
    Record record = makeRecord<Record>(kOutputPort);
    record.*field = value;
    return setConfig(index, record);
  }
  android::status_t rotate(int32_t degrees) {
    return change(OMX_IndexConfigCommonRotate, &OMX_CONFIG_ROTATIONTYPE::nRotation, degrees);
  }

  // One picture in the device's layout, and its access unit.
  Output& encode(const Picture& picture);
  // Pictures of the scene from where it was.
  void encodeScene(uint32_t width, uint32_t height, uint32_t count) {
    for (uint32_t i = 0; i < count; ++i) encode(scene(width, height, _next++));
  }

  // Where in the outputs the key frames are, by their flags.
  std::vector<size_t> keyFrames() const {
    std::vector<size_t> found;
    for (size_t i = 0; i < outputs.size(); ++i) {
      if ((outputs[i].flags & OMX_BUFFERFLAG_SYNCFRAME) != 0) found.push_back(i);
    }
    return found;
  }
  std::vector<Unit> units() const { return {outputs.begin(), outputs.end()}; }

 private:
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
