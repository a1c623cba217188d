// The H.264 encoder component: pictures in one of the vendors' layouts in, one access unit a buffer out.
// Threads as for every Codec. What clients set lives in EncoderSettings; everything else is the worker's.
#pragma once

#include <cstdint>
#include <memory>
#include <vector>

#include "host/mediaserver/codec.h"
#include "host/mediaserver/components/avc_stream.h"
#include "host/mediaserver/components/encoder_settings.h"
#include "host/mediaserver/components/picture_layout.h"

namespace mediaserver {

class AvcEncoder final : public Codec {
 public:
  AvcEncoder(const omxhost::ComponentTraits& traits, CodecHost& host);

  PortPair ports() const override;
  std::vector<VideoFormat> formats(OMX_U32 port) const override;
  std::vector<Extension> extensions() const override;
  OMX_ERRORTYPE definePort(OMX_U32 port, const PortDefinition& wanted, PortPair& ports) override;
  Answer getParameter(OMX_INDEXTYPE index, void* record, size_t size) override;
  Answer setParameter(OMX_INDEXTYPE index, const void* record, size_t size) override;
  Answer getConfig(OMX_INDEXTYPE index, void* record, size_t size) override;
  Answer setConfig(OMX_INDEXTYPE index, const void* record, size_t size) override;

  void configure(const PortPair& ports) override;
  OMX_ERRORTYPE start() override;
  void stop() override;
  void flush(OMX_U32 port) override;
  Sent send(const InputView& input) override;
  void drain(OMX_TICKS timestamp) override;
  Received receive(OutputSpace& output) override;
  OMX_U32 geometry(PortDefinition& output) override;

 private:
  // The stream's access unit, which waits for an output buffer.
  struct Unit {
    bool key = false;
    OMX_TICKS timestamp = 0;
    uint32_t width = 0;
    uint32_t height = 0;
  };

  bool hasUnit() const { return _stream != nullptr && _stream->unitBytes() != 0; }
  bool openStream(uint32_t width, uint32_t height, const StreamPace& pace);
  void encode(const SemiPlanarView& picture, OMX_TICKS timestamp);

  const omxhost::ComponentTraits _traits;
  CodecHost& _host;
  EncoderSettings _settings;

  // The worker's.
  InputGeometry _input{};
  uint32_t _shownWidth = 0;  // by the output port
  uint32_t _shownHeight = 0;
  std::unique_ptr<AvcStream> _stream;
  uint32_t _sinceKey = 0;  // pictures, the key frame included; 0: the next one has to be one
  std::vector<uint8_t> _turned;
  Unit _unit;
  bool _draining = false;
};

}  // namespace mediaserver
