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

#include <media/stagefright/MediaErrors.h>
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
using Options = std::map<std::string, std::string>;
using Errors = std::vector<std::string>;
using NalTypes = std::vector<unsigned>;

constexpr auto kOk = static_cast<android::status_t>(android::OK);
constexpr auto kUnknownError = static_cast<android::status_t>(android::UNKNOWN_ERROR);
constexpr auto kUnsupported = static_cast<android::status_t>(android::ERROR_UNSUPPORTED);

// Those that have components.
constexpr const char* kDevices[] = {"msm7x30", "msm8x55", "msm8x60", "msm8960", "omap4", "msm-unknown"};

// A filled output buffer, with the port and the rectangle as the client reads them when it gets it.
struct Output {
  std::vector<uint8_t> bytes;
  int64_t timestamp;
  OMX_U32 flags;
  mediaserver::PortDefinition definition;
  OMX_CONFIG_RECTTYPE crop;
};

template <typename T>
T makeRecord(OMX_U32 port) {
  T record{};
  record.nSize = sizeof(T);
  record.nVersion.s.nVersionMajor = 1;
  record.nVersion.s.nVersionMinor = 1;
  record.nPortIndex = port;
  return record;
}

class ComponentRun {
 public:
  ComponentRun(const omxhost::Device& device, const char* component, omxtest::Giving output);

  omxtest::OmxClient& node() { return _node; }
  const omxhost::ComponentTraits& traits() const { return _traits; }
  bool isTi() const { return _traits.vendor == omxhost::Vendor::Ti; }

  // Records. The index and what it takes are the caller's business.
  template <typename T>
  android::status_t get(OMX_INDEXTYPE index, T* record) {
    return _node.omx()->getParameter(_node.node(), index, record, sizeof(T));
  }
  template <typename T>
  android::status_t set(OMX_INDEXTYPE index, const T& record) {
    return _node.omx()->setParameter(_node.node(), index, &record, sizeof(T));
  }
  template <typename T>
  android::status_t getConfig(OMX_INDEXTYPE index, T* record) {
    return _node.omx()->getConfig(_node.node(), index, record, sizeof(T));
  }
  template <typename T>
  android::status_t setConfig(OMX_INDEXTYPE index, const T& record) {
    return _node.omx()->setConfig(_node.node(), index, &record, sizeof(T));
  }
  // Changes a port's video definition.
  using VideoEdit = std::function<void(OMX_VIDEO_PORTDEFINITIONTYPE&)>;
  android::status_t define(OMX_U32 port, const VideoEdit& edit);

  // Executing, with all output buffers given.
  void start();
  // Waits for a free input buffer.
  void send(const std::vector<uint8_t>& bytes, int64_t timestamp, OMX_U32 flags = OMX_BUFFERFLAG_ENDOFFRAME);
  // Sends the end mark and waits until it comes out.
  void finish();
  // Disables the input port, changes something, and enables it again with new buffers.
  void reopenInput(const std::function<void()>& change);
  // Lets the component work until `count` outputs have come.
  void awaitOutputs(size_t count);
  void awaitEnd();

  std::vector<Output> outputs;  // with bytes
  Errors errors;
  size_t reconfigurations = 0;

 private:
  void await(const std::function<bool()>& condition);
  bool handleNext();
  void onEvent(const android::omx_message& message);
  void onFilled(const android::omx_message& message);
  size_t indexOf(OMX_U32 port, android::IOMX::buffer_id id) const;

  const omxhost::ComponentTraits& _traits;
  omxtest::OmxClient _node;
  size_t _handled = 0;  // messages
  std::vector<bool> _inputFree;
  size_t _outputsOut = 0;  // with the component
  bool _reconfiguring = false;
  bool _ending = false;
  bool _ended = false;
};

class DecoderRun : public ComponentRun {
 public:
  explicit DecoderRun(const char* device);
  DecoderRun(const char* device, QcomOrder order) : DecoderRun(device) { EXPECT_EQ(setOrder(order), kOk); }

  android::status_t setOrder(QcomOrder order);
  android::status_t setPacking(QcomPacking packing);
  // 0: the size stays.
  void setInput(OMX_VIDEO_CODINGTYPE coding, uint32_t width = 0, uint32_t height = 0);
  // One buffer a unit.
  void sendAll(const std::vector<Unit>& units);
  // A whole life with these units.
  void run(const std::vector<Unit>& units);
  // The outputs.
  std::vector<Decoded> pictures() const;
};

class EncoderRun : public ComponentRun {
 public:
  explicit EncoderRun(const char* device);
  EncoderRun(const char* device, uint32_t width, uint32_t height, uint32_t framesPerSecond = 25)
      : EncoderRun(device) {
    setSize(width, height, framesPerSecond);
  }

  // Both ports, as wrappers do it.
  void setSize(uint32_t width, uint32_t height, uint32_t framesPerSecond = 25);
  void setBitRate(uint32_t bitsPerSecond);
  // Changes the AVC record as it is.
  android::status_t setAvc(const std::function<void(OMX_VIDEO_PARAM_AVCTYPE&)>& change);
  OMX_VIDEO_PARAM_AVCTYPE avc();

  // Configurations, on the port that wrappers use.
  template <typename Record, typename Value>
  android::status_t change(OMX_INDEXTYPE index, Value Record::*field, std::type_identity_t<Value> value,
                           OMX_U32 port = kOutputPort) {
    Record record = makeRecord<Record>(port);
    record.*field = value;
    return setConfig(index, record);
  }
  android::status_t changeBitRate(uint32_t bitsPerSecond) {
    return change(OMX_IndexConfigVideoBitrate, &OMX_VIDEO_CONFIG_BITRATETYPE::nEncodeBitrate, bitsPerSecond);
  }
  android::status_t requestKey() {
    const auto field = &OMX_CONFIG_INTRAREFRESHVOPTYPE::IntraRefreshVOP;
    return change(OMX_IndexConfigVideoIntraVOPRefresh, field, OMX_TRUE);
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
