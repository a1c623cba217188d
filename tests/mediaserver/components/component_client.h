#pragma once
// A client that drives one of a device's components through IOMX the way our sessions do: buffers go round,
// new output settings are answered by new buffers. One test thread. Waits have a limit; what goes wrong is
// the test's failure.

#include <cstdint>
#include <functional>
#include <string>
#include <vector>

#include <omxhost/device.h>

#include "host/mediaserver/codec.h"
#include "host/mediaserver/omx_server.h"
#include "tests/mediaserver/components/pictures.h"
#include "tests/mediaserver/components/reference_codec.h"
#include "tests/support/omx_client.h"

namespace componenttest {

enum class Kind { Decoder, Encoder };

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

class ComponentClient {
 public:
  ComponentClient(const char* device, Kind kind);

  omxtest::OmxClient& node() { return *_node; }
  const omxhost::Device& device() const { return *_device; }
  bool isTi() const { return _device->components.vendor == omxhost::Vendor::Ti; }

  // Records. The index and what it takes are the caller's business.
  template <typename T>
  android::status_t get(OMX_INDEXTYPE index, T* record) {
    return _node->omx()->getParameter(_node->node(), index, record, sizeof(T));
  }
  template <typename T>
  android::status_t set(OMX_INDEXTYPE index, const T& record) {
    return _node->omx()->setParameter(_node->node(), index, &record, sizeof(T));
  }
  template <typename T>
  android::status_t getConfig(OMX_INDEXTYPE index, T* record) {
    return _node->omx()->getConfig(_node->node(), index, record, sizeof(T));
  }
  template <typename T>
  android::status_t setConfig(OMX_INDEXTYPE index, const T& record) {
    return _node->omx()->setConfig(_node->node(), index, &record, sizeof(T));
  }

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
  // Handles messages until the condition holds.
  void await(const std::function<bool()>& condition);

  // Outputs with bytes.
  std::vector<Output>& outputs() { return _outputs; }
  const std::vector<Output>& outputs() const { return _outputs; }
  std::vector<std::string> errors() const { return _errors; }
  size_t reconfigurations() const { return _reconfigurations; }
  bool ended() const { return _ended; }

  // A decoder's outputs as pictures.
  std::vector<Decoded> pictures() const;

 private:
  bool handleNext();
  void onEvent(OMX_U32 event, OMX_U32 data1, OMX_U32 data2);
  void onFilled(const android::omx_message& message);
  size_t indexOf(OMX_U32 port, android::IOMX::buffer_id id) const;

  const omxhost::Device* const _device;
  const omxhost::PictureLayout _layout;
  android::sp<mediaserver::OmxServer> _server;
  std::unique_ptr<omxtest::OmxClient> _node;
  size_t _handled = 0;  // messages
  std::vector<bool> _inputFree;
  size_t _outputsOut = 0;  // with the component
  bool _reconfiguring = false;
  bool _ending = false;
  bool _ended = false;
  std::vector<Output> _outputs;
  std::vector<std::string> _errors;
  size_t _reconfigurations = 0;
};

}  // namespace componenttest
