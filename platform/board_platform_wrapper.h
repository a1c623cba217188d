// Vendor knowledge behind one interface: which platform this is, what its components are called, and
// the settings that only its components understand.
//
// A session creates its wrapper once its node exists and deletes it in deInit(). The wrapper holds its
// own reference to IOMX and keeps no other state, so its operations may be called on any thread while
// the session keeps it from being deleted.
#pragma once

#include <stdint.h>

#include <media/IOMX.h>
#include <utils/RefBase.h>

#include "core/shared_value.h"
#include "omxbridge/codec_settings.h"
#include "omxbridge/export.h"
#include "omxbridge/result.h"

class OmxInterface;

enum BoardPlatformType : int32_t {
  BOARD_PLATFORM_UNDETECTED = 0,
  BOARD_PLATFORM_QCOM = 1,   // ro.board.platform begins with "msm"
  BOARD_PLATFORM_TI = 2,     // ... with "omap"
  BOARD_PLATFORM_OTHER = 3,  // anything else: no component, no wrapper
};

class OMXBRIDGE_EXPORT CBoardPlatformWrapper {
 public:
  // `owner` may be null and is not owned; `node` is the node to configure, an IOMX::node_id.
  CBoardPlatformWrapper(OmxInterface* owner, android::sp<android::IOMX> omx, void* node);
  CBoardPlatformWrapper(const CBoardPlatformWrapper&) = delete;
  CBoardPlatformWrapper& operator=(const CBoardPlatformWrapper&) = delete;

  // --- Virtual operations. Kept: binaries call these by their order, and there is no virtual
  // destructor among them. ------------------------------------------------------------------------

  // Configures an encoder component from the application's settings. 0, or what the vendor's own
  // operation returns on its first failure.
  virtual int configureEncoder(webrtc::VideoCodec* codec) = 0;
  // Changes one setting of a running encoder. 0 or OMXI_ERR_SET_CONFIG (33).
  virtual int setConfig(CONFIGTYPE type, unsigned long value) = 0;
  // 0: pictures leave the decoder in display order; 1: in decode order. 0 or 30.
  virtual int setPictureOrder(int order);
  // How compressed pictures are packed into input buffers: 1 one whole picture a buffer, 2 at any
  // border, else unspecified. 0 or 31.
  virtual int setInputPackingFormat(int format);
  // Sets the decoder's vendor output layout; `format` has no meaning yet. 0 or -1.
  virtual int setOutputColorFormat(int format);

  // The platform this process runs on, detected at the first call and kept for the process's life.
  static int GetBoardPlatformType();
  // A new wrapper of the platform's kind, to be given to Destroy(); null on a platform without one or
  // without memory.
  static CBoardPlatformWrapper* CreateBoardPlatformWrapper(OmxInterface* owner,
                                                           android::sp<android::IOMX> omx, void* node);
  // Deletes a wrapper of either kind; null does nothing.
  static void Destroy(CBoardPlatformWrapper* wrapper);

  // Names of the platform's H.264 components as the media server lists them; null on a platform
  // without. Never freed.
  static const char* getHardwareDecodeCodecIdentifierString();
  static const char* getHardwareEncodeCodecIdentifierString();

 protected:
  // Not virtual: see Destroy().
  ~CBoardPlatformWrapper();

  // Kept: binaries know these members by their order; the vendors' classes add none.
  OmxInterface* _owner;
  android::sp<android::IOMX> _omx;
  void* _node;

 private:
  static SharedValue<int32_t> _BoardPlatformType;
};
