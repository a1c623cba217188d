// The decoder component: compressed buffers in, pictures in the device's layout out, one a buffer. A picture
// of another size than the output port's waits until the client has made buffers for it. Threads as for every
// Codec; what both clients' threads and the worker use is guarded by _mutex.
#pragma once

#include <cstdint>
#include <memory>
#include <mutex>
#include <optional>
#include <vector>

#include "host/mediaserver/codec.h"
#include "host/mediaserver/components/picture_layout.h"
#include "host/mediaserver/components/stream_decoder.h"

namespace mediaserver {

class VideoDecoder final : public Codec {
 public:
  VideoDecoder(const omxhost::ComponentTraits& traits, CodecHost& host);

  PortPair ports() const override;
  std::vector<VideoFormat> formats(OMX_U32 port) const override;
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
  OutputGeometry geometryOf(uint32_t width, uint32_t height) const {
    return outputGeometry(_traits.decoderOutput, width, height);
  }
  void describe(const OutputGeometry& geometry, PortDefinition* output) const;
  uint32_t neededBuffers() const;

  // Pictures that the delivery thread has written out. It gives them back instead of releasing them: so the
  // worker alone releases decoder's memory, after a lock that both have held. May outlive the decoder.
  struct Written {
    std::mutex mutex;
    std::vector<std::shared_ptr<const AVFrame>> pictures;
  };
  void releaseWritten();

  const omxhost::ComponentTraits _traits;

  std::mutex _mutex;  // guards the next three
  PictureOrder _order = PictureOrder::Display;
  Packing _packing = Packing::Unit;
  OutputGeometry _crop;  // of the pictures that clients see, for the rectangle inside

  const std::shared_ptr<Written> _written = std::make_shared<Written>();

  // The worker's.
  DecoderOptions _options{};
  std::unique_ptr<StreamDecoder> _decoder;
  std::optional<OutputGeometry> _announced;  // what geometry() has told last
  std::optional<OutputGeometry> _agreed;     // what the client's buffers are made for
  uint32_t _buffers = 0;
  bool _draining = false;
};

}  // namespace mediaserver
