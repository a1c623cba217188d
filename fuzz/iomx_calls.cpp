// The components of every device under random sequences of IOMX calls: unknown ids, wrong sizes and states,
// buffers sent twice, records of any content. Whatever a client does, the server answers, and a node that has
// been freed is silent.
#include <fuzzer/FuzzedDataProvider.h>

#include <algorithm>
#include <array>
#include <atomic>
#include <chrono>
#include <cstdint>
#include <cstdlib>
#include <string>
#include <thread>
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
constexpr int kPatience = 20;  // milliseconds: enough for a component's answer; nothing depends on it

void require(bool holds) {
  if (!holds) std::abort();
}

struct Observer : android::BnOMXObserver {
  void onMessage(const android::omx_message& /*message*/) override {
    require(!silent);
    ++heard;
  }
  std::atomic<uint64_t> heard{0};
  std::atomic<bool> silent{false};  // its node is gone: no message may come any more
};

// Besides those of videos, which follow each other.
constexpr OMX_INDEXTYPE kIndices[] = {
    OMX_IndexParamPortDefinition,          OMX_IndexParamVideoInit,
    OMX_IndexParamCompBufferSupplier,      OMX_IndexParamStandardComponentRole,
    OMX_IndexConfigCommonRotate,           OMX_IndexConfigCommonOutputCrop,
    mediaserver::kQcomPortDefinitionIndex, mediaserver::kQcomIntraPeriodIndex,
    mediaserver::kQcomPictureOrderIndex,   mediaserver::kStoreMetaDataIndex};

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
    _observer->silent = true;
    _observer.clear();
    require(_omx->freeNode(_node) != android::OK);
    for (auto& buffers : _buffers) buffers.clear();
  }

  void freeSometimes() {
    if (number(0, 3) == 0) freeNode();
  }

  // For more than has been heard.
  void waitForMore() {
    if (_observer == nullptr) return;
    for (int i = 0; i < kPatience && _observer->heard == _seen; ++i)
      std::this_thread::sleep_for(std::chrono::milliseconds(1));
    _seen = _observer->heard;
  }

  OMX_U32 number(OMX_U32 low, OMX_U32 high) { return _data.ConsumeIntegralInRange(low, high); }
  OMX_U32 word() { return _data.ConsumeIntegral<OMX_U32>(); }
  bool rarely() { return number(0, 15) == 0; }
  OMX_U32 anyPort() { return number(0, kPortCount); }

  void command() {
    const auto command = static_cast<OMX_COMMANDTYPE>(number(0, 5));
    _omx->sendCommand(_node, command, static_cast<OMX_S32>(rarely() ? word() : number(0, 7) - 1));
  }

  mediaserver::PortDefinition definition(OMX_U32 port) {
    mediaserver::PortDefinition definition{};
    definition.nPortIndex = port;
    _omx->getParameter(_node, OMX_IndexParamPortDefinition, &definition, sizeof(definition));
    return definition;
  }

  // As a decent client starts, from whatever state it is in.
  void start() {
    _omx->sendCommand(_node, OMX_CommandStateSet, OMX_StateIdle);
    for (OMX_U32 port = 0; port < kPortCount; ++port) {
      const mediaserver::PortDefinition wanted = definition(port);
      while (_buffers[port].size() < std::min<size_t>(wanted.nBufferCountActual, 32)) {
        const size_t before = _buffers[port].size();
        give(port, wanted.nBufferSize);
        if (_buffers[port].size() == before) break;
      }
    }
    waitForMore();
    _omx->sendCommand(_node, OMX_CommandStateSet, OMX_StateExecuting);
    waitForMore();
    for (const Given& buffer : _buffers[mediaserver::kOutputPort]) _omx->fillBuffer(_node, buffer.id);
  }

  void record() {
    const OMX_U32 video = number(OMX_IndexParamVideoPortFormat, OMX_IndexConfigVideoNalSize);
    const OMX_INDEXTYPE other = _data.PickValueInArray(kIndices);
    const bool isVideo = _data.ConsumeBool();
    const OMX_INDEXTYPE index =
        rarely() || isVideo ? static_cast<OMX_INDEXTYPE>(isVideo ? video : word()) : other;
    std::vector<uint8_t> bytes = _data.ConsumeBytes<uint8_t>(number(0, 256));
    bytes.shrink_to_fit();
    void* const memory = bytes.empty() ? nullptr : bytes.data();
    const OMX_U32 call = number(0, 3);
    if (call == 0) _omx->getParameter(_node, index, memory, bytes.size());
    if (call == 1) _omx->setParameter(_node, index, memory, bytes.size());
    if (call == 2) _omx->getConfig(_node, index, memory, bytes.size());
    if (call == 3) _omx->setConfig(_node, index, memory, bytes.size());
  }

  void definePort() {
    mediaserver::PortDefinition wanted = definition(anyPort());
    auto& video = wanted.format.video;
    OMX_U32* const words[] = {
        &wanted.nBufferCountActual, &wanted.nBufferSize, &video.nFrameWidth, &video.nFrameHeight,
        &video.nSliceHeight,        &video.xFramerate,   &video.nBitrate};
    *_data.PickValueInArray(words) = _data.ConsumeBool() ? number(0, 400) : word();
    if (_data.ConsumeBool()) video.eCompressionFormat = static_cast<OMX_VIDEO_CODINGTYPE>(anyPort() * 3);
    _omx->setParameter(_node, OMX_IndexParamPortDefinition, &wanted, sizeof(wanted));
  }

  // `size` 0: any.
  void give(OMX_U32 port, size_t size) {
    const OMX_U32 how = number(0, 2);
    if (size == 0) size = number(0, 1 << 18);
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
    const auto& buffers = _buffers[number(0, kPortCount - 1)];
    const auto wrong = reinterpret_cast<IOMX::buffer_id>(uintptr_t{number(0, 1000)});
    if (buffers.empty() || rarely()) return {wrong, nullptr, nullptr, 0};
    return buffers[number(0, static_cast<OMX_U32>(buffers.size()) - 1)];
  }

  void fillBuffer() { _omx->fillBuffer(_node, anyBuffer().id); }

  void freeBuffer() {
    const OMX_U32 port = anyPort();
    const Given chosen = anyBuffer();
    if (_omx->freeBuffer(_node, port, chosen.id) != android::OK) return;
    std::erase_if(_buffers.at(port), [&](const Given& given) { return given.id == chosen.id; });
  }

  void emptyBuffer() {
    const Given chosen = anyBuffer();
    const bool fits = number(0, 7) != 0;
    const OMX_U32 any = word();
    const OMX_U32 part = _data.ConsumeBool() ? static_cast<OMX_U32>(chosen.size)
                                             : static_cast<OMX_U32>(any % (chosen.size + 1));
    // Not while the component may read it.
    if (chosen.block != nullptr && _data.ConsumeBool()) {
      const std::vector<uint8_t> bytes = _data.ConsumeBytes<uint8_t>(number(0, 4096));
      std::copy_n(bytes.begin(), std::min(bytes.size(), chosen.size), chosen.bytes);
    }
    const OMX_U32 flags = number(0, 3) == 0 ? word() : OMX_U32{OMX_BUFFERFLAG_ENDOFFRAME};
    const auto time = _data.ConsumeIntegral<int16_t>();
    _omx->emptyBuffer(_node, chosen.id, fits ? 0 : word(), fits ? part : any, flags, time);
  }

  void oddCalls() {
    OMX_STATETYPE state = OMX_StateInvalid;
    OMX_INDEXTYPE index{};
    OMX_U32 word = 0;
    const OMX_BOOL enable = _data.ConsumeBool() ? OMX_TRUE : OMX_FALSE;
    _omx->getState(_node, &state);
    _omx->getState(_node, nullptr);
    _omx->storeMetaDataInBuffers(_node, anyPort(), enable);
    _omx->enableGraphicBuffers(_node, anyPort(), enable);
    _omx->getGraphicBufferUsage(_node, anyPort(), &word);
    _omx->useBuffer(_node, anyPort(), nullptr, nullptr);
    _omx->getExtensionIndex(_node, _data.ConsumeRandomLengthString(64).c_str(), &index);
  }

  const sp<IOMX> _omx;
  const omxhost::Device& _device;
  FuzzedDataProvider& _data;
  sp<Observer> _observer;
  uint64_t _seen = 0;
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
