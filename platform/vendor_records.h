// Records of the Qualcomm components' own indices, which the platform's headers do not have.
#pragma once

#include <OMX_Core.h>
#include <OMX_Index.h>

// Input packing of a decoder, among other things about a port.
constexpr auto kQcomIndexPortDefinition = static_cast<OMX_INDEXTYPE>(0x7F000002);
struct QcomPortDefinition {
  OMX_U32 nSize;
  OMX_VERSIONTYPE nVersion;
  OMX_U32 nPortIndex;
  OMX_U32 nMemoryRegion;        // 0: unspecified
  OMX_U32 nCacheAttribute;      // 0: none
  OMX_U32 nFramePackingFormat;  // QcomFramePacking
};
static_assert(sizeof(QcomPortDefinition) == 24);

enum QcomFramePacking : OMX_U32 {
  QCOM_FRAME_PACKING_UNSPECIFIED = 0,
  QCOM_FRAME_PACKING_ARBITRARY = 1,
  QCOM_FRAME_PACKING_ONE_COMPLETE_FRAME = 3,
};

// Distance of an encoder's key frames; may be changed while it runs.
constexpr auto kQcomIndexIntraPeriod = static_cast<OMX_INDEXTYPE>(0x7F000007);
struct QcomIntraPeriod {
  OMX_U32 nSize;
  OMX_VERSIONTYPE nVersion;
  OMX_U32 nPortIndex;
  OMX_U32 nIDRPeriod;  // every so manieth intra picture is an IDR picture
  OMX_U32 nPFrames;    // P pictures between two intra pictures
  OMX_U32 nBFrames;
};
static_assert(sizeof(QcomIntraPeriod) == 24);

// The order in which a decoder puts pictures out.
constexpr auto kQcomIndexPictureOrder = static_cast<OMX_INDEXTYPE>(0x7F000010);
struct QcomPictureOrder {
  OMX_U32 nSize;
  OMX_VERSIONTYPE nVersion;
  OMX_U32 nPortIndex;
  OMX_U32 eOutputPictureOrder;  // QcomOutputOrder; 0: nothing asked for
};
static_assert(sizeof(QcomPictureOrder) == 16);

enum QcomOutputOrder : OMX_U32 {
  QCOM_OUTPUT_IN_DISPLAY_ORDER = 1,
  QCOM_OUTPUT_IN_DECODE_ORDER = 2,
};
