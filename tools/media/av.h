// Ownership of the media libraries' objects, and their errors in words. The only header of the tool that
// includes theirs. As thread safe as the objects themselves.
#pragma once

#include <memory>
#include <string>

extern "C" {
#include <libavcodec/avcodec.h>
#include <libavcodec/bsf.h>
#include <libavformat/avformat.h>
#include <libavutil/imgutils.h>
#include <libswscale/swscale.h>
}

namespace tool {

struct AvRelease {
  void operator()(AVCodecContext* context) const { avcodec_free_context(&context); }
  void operator()(AVFrame* frame) const { av_frame_free(&frame); }
  void operator()(AVPacket* packet) const { av_packet_free(&packet); }
  void operator()(AVBSFContext* filter) const { av_bsf_free(&filter); }
  void operator()(SwsContext* scaler) const { sws_freeContext(scaler); }
  void operator()(AVIOContext* io) const {
    av_freep(&io->buffer);
    avio_context_free(&io);
  }
};

using AvCodecContext = std::unique_ptr<AVCodecContext, AvRelease>;
using AvFrame = std::unique_ptr<AVFrame, AvRelease>;
using AvPacket = std::unique_ptr<AVPacket, AvRelease>;
using AvFilter = std::unique_ptr<AVBSFContext, AvRelease>;
using AvScaler = std::unique_ptr<SwsContext, AvRelease>;
using AvIo = std::unique_ptr<AVIOContext, AvRelease>;

inline std::string avText(int error) {
  char text[AV_ERROR_MAX_STRING_SIZE] = "";
  av_strerror(error, text, sizeof(text));
  return text;
}

}  // namespace tool
