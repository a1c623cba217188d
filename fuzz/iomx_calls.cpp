// The components of every device under random sequences of IOMX calls: unknown ids, wrong sizes and states,
// buffers sent twice, records of any content. Whatever a client does, the server answers, and a node that has
// been freed is silent.
#include <fuzzer/FuzzedDataProvider.h>

#include <algorithm>
#include <array>
#include <atomic>
#include <chrono>
#include <condition_variable>
#include <cstdint>
#include <cstdlib>
#include <mutex>
#include <string>
#include <vector>

#include <binder/MemoryDealer.h>
#include <media/IOMX.h>
#include <omxhost/device.h>
#include <omxhost/log.h>

#include "host/mediaserver/codec.h"
#include "host/mediaserver/components/component_list.h"
#include "host/mediaserver/components/vendor_records.h"
#include "host/mediaserver/omx_server.h"

namespace {

using android::IOMX;
using android::sp;
using mediaserver::kPortCount;

constexpr int kMostCalls = 200;
constexpr size_t kLargestBlock = 8 << 20;
// Enough for a component's answer; nothing depends on it.
constexpr std::chrono::milliseconds kPatience{20};

void require(bool holds) {
  if (!holds) std::abort();
}

class Observer : public android::BnOMXObserver {
 public:
  void onMessage(const android::omx_message& /*message*/) override {
    const std::lock_guard<std::mutex> lock(_mutex);
    require(!_silent);
    ++_heard;
    _changed.notify_all();
  }
  void waitForMore() {
    std::unique_lock<std::mutex> lock(_mutex);
    _changed.wait_for(lock, kPatience, [this] { return _heard > _seen; });
    _seen = _heard;
  }
  // Its node is gone: no message may come any more.
  void silence() {
    const std::lock_guard<std::mutex> lock(_mutex);
    _silent = true;
  }

 private:
  std::mutex _mutex;
  std::condition_variable _changed;
  uint64_t _heard = 0;
  uint64_t _seen = 0;
  bool _silent = false;
};

constexpr OMX_INDEXTYPE kIndices[] = {
    OMX_IndexParamPortDefinition,
    OMX_IndexParamVideoPortFormat,
    OMX_IndexParamVideoInit,
    OMX_IndexParamCompBufferSupplier,
    OMX_IndexParamStandardComponentRole,
    OMX_IndexParamVideoAvc,
    OMX_IndexParamVideoBitrate,
    OMX_IndexParamVideoProfileLevelCurrent,
    OMX_IndexParamVideoProfileLevelQuerySupported,
    OMX_IndexParamVideoQuantization,
    OMX_IndexParamVideoErrorCorrection,
    OMX_IndexParamVideoIntraRefresh,
    OMX_IndexConfigVideoBitrate,
    OMX_IndexConfigVideoFramerate,
    OMX_IndexConfigVideoIntraVOPRefresh,
    OMX_IndexConfigVideoAVCIntraPeriod,
    OMX_IndexConfigCommonRotate,
    OMX_IndexConfigCommonOutputCrop,
    mediaserver::kQcomPortDefinitionIndex,
    mediaserver::kQcomIntraPeriodIndex,
    mediaserver::kQcomPictureOrderIndex,
    mediaserver::kStoreMetaDataIndex,
};

struct Given {
  IOMX::buffer_id id;
  sp<android::IMemory> block;  // null: the component's
  uint8_t* bytes;
  size_t size;
};

// A client with one node, which it may not have yet or any more.
class Client {
 public:
  Client(const sp<IOMX>& omx, const omxhost::Device& device, FuzzedDataProvider& data)
      : _omx(omx), _device(device), _data(data) {}
  ~Client() { freeNode(); }
  Client(const Client&) = delete;
  Client& operator=(const Client&) = delete;

  void act() {
    using Act = void (Client::*)();
    static constexpr Act kActs[] = {
        &Client::allocateNode, &Client::freeSometimes, &Client::command,     &Client::command,
        &Client::start,        &Client::record,        &Client::record,      &Client::definePort,
        &Client::giveAny,      &Client::freeBuffer,    &Client::fillBuffer,  &Client::fillBuffer,
        &Client::emptyBuffer,  &Client::emptyBuffer,   &Client::waitForMore, &Client::oddCalls};
    (this->*_data.PickValueInArray(kActs))();
  }

 private:
  void allocateNode() {
    if (_observer != nullptr) return;
    const std::string other = _data.ConsumeRandomLengthString(24);
    const std::array<const char*, 4> names = {_device.decoderComponent, _device.encoderComponent,
                                              _device.encoderComponent, other.c_str()};
    _observer = new Observer;
    if (_omx->allocateNode(_data.PickValueInArray(names), _observer, &_node) != android::OK)
      _observer.clear();
  }

  void freeNode() {
    if (_observer == nullptr) return;
    require(_omx->freeNode(_node) == android::OK);
    _observer->silence();
    _observer.clear();
    require(_omx->freeNode(_node) != android::OK);
    for (auto& buffers : _buffers) buffers.clear();
  }

  void freeSometimes() {
    if (_data.ConsumeIntegralInRange(0, 3) == 0) freeNode();
  }

  void waitForMore() {
    if (_observer != nullptr) _observer->waitForMore();
  }

  OMX_U32 anyPort() { return _data.ConsumeIntegralInRange<OMX_U32>(0, kPortCount); }

  void command() {
    const int command = _data.ConsumeIntegralInRange(0, 5);
    const auto parameter = _data.ConsumeIntegralInRange(0, 15) == 0 ? _data.ConsumeIntegral<OMX_S32>()
                                                                    : _data.ConsumeIntegralInRange(-1, 6);
    static_cast<void>(_omx->sendCommand(_node, static_cast<OMX_COMMANDTYPE>(command), parameter));
  }

  mediaserver::PortDefinition definition(OMX_U32 port) {
    mediaserver::PortDefinition definition{};
    definition.nPortIndex = port;
    static_cast<void>(
        _omx->getParameter(_node, OMX_IndexParamPortDefinition, &definition, sizeof(definition)));
    return definition;
  }

  // As a decent client starts, from whatever state it is in.
  void start() {
    static_cast<void>(_omx->sendCommand(_node, OMX_CommandStateSet, OMX_StateIdle));
    for (OMX_U32 port = 0; port < kPortCount; ++port) {
      const mediaserver::PortDefinition wanted = definition(port);
      while (_buffers[port].size() < std::min<size_t>(wanted.nBufferCountActual, 32)) {
        const size_t before = _buffers[port].size();
        give(port, wanted.nBufferSize);
        if (_buffers[port].size() == before) break;
      }
    }
    waitForMore();
    static_cast<void>(_omx->sendCommand(_node, OMX_CommandStateSet, OMX_StateExecuting));
    waitForMore();
    for (const Given& buffer : _buffers[mediaserver::kOutputPort])
      static_cast<void>(_omx->fillBuffer(_node, buffer.id));
  }

  void record() {
    const OMX_INDEXTYPE index = _data.ConsumeIntegralInRange(0, 15) == 0
                                    ? static_cast<OMX_INDEXTYPE>(_data.ConsumeIntegral<uint32_t>())
                                    : _data.PickValueInArray(kIndices);
    const int call = _data.ConsumeIntegralInRange(0, 3);
    std::vector<uint8_t> bytes = _data.ConsumeBytes<uint8_t>(_data.ConsumeIntegralInRange<size_t>(0, 256));
    bytes.shrink_to_fit();
    void* const memory = bytes.empty() ? nullptr : bytes.data();
    if (call == 0) static_cast<void>(_omx->getParameter(_node, index, memory, bytes.size()));
    if (call == 1) static_cast<void>(_omx->setParameter(_node, index, memory, bytes.size()));
    if (call == 2) static_cast<void>(_omx->getConfig(_node, index, memory, bytes.size()));
    if (call == 3) static_cast<void>(_omx->setConfig(_node, index, memory, bytes.size()));
  }

  void definePort() {
    mediaserver::PortDefinition wanted = definition(anyPort());
    auto& video = wanted.format.video;
    OMX_U32* const words[] = {
        &wanted.nBufferCountActual, &wanted.nBufferSize, &video.nFrameWidth, &video.nFrameHeight,
        &video.nSliceHeight,        &video.xFramerate,   &video.nBitrate};
    *_data.PickValueInArray(words) = _data.ConsumeBool() ? _data.ConsumeIntegralInRange<OMX_U32>(0, 400)
                                                         : _data.ConsumeIntegral<OMX_U32>();
    if (_data.ConsumeBool()) video.eCompressionFormat = static_cast<OMX_VIDEO_CODINGTYPE>(anyPort() * 3);
    static_cast<void>(_omx->setParameter(_node, OMX_IndexParamPortDefinition, &wanted, sizeof(wanted)));
  }

  // `size` 0: any.
  void give(OMX_U32 port, size_t size) {
    const int how = _data.ConsumeIntegralInRange(0, 2);
    if (size == 0) size = _data.ConsumeIntegralInRange<size_t>(0, 1 << 18);
    if (size > kLargestBlock) return;
    Given given{nullptr, nullptr, nullptr, size};
    android::status_t status = android::OK;
    if (how == 0) {
      void* bytes = nullptr;
      status = _omx->allocateBuffer(_node, port, size, &given.id, &bytes);
      given.bytes = static_cast<uint8_t*>(bytes);
    } else {
      const sp<android::MemoryDealer> dealer = new android::MemoryDealer(size, "fuzz");
      given.block = dealer->allocate(size);
      if (given.block == nullptr) return;
      given.bytes = static_cast<uint8_t*>(given.block->pointer());
      status = how == 1 ? _omx->useBuffer(_node, port, given.block, &given.id)
                        : _omx->allocateBufferWithBackup(_node, port, given.block, &given.id);
    }
    if (status == android::OK) _buffers.at(port).push_back(given);
  }

  void giveAny() { give(anyPort(), 0); }

  // One of the client's own, mostly.
  Given anyBuffer() {
    const auto& buffers = _buffers[_data.ConsumeIntegralInRange<size_t>(0, kPortCount - 1)];
    if (buffers.empty() || _data.ConsumeIntegralInRange(0, 15) == 0)
      return {reinterpret_cast<IOMX::buffer_id>(_data.ConsumeIntegralInRange<uintptr_t>(0, 1000)), nullptr,
              nullptr, 0};
    return buffers[_data.ConsumeIntegralInRange<size_t>(0, buffers.size() - 1)];
  }

  void fillBuffer() { static_cast<void>(_omx->fillBuffer(_node, anyBuffer().id)); }

  void freeBuffer() {
    const OMX_U32 port = anyPort();
    const Given chosen = anyBuffer();
    if (_omx->freeBuffer(_node, port, chosen.id) != android::OK) return;
    std::erase_if(_buffers.at(port), [&](const Given& given) { return given.id == chosen.id; });
  }

  void emptyBuffer() {
    const Given chosen = anyBuffer();
    const bool fits = _data.ConsumeIntegralInRange(0, 7) != 0;
    auto offset = _data.ConsumeIntegral<OMX_U32>();
    auto length = _data.ConsumeIntegral<OMX_U32>();
    if (fits) {
      offset = 0;
      length = static_cast<OMX_U32>(_data.ConsumeBool() ? chosen.size : length % (chosen.size + 1));
    }
    // Not while the component may read it.
    if (chosen.block != nullptr && _data.ConsumeBool()) {
      const std::vector<uint8_t> bytes =
          _data.ConsumeBytes<uint8_t>(_data.ConsumeIntegralInRange<size_t>(0, 4096));
      std::copy_n(bytes.begin(), std::min(bytes.size(), chosen.size), chosen.bytes);
    }
    const auto flags = _data.ConsumeIntegralInRange(0, 3) == 0 ? _data.ConsumeIntegral<OMX_U32>()
                                                               : OMX_U32{OMX_BUFFERFLAG_ENDOFFRAME};
    static_cast<void>(
        _omx->emptyBuffer(_node, chosen.id, offset, length, flags, _data.ConsumeIntegral<int16_t>()));
  }

  void oddCalls() {
    OMX_STATETYPE state = OMX_StateInvalid;
    OMX_INDEXTYPE index{};
    OMX_U32 word = 0;
    const OMX_BOOL enable = _data.ConsumeBool() ? OMX_TRUE : OMX_FALSE;
    static_cast<void>(_omx->getState(_node, &state));
    static_cast<void>(_omx->getState(_node, nullptr));
    static_cast<void>(_omx->storeMetaDataInBuffers(_node, anyPort(), enable));
    static_cast<void>(_omx->enableGraphicBuffers(_node, anyPort(), enable));
    static_cast<void>(_omx->getGraphicBufferUsage(_node, anyPort(), &word));
    static_cast<void>(_omx->useBuffer(_node, anyPort(), nullptr, nullptr));
    static_cast<void>(_omx->getExtensionIndex(_node, _data.ConsumeRandomLengthString(64).c_str(), &index));
  }

  const sp<IOMX> _omx;
  const omxhost::Device& _device;
  FuzzedDataProvider& _data;
  sp<Observer> _observer;
  IOMX::node_id _node = nullptr;
  std::array<std::vector<Given>, kPortCount + 1> _buffers;  // the last: of a port that is not there
};

}  // namespace

extern "C" int LLVMFuzzerTestOneInput(const uint8_t* bytes, size_t size);
extern "C" int LLVMFuzzerTestOneInput(const uint8_t* bytes, size_t size) {
  static const omxhost::LogCapture silence;
  FuzzedDataProvider data(bytes, size);
  std::vector<const omxhost::Device*> devices;
  for (const omxhost::Device& device : omxhost::devices())
    if (device.encoderComponent != nullptr) devices.push_back(&device);
  const omxhost::Device& device = *devices[data.ConsumeIntegralInRange<size_t>(0, devices.size() - 1)];
  const sp<IOMX> omx = new mediaserver::OmxServer(mediaserver::componentsOf(device));
  Client first(omx, device, data);
  Client second(omx, device, data);
  for (int i = 0; i < kMostCalls && data.remaining_bytes() > 0; ++i)
    (data.ConsumeIntegralInRange(0, 7) == 0 ? second : first).act();
  return 0;
}
