#include "bench/frames/peers.h"

#if BENCH_HAS_AVFILTER
#include <cstring>
#include <stdexcept>

extern "C" {
#include <libavfilter/avfilter.h>
#include <libavfilter/buffersink.h>
#include <libavfilter/buffersrc.h>
#include <libavutil/frame.h>
}
#endif

namespace bench {

#if BENCH_HAS_AVFILTER
namespace {

void require(bool fine) {
  if (!fine) throw std::runtime_error("libavfilter refuses the benchmark's graph");
}

// Graph, input and output frame of one chain.
class Chain {
 public:
  Chain(const char* chain, AVPixelFormat format, Size size) {
    const std::string spec =
        "buffer=width=" + std::to_string(size.width) + ":height=" + std::to_string(size.height) +
        ":pix_fmt=" + std::to_string(static_cast<int>(format)) + ":time_base=1/30," + chain + ",buffersink";
    AVFilterInOut *inputs = nullptr, *outputs = nullptr;
    _graph->nb_threads = 1;
    require(avfilter_graph_parse2(_graph, spec.c_str(), &inputs, &outputs) >= 0);
    require(avfilter_graph_config(_graph, nullptr) >= 0);
    for (unsigned k = 0; k < _graph->nb_filters; ++k) {
      AVFilterContext* filter = _graph->filters[k];
      if (filter->nb_inputs == 0) _source = filter;
      if (filter->nb_outputs == 0) _sink = filter;
    }
    _in->format = format;
    _in->width = static_cast<int>(size.width);
    _in->height = static_cast<int>(size.height);
    require(av_frame_get_buffer(_in, 0) >= 0);
    // Memory that nobody has written is one page again and again, which reads far too fast.
    for (const AVBufferRef* buffer : _in->buf) {
      if (buffer != nullptr) std::memset(buffer->data, 0x55, buffer->size);
    }
    run();
  }
  ~Chain() {
    av_frame_free(&_out);
    av_frame_free(&_in);
    avfilter_graph_free(&_graph);
  }
  Chain(const Chain&) = delete;
  Chain& operator=(const Chain&) = delete;

  void run() {
    require(av_buffersrc_add_frame_flags(_source, _in, AV_BUFFERSRC_FLAG_KEEP_REF) >= 0);
    require(av_buffersink_get_frame(_sink, _out) >= 0);
    av_frame_unref(_out);
  }

 private:
  AVFilterGraph* _graph = avfilter_graph_alloc();
  AVFrame *_in = av_frame_alloc(), *_out = av_frame_alloc();
  AVFilterContext *_source = nullptr, *_sink = nullptr;
};

}  // namespace

Contenders avfilter(const char* chain, Format from, Size size) {
  const AVPixelFormat format = from == Format::kNv12   ? AV_PIX_FMT_NV12
                               : from == Format::kNv21 ? AV_PIX_FMT_NV21
                                                       : AV_PIX_FMT_YUV420P;
  const auto graph = std::make_shared<Chain>(chain, format, size);
  return {{"libavfilter", [graph] { graph->run(); }}};
}

#else

Contenders avfilter(const char*, Format, Size) {
  return {};
}

#endif

}  // namespace bench
