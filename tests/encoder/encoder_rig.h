// An encoding session on a posed device whose components are scripted, and what tests of encoders and of
// their wrappers say about records. The device is detected once a process: one rig a device and process.
#pragma once

#include <gtest/gtest.h>

#include <cstring>
#include <functional>
#include <memory>
#include <string>
#include <vector>

#include <omxhost/log.h>

#include "core/omx_interface.h"
#include "encoder/omx_interface_encoder.h"
#include "omxbridge/codec_settings.h"
#include "tests/core/log_lines.h"
#include "tests/support/scripted_media_server.h"

namespace omxtest {

// Settings with a value of its own in every field that is read.
inline webrtc::VideoCodec settings() {
  webrtc::VideoCodec codec = {};
  codec.codecType = webrtc::kVideoCodecH264;
  codec.width = 176;
  codec.height = 144;
  codec.startBitrate = 500;
  codec.maxFramerate = 30;
  codec.codecSpecific.H264.profile = 77;
  codec.codecSpecific.H264.keyFrameInterval = 60;
  codec.codecSpecific.H264.referenceFrames = 2;
  codec.codecSpecific.H264.entropyCoding = 1;
  codec.codecSpecific.H264.transform8x8 = 1;
  return codec;
}

struct EncoderRig {
  explicit EncoderRig(const char* device) : server(device) {}

  // Replaces the session by a new one. Create()'s result.
  int create(webrtc::VideoCodec codec = settings()) {
    session.reset();
    server.omx().clearCalls();
    log.clear();
    OmxInterfaceEncoder* created = nullptr;
    const int result = OmxInterfaceEncoder::Create(&created, &codec);
    session.reset(created);
    return result;
  }

  omxhost::LogCapture log;
  ScriptedMediaServer server;
  std::unique_ptr<OmxInterfaceEncoder> session;
};

using Words = std::vector<OMX_U32>;

inline Words words(const std::vector<uint8_t>& bytes) {
  Words result(bytes.size() / sizeof(OMX_U32));
  if (!result.empty()) std::memcpy(result.data(), bytes.data(), result.size() * sizeof(OMX_U32));
  return result;
}

// Calls that read and write settings, in order.
inline std::vector<Call> settingCalls(RecordingOmx& omx) {
  std::vector<Call> result;
  for (Call& call : omx.calls()) {
    switch (call.method) {
      case Method::GetParameter:
      case Method::SetParameter:
      case Method::GetConfig:
      case Method::SetConfig:
      case Method::StoreMetaDataInBuffers:
        result.push_back(std::move(call));
        break;
      default:
        break;
    }
  }
  return result;
}

// The same in short: "getParameter 2000001 port 0".
inline std::vector<std::string> inShort(const std::vector<Call>& calls) {
  std::vector<std::string> result;
  for (const Call& call : calls) {
    char text[80];
    const bool record = call.method != Method::StoreMetaDataInBuffers;
    const OMX_U32 port = record ? words(call.record).at(2) : call.port;
    snprintf(text, sizeof(text), "%s %x port %u", name(call.method), static_cast<unsigned int>(call.index),
             port);
    result.emplace_back(text);
  }
  return result;
}

// What has to be written after `read`: its record with some fields changed, everything else, padding
// too, as the component had it.
template <typename Record>
std::vector<uint8_t> edited(const Call& read, const std::function<void(Record&)>& edit) {
  std::vector<uint8_t> bytes = read.record;
  bytes.resize(sizeof(Record));
  Record record;
  std::memcpy(&record, bytes.data(), sizeof(record));
  edit(record);
  std::memcpy(bytes.data(), &record, sizeof(record));
  return bytes;
}

// A record of `size` bytes for `port` with another value in every word, to tell what a client leaves alone.
template <size_t size>
std::array<OMX_U32, size / sizeof(OMX_U32)> patternRecord(OMX_U32 port) {
  std::array<OMX_U32, size / sizeof(OMX_U32)> result;
  for (size_t i = 0; i < result.size(); ++i) result[i] = 0x0A0B0C00 + static_cast<OMX_U32>(i);
  result[2] = port;
  return result;
}

constexpr OMX_U32 kVersion = 0x00000101;  // 1.1.0.0

}  // namespace omxtest
