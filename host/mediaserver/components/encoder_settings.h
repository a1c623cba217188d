// What clients can set on an H.264 encoder: the standard's and the vendor's records on one side, what they
// mean on the other. Records may come on any thread, also while the encoder works; the worker looks at a copy
// of the whole before each picture. Guards itself.
#pragma once

#include <cstddef>
#include <cstdint>
#include <mutex>

#include <OMX_Video.h>
#include <omxhost/device.h>

#include "host/mediaserver/codec.h"

namespace mediaserver {

// What the stream is made with. A difference in any of it takes a new stream.
struct StreamTools {
  int profileIdc;
  int leastLevelIdc;  // 0: none asked for
  bool cabac;
  bool transform8x8;
  uint32_t referenceFrames;
  uint32_t activeReferences;  // of these, searched for one picture
  bool constrainedIntra;
  bool weightedPrediction;
  bool deblocking;
  uint32_t cabacInit;
  uint32_t sliceMacroblocks;  // 0: one slice a picture
  bool constantQuantizer;
  uint32_t quantizerI;  // with a constant quantizer
  uint32_t quantizerP;
  double bufferedSeconds;  // that rate control may borrow and save

  bool operator==(const StreamTools&) const = default;
};

// What may change from picture to picture.
struct StreamPace {
  uint32_t bitRate;    // bits per second
  uint32_t frameRate;  // Q16 frames per second
  uint32_t keyPeriod;  // pictures from one key frame to the next; 0: only where requested
  unsigned degrees;    // clockwise
};

class EncoderSettings {
 public:
  static constexpr uint32_t kFirstBitRate = 64000;
  static constexpr uint32_t kFirstFrameRate = 30U << 16;

  explicit EncoderSettings(const omxhost::ComponentTraits& traits);

  StreamTools tools() const;
  StreamPace pace() const;
  // True once for each request.
  bool takeKeyRequest();

  // From a port's definition.
  void setBitRate(uint32_t bitsPerSecond);
  void setFrameRate(uint32_t q16);

  // As Codec's.
  Codec::Answer getParameter(OMX_INDEXTYPE index, void* record, size_t size) const;
  Codec::Answer setParameter(OMX_INDEXTYPE index, const void* record, size_t size);
  Codec::Answer getConfig(OMX_INDEXTYPE index, void* record, size_t size) const;
  Codec::Answer setConfig(OMX_INDEXTYPE index, const void* record, size_t size);

 private:
  // With the lock held.
  bool knowsProfile(OMX_U32 profile) const;
  bool canDo(const OMX_VIDEO_PARAM_AVCTYPE& avc) const;
  OMX_ERRORTYPE setProfileAndLevel(OMX_U32 profile, OMX_U32 level);
  OMX_ERRORTYPE setAvc(const OMX_VIDEO_PARAM_AVCTYPE& wanted);
  OMX_ERRORTYPE enumerate(OMX_VIDEO_PARAM_PROFILELEVELTYPE* entry) const;
  bool cabac() const;
  bool transform8x8() const;
  OMX_U32 countPFrames(uint32_t period) const;
  uint32_t keyPeriod(OMX_U32 pFrames) const;

  const omxhost::ComponentTraits _traits;
  mutable std::mutex _mutex;  // guards the rest
  OMX_VIDEO_PARAM_AVCTYPE _avc{};
  OMX_VIDEO_CONTROLRATETYPE _controlRate = OMX_Video_ControlRateVariable;
  uint32_t _quantizerI = 26;
  uint32_t _quantizerP = 28;
  StreamPace _pace{kFirstBitRate, kFirstFrameRate, 0, 0};
  bool _keyRequested = false;
};

}  // namespace mediaserver
