// Sessions made and ended, and whether there is a component for one.
#include <android/log.h>

#include "capi/handle.h"
#include "core/log.h"
#include "decoder/omx_interface_decoder.h"
#include "encoder/omx_interface_encoder.h"
#include "omxbridge/omxbridge.h"
#include "platform/hardware_version.h"

namespace {

constexpr int kDecoderFrameRate = 24;

void report(int* result, int code) {
  if (result != nullptr) *result = code;
}

}  // namespace

void* decoder_create(int* result, const char* componentName) {
  OmxInterfaceDecoder* session = nullptr;
  int code = OmxInterfaceDecoder::Create(&session, componentName);
  if (code == OMXI_OK) {
    const HardwareTraits& traits = hardwareTraits(getHardwareBaseVersion());
    code = session->setupPortParameters(kOmxInputPort, traits.decoderInputWidth, traits.decoderInputHeight,
                                        kDecoderFrameRate);
    if (code != OMXI_OK) delete session;
  }
  report(result, code);
  if (code == OMXI_OK) return toHandle(session);
  logError("OMXINTERFACE - ERROR creating decoder: %d (%s)", code, resultDescription(code));
  return nullptr;
}

void* encoder_create(int* result, OmxVideoCodec* codec) {
  // Kept: the one line with a tag and at information level, by which support tells builds apart.
  __android_log_print(ANDROID_LOG_INFO, "zol-video", "enter hardCodec encoder_create: build time:%s ",
                      g_strPrgCreatTime);
  OmxInterfaceEncoder* session = nullptr;
  const int code = OmxInterfaceEncoder::Create(&session, codec);
  report(result, code);
  if (code == OMXI_OK) return toHandle(session);
  delete session;  // creation leaves one behind where there were no settings
  logError("OMXINTERFACE - ERROR creating encoder: %d (%s)", code, resultDescription(code));
  return nullptr;
}

int omx_interface_destroy(void* handle) {
  delete fromHandle<OmxInterface>(handle);
  return OMXI_OK;
}

int omx_component_is_available(const char* name) {
  return OmxInterface::OmxComponentCanBeAcquired(name);
}
