#include "host/mediaserver/components/component_list.h"

#include <android/log.h>

#include "host/mediaserver/components/avc_encoder.h"
#include "host/mediaserver/components/avc_stream.h"
#include "host/mediaserver/components/video_decoder.h"

namespace mediaserver {

std::vector<Component> componentsOf(const omxhost::Device& device) {
  std::vector<Component> components;
  const omxhost::ComponentTraits traits = device.components;
  if (device.decoderComponent != nullptr) {
    components.push_back(
        {device.decoderComponent,
         {"video_decoder.avc", "video_decoder.mpeg4", "video_decoder.h263", "video_decoder.wmv"},
         [traits](CodecHost& host) { return std::make_unique<VideoDecoder>(traits, host); }});
  }
  if (device.encoderComponent != nullptr) {
    components.push_back(
        {device.encoderComponent, {"video_encoder.avc"}, [traits](CodecHost& host) -> std::unique_ptr<Codec> {
           if (!AvcStream::available()) return nullptr;
           return std::make_unique<AvcEncoder>(traits, host);
         }});
  }
  return components;
}

}  // namespace mediaserver
