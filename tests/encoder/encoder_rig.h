// An encoding session on a posed device whose components are scripted. The device is detected once a
// process: one rig a device and process.
#pragma once

#include <gtest/gtest.h>

#include <memory>
#include <string>
#include <vector>

#include <omxhost/log.h>

#include "core/omx_interface.h"
#include "encoder/omx_interface_encoder.h"
#include "omxbridge/codec_settings.h"
#include "tests/core/log_lines.h"
#include "tests/core/records.h"
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
  // Calls that read and write settings, in order.
  std::vector<Call> settingCalls() {
    std::vector<Call> calls = server.omx().calls();
    std::erase_if(calls, [](const Call& call) {
      return call.method < Method::GetParameter || call.method > Method::StoreMetaDataInBuffers;
    });
    return calls;
  }

  omxhost::LogCapture log;
  ScriptedMediaServer server;
  std::unique_ptr<OmxInterfaceEncoder> session;
};

}  // namespace omxtest
