// Ownership of libavcodec's objects, and contexts that keep quiet. The only header here that includes
// libavcodec's. No state; as thread safe as the objects themselves.
#pragma once

#include <memory>

extern "C" {
#include <libavcodec/avcodec.h>
#include <libavutil/frame.h>
}

namespace mediaserver {

struct AvRelease {
  void operator()(AVCodecContext* context) const { avcodec_free_context(&context); }
  void operator()(AVCodecParserContext* parser) const { av_parser_close(parser); }
  void operator()(AVFrame* frame) const { av_frame_free(&frame); }
  void operator()(AVPacket* packet) const { av_packet_free(&packet); }
};

using AvContext = std::unique_ptr<AVCodecContext, AvRelease>;
using AvParser = std::unique_ptr<AVCodecParserContext, AvRelease>;
using AvFrame = std::unique_ptr<AVFrame, AvRelease>;
using AvPacket = std::unique_ptr<AVPacket, AvRelease>;

// A context for one thread, one picture at a time. It writes nothing to standard error, whatever log level
// the process has set: damaged streams are everyday business here. Null for a null codec or when memory is
// short.
inline AvContext makeContext(const AVCodec* codec) {
  AvContext context(codec != nullptr ? avcodec_alloc_context3(codec) : nullptr);
  if (context != nullptr) {
    constexpr int kBeyondEveryLevel = 100;  // and still inside a byte, which is all that is looked at
    context->log_level_offset = kBeyondEveryLevel;
    context->thread_count = 1;
  }
  return context;
}

}  // namespace mediaserver
