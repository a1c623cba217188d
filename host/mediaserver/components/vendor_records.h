// Records of the vendors' and of Android's own indices, which the standard's headers do not have.
#pragma once

#include <OMX_Core.h>
#include <OMX_IVCommon.h>
#include <OMX_Index.h>

namespace mediaserver {

constexpr auto kTiledFormat = static_cast<OMX_COLOR_FORMATTYPE>(0x7FA30C03);

// Qualcomm decoders: what an input buffer holds, among other things about a port.
constexpr auto kQcomPortDefinitionIndex = static_cast<OMX_INDEXTYPE>(0x7F000002);
struct QcomPortDefinition {
  OMX_U32 nSize;
  OMX_VERSIONTYPE nVersion;
  OMX_U32 nPortIndex;
  OMX_U32 nMemRegion;
  OMX_U32 nCacheAttr;
  OMX_U32 nFramePackingFormat;  // QcomPacking
};
static_assert(sizeof(QcomPortDefinition) == 24);

enum class QcomPacking : OMX_U32 {
  Unspecified = 0,
  Arbitrary = 1,
  CompleteFrames = 2,
  OneCompleteFrame = 3,
  OneCompleteSubFrame = 4,
};

// Qualcomm encoders: the distance of key frames.
constexpr auto kQcomIntraPeriodIndex = static_cast<OMX_INDEXTYPE>(0x7F000007);
struct QcomIntraPeriod {
  OMX_U32 nSize;
  OMX_VERSIONTYPE nVersion;
  OMX_U32 nPortIndex;
  OMX_U32 nIDRPeriod;  // every so manieth intra picture is an IDR picture
  OMX_U32 nPFrames;
  OMX_U32 nBFrames;
};
static_assert(sizeof(QcomIntraPeriod) == 24);

// Qualcomm decoders: the order of pictures.
constexpr auto kQcomPictureOrderIndex = static_cast<OMX_INDEXTYPE>(0x7F000010);
struct QcomPictureOrder {
  OMX_U32 nSize;
  OMX_VERSIONTYPE nVersion;
  OMX_U32 nPortIndex;
  OMX_U32 eOutputPictureOrder;  // QcomOrder
};
static_assert(sizeof(QcomPictureOrder) == 16);

enum class QcomOrder : OMX_U32 {
  NothingAsked = 0,
  Display = 1,
  Decode = 2,
};

// Android: whether buffers hold handles instead of pixels. The index is of our own choosing; clients find it
// by name.
constexpr const char* kStoreMetaDataName = "OMX.google.android.index.storeMetaDataInBuffers";
constexpr auto kStoreMetaDataIndex = static_cast<OMX_INDEXTYPE>(0x7F00F001);
struct StoreMetaData {
  OMX_U32 nSize;
  OMX_VERSIONTYPE nVersion;
  OMX_U32 nPortIndex;
  OMX_BOOL bStoreMetaData;
};
static_assert(sizeof(StoreMetaData) == 16);

}  // namespace mediaserver
