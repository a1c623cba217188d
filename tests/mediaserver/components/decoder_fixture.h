#pragma once
// A decoder component at work, and what its tests have in common.

#include <gtest/gtest.h>

#include <vector>

#include "host/mediaserver/components/vendor_records.h"
#include "tests/mediaserver/components/component_client.h"

namespace componenttest {

class DecoderRun : public ComponentClient {
 public:
  explicit DecoderRun(const char* device) : ComponentClient(device, Kind::Decoder) {}

  bool isTi() const { return device().components.vendor == omxhost::Vendor::Ti; }

  android::status_t setOrder(mediaserver::QcomOrder order);
  android::status_t setPacking(mediaserver::QcomPacking packing);
  // 0: the size stays.
  void setInput(OMX_VIDEO_CODINGTYPE coding, uint32_t width = 0, uint32_t height = 0);

  // One buffer a unit.
  void sendAll(const std::vector<Unit>& units);
  // The stream in pieces of so many bytes, regardless of what they are.
  void sendPieces(const std::vector<uint8_t>& stream, size_t bytes);
};

// Size, bytes and time stamp of every picture.
void expectSame(const std::vector<Decoded>& got, const std::vector<Decoded>& wanted);
// The same without time stamps.
void expectSamePictures(const std::vector<Decoded>& got, const std::vector<Decoded>& wanted);

}  // namespace componenttest
