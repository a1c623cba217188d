// Decoded pictures on their way to the application.
#include <stdlib.h>

#include <array>

#include <media/stagefright/ColorConverter.h>

#include "core/log.h"
#include "core/omx_record.h"
#include "core/session_state.h"
#include "decoder/hardware_version_cache.h"
#include "decoder/omx_interface_decoder.h"
#include "platform/hardware_version.h"

namespace {

// Qualcomm's 64x32-tiled semi-planar YUV 4:2:0; not in the platform's own headers.
constexpr auto kTiledSemiPlanar = static_cast<OMX_COLOR_FORMATTYPE>(0x7FA30C03);

// What the conversion buffer is aligned to, and the most that its start is moved by.
constexpr size_t kAlignment = 16;

constexpr int kClipLowest = -278;
constexpr int kClipHighest = 535;

uint32_t alignUp(uint32_t value, uint32_t alignment) {
  return (value + alignment - 1) / alignment * alignment;
}

// Bytes that a tiled picture occupies: both planes in tiles of 64 bytes x 32 rows, an even number of
// them in a row, the chroma plane (half the rows) at a multiple of four tiles.
uint64_t tiledPictureSize(uint32_t width, uint32_t height) {
  constexpr uint64_t kTileBytes = 64 * 32;
  const uint64_t tilesPerRow = alignUp(width, 128) / 64;
  const uint64_t lumaTiles = tilesPerRow * (alignUp(height, 32) / 32);
  const uint64_t chromaTiles = tilesPerRow * (alignUp(height, 64) / 64);
  return ((lumaTiles + 3) / 4 * 4 + chromaTiles) * kTileBytes;
}

}  // namespace

int OmxInterfaceDecoder::privateCallOutputCallbackFunction(DECODEDDATAINFO& info, void* data,
                                                           unsigned int length, void* bufferId,
                                                           unsigned int timestamp) {
  OutputCallback callback = nullptr;
  void* context = nullptr;
  {
    const SessionState::Lock held(_state->lock);
    callback = _outputCallback;
    context = _outputCallbackContext;
  }
  if (callback != nullptr) callback(&info, data, length, bufferId, context, timestamp);
  return 0;
}

int OmxInterfaceDecoder::callOutputCallbackFunction(void* data, unsigned int length, void* bufferId,
                                                    unsigned int timestamp) {
  {
    const SessionState::Lock held(_state->lock);
    if (_outputCallback == nullptr) return 0;
  }
  if (length == 0) return 0;
  // Asked for every picture: the size may have changed with the last reconfiguration.
  auto definition = OMX_PARAM_PORTDEFINITIONTYPE();
  if (readPortDefinition(kOmxOutputPort, &definition) != android::OK) return 0;
  DECODEDDATAINFO info = {};
  info.width = definition.format.video.nFrameWidth;
  info.height = definition.format.video.nFrameHeight;
  // Kept: the conversion buffer is made on every device, needed or not.
  if (!reserveConvertBuffer(info.width * info.height * 2)) {
    logError("malloc fail in OmxInterfaceDecoder::callOutputCallbackFunction! line:%d ", 502);
    return 0;
  }
  switch (cachedHardwareBaseVersion()) {
    case HW_VERSION_MSM8X60:
      return deliverConverted(info, data, bufferId, timestamp);
    case HW_VERSION_OMAP4:
      return deliverWithCrop(info, data, length, bufferId, timestamp);
    default:
      return privateCallOutputCallbackFunction(info, data, length, bufferId, timestamp);
  }
}

// MSM8x60: from tiles to RGB565.
int OmxInterfaceDecoder::deliverConverted(DECODEDDATAINFO& info, void* data, void* bufferId,
                                          unsigned int timestamp) {
  android::ColorConverter converter(kTiledSemiPlanar, OMX_COLOR_Format16bitRGB565);
  if (!converter.isValid()) return 0;

  uint32_t capacity = 0;
  {
    const SessionState::Lock held(_state->lock);
    // With a heap of the component's own, only the buffer id leads to the picture.
    const BufferInfo* record = findRecord(kOmxOutputPort, bufferId);
    if (data == nullptr && record != nullptr) data = record->data;
    capacity = _state->ports[kOmxOutputPort].capacity;
  }
  const uint64_t rgbSize = uint64_t{info.width} * info.height * 2;
  if (data == nullptr || rgbSize > _outputConvertBufferSize ||
      tiledPictureSize(info.width, info.height) > capacity) {
    logError("OMXINTERFACE - Picture of %ux%u dropped: address %p, buffer of %u bytes", info.width,
             info.height, data, capacity);
    return 0;
  }
  const size_t right = size_t{info.width} - 1;
  const size_t bottom = size_t{info.height} - 1;
  static_cast<void>(converter.convert(data, alignUp(info.width, 128), alignUp(info.height, 32), 0, 0, right,
                                      bottom, _outputConvertBuffer, info.width, info.height, 0, 0, right,
                                      bottom));
  info.dataType = DECODED_DATA_RGB565;
  return privateCallOutputCallbackFunction(info, _outputConvertBuffer, static_cast<unsigned int>(rgbSize),
                                           bufferId, timestamp);
}

// OMAP4: the padded picture as it is, with the rectangle that is visible.
int OmxInterfaceDecoder::deliverWithCrop(DECODEDDATAINFO& info, void* data, unsigned int length,
                                         void* bufferId, unsigned int timestamp) {
  auto crop = makeOmxRecord<OMX_CONFIG_RECTTYPE>(kOmxOutputPort);
  const android::status_t status =
      _omx->getConfig(_node, OMX_IndexConfigCommonOutputCrop, &crop, sizeof(crop));
  if (status != android::OK) {
    logError("getConfig of OutputCrop: err=%x", static_cast<unsigned int>(status));
    return 0;
  }
  info.cropWidth = crop.nWidth;
  info.cropHeight = crop.nHeight;
  info.cropLeft = static_cast<uint32_t>(crop.nLeft);
  info.cropTop = static_cast<uint32_t>(crop.nTop);
  info.dataType = DECODED_DATA_CROPPED;
  return privateCallOutputCallbackFunction(info, data, length, bufferId, timestamp);
}

// Makes sure that the conversion buffer holds `size` bytes; it grows and never shrinks. After a
// failure it is absent, and the next picture tries again.
bool OmxInterfaceDecoder::reserveConvertBuffer(uint32_t size) {
  if (_outputConvertBuffer != nullptr && size <= _outputConvertBufferSize) return true;
  freeConvertBuffer();
  _outputConvertBufferSize = size;
  const uint64_t bytes = uint64_t{size} + kAlignment;
  if (bytes > SIZE_MAX) return false;
  auto* block = static_cast<unsigned char*>(malloc(static_cast<size_t>(bytes)));
  if (block == nullptr) return false;
  // The byte before the aligned start tells how far it was moved, 1 to 16 bytes.
  const size_t advance = kAlignment - reinterpret_cast<uintptr_t>(block) % kAlignment;
  _outputConvertBuffer = block + advance;
  _outputConvertBuffer[-1] = static_cast<unsigned char>(advance);
  return true;
}

void OmxInterfaceDecoder::freeConvertBuffer() {
  if (_outputConvertBuffer != nullptr) free(_outputConvertBuffer - _outputConvertBuffer[-1]);
  _outputConvertBuffer = nullptr;
  _outputConvertBufferSize = 0;
}

unsigned char* OmxInterfaceDecoder::initClip() {
  using Table = std::array<unsigned char, kClipHighest - kClipLowest + 1>;
  static Table table = [] {
    Table entries{};
    for (int value = kClipLowest; value <= kClipHighest; ++value) {
      const int clamped = value < 0 ? 0 : value > 255 ? 255 : value;
      entries[static_cast<size_t>(value - kClipLowest)] = static_cast<unsigned char>(clamped);
    }
    return entries;
  }();
  if (_clipTable == nullptr) _clipTable = table.data() - kClipLowest;
  return _clipTable;
}
