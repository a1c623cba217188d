// An encoding session: raw frames in on port 0, an H.264 byte stream out on port 1.
//
// Created from the application's settings, which the platform's wrapper carries out; the operations
// below that write one kind of record are what wrappers build on. The owner's thread creates, sets up
// and destroys; setConfig(), updateBitRate(), updateAVCIntraPeriod() and requestIFrame() may be called
// on any thread while frames flow: they keep nothing in the session, and each takes effect at once.
// sendDataFrame() is for the feeding threads.
//
// Results are result codes. Without a connection every operation fails as if the component refused.
#pragma once

#include <OMX_Index.h>

#include "core/omx_interface.h"
#include "omxbridge/codec_settings.h"
#include "omxbridge/export.h"

class OMXBRIDGE_EXPORT OmxInterfaceEncoder : public OmxInterface {
 public:
  OmxInterfaceEncoder();
  ~OmxInterfaceEncoder() override;

  // Builds a session, connects it and configures the component. The session is not started: that is
  // init()'s. 0; 2 no memory; 28 no settings; else the code of setupIOMXConnections() or
  // configureEncoder(). On failure *out is null.
  // Kept: but for 28, where *out is a session that was never connected; the caller deletes it.
  static int Create(OmxInterfaceEncoder** out, webrtc::VideoCodec* codec);

  // Configures the component from the application's settings, before init(). Some wrappers write the
  // frame rate that they could set back into the settings. 0; 28 no settings; 36 no wrapper; else the
  // wrapper's result.
  int configureEncoder(webrtc::VideoCodec* codec);

  // Changes one item of a running encoder through the wrapper. 0; 33 refused or no such item; 36 no
  // wrapper (any more).
  int setConfig(CONFIGTYPE type, unsigned long value);

  // The same for one item each, in the standard's way and past the wrapper, without a log line.
  // Bits per second. 0; 17 the present bit rate could not be read; 18 refused.
  int updateBitRate(int bitrate);
  // Frames from one key frame to the next. 0 or 37.
  int updateAVCIntraPeriod(int period);
  // The next frame becomes a key frame. 0 or 16.
  int requestIFrame();

  // Before init(): rate control (an OMX_VIDEO_CONTROLRATETYPE) and its target in bits per second.
  // 0; 17 not read; 18 refused.
  int setupRateControl(int controlRate, int targetBitrate);
  // Before init(): a port's bit rate in bits per second. 0; 13 not read; 14 refused.
  int setupPortBitRate(int port, int bitrate);
  // Before init(): profile, key frames, reference frames, entropy coding, transform; always level 3.1
  // and progressive. `h264` is not null. 0; 34 not read; 35 refused.
  int setupAvcSettings(webrtc::VideoCodecH264* h264);

  // Copies one raw frame into a free input buffer, laid out as the hardware generation takes it, and
  // sends it. `frame` is semi-planar YUV 4:2:0 without padding: width x height bytes of luma, then
  // half as many of interleaved chroma. Never waits for a free buffer.
  //
  // The recorded failure, which is 0 normally and also when no buffer was free and the frame was
  // dropped; -1 the frame does not fit an input buffer, is empty or null, or the component refused it.
  // After the end of input it does not return, yielding the processor over and over, before a failure
  // is recorded (the result) or the session ends (-1).
  int sendDataFrame(const unsigned char* frame, int width, int height, int timestamp);

 private:
  int awaitFailure();
};
