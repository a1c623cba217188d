// Video ports: their definition, format enumeration, rate control, and the H.264 settings.
// Frame rates (xFramerate and kin) are Q16 frames per second, bit rates are bits per second.
#pragma once

#include <OMX_IVCommon.h>

enum OMX_VIDEO_CODINGTYPE : uint32_t {
  OMX_VIDEO_CodingUnused = 0,
  OMX_VIDEO_CodingAutoDetect = 1,
  OMX_VIDEO_CodingMPEG2 = 2,
  OMX_VIDEO_CodingH263 = 3,
  OMX_VIDEO_CodingMPEG4 = 4,
  OMX_VIDEO_CodingWMV = 5,
  OMX_VIDEO_CodingRV = 6,
  OMX_VIDEO_CodingAVC = 7,
  OMX_VIDEO_CodingMJPEG = 8,
  OMX_VIDEO_CodingVPX = 9
};

enum OMX_VIDEO_CONTROLRATETYPE : uint32_t {
  OMX_Video_ControlRateDisable = 0,
  OMX_Video_ControlRateVariable = 1,
  OMX_Video_ControlRateConstant = 2,
  OMX_Video_ControlRateVariableSkipFrames = 3,
  OMX_Video_ControlRateConstantSkipFrames = 4
};

enum OMX_VIDEO_AVCPROFILETYPE : uint32_t {
  OMX_VIDEO_AVCProfileBaseline = 0x01,
  OMX_VIDEO_AVCProfileMain = 0x02,
  OMX_VIDEO_AVCProfileExtended = 0x04,
  OMX_VIDEO_AVCProfileHigh = 0x08,
  OMX_VIDEO_AVCProfileHigh10 = 0x10,
  OMX_VIDEO_AVCProfileHigh422 = 0x20,
  OMX_VIDEO_AVCProfileHigh444 = 0x40
};

enum OMX_VIDEO_AVCLEVELTYPE : uint32_t {
  OMX_VIDEO_AVCLevel1 = 0x01,
  OMX_VIDEO_AVCLevel1b = 0x02,
  OMX_VIDEO_AVCLevel11 = 0x04,
  OMX_VIDEO_AVCLevel12 = 0x08,
  OMX_VIDEO_AVCLevel13 = 0x10,
  OMX_VIDEO_AVCLevel2 = 0x20,
  OMX_VIDEO_AVCLevel21 = 0x40,
  OMX_VIDEO_AVCLevel22 = 0x80,
  OMX_VIDEO_AVCLevel3 = 0x100,
  OMX_VIDEO_AVCLevel31 = 0x200,
  OMX_VIDEO_AVCLevel32 = 0x400,
  OMX_VIDEO_AVCLevel4 = 0x800,
  OMX_VIDEO_AVCLevel41 = 0x1000,
  OMX_VIDEO_AVCLevel42 = 0x2000,
  OMX_VIDEO_AVCLevel5 = 0x4000,
  OMX_VIDEO_AVCLevel51 = 0x8000
};

enum OMX_VIDEO_AVCLOOPFILTERTYPE : uint32_t {
  OMX_VIDEO_AVCLoopFilterEnable = 0,
  OMX_VIDEO_AVCLoopFilterDisable = 1,
  OMX_VIDEO_AVCLoopFilterDisableSliceBoundary = 2
};

enum OMX_VIDEO_PICTURETYPE : uint32_t {
  OMX_VIDEO_PictureTypeI = 0x01,
  OMX_VIDEO_PictureTypeP = 0x02,
  OMX_VIDEO_PictureTypeB = 0x04,
  OMX_VIDEO_PictureTypeSI = 0x08,
  OMX_VIDEO_PictureTypeSP = 0x10,
  OMX_VIDEO_PictureTypeEI = 0x11,
  OMX_VIDEO_PictureTypeEP = 0x12,
  OMX_VIDEO_PictureTypeS = 0x14
};

enum OMX_VIDEO_INTRAREFRESHTYPE : uint32_t {
  OMX_VIDEO_IntraRefreshCyclic = 0,
  OMX_VIDEO_IntraRefreshAdaptive = 1,
  OMX_VIDEO_IntraRefreshBoth = 2
};

struct OMX_VIDEO_PORTDEFINITIONTYPE {
  OMX_STRING cMIMEType;
  OMX_NATIVE_DEVICETYPE pNativeRender;
  OMX_U32 nFrameWidth;
  OMX_U32 nFrameHeight;
  OMX_S32 nStride;  // bytes; negative for bottom-up pictures
  OMX_U32 nSliceHeight;
  OMX_U32 nBitrate;
  OMX_U32 xFramerate;
  OMX_BOOL bFlagErrorConcealment;
  OMX_VIDEO_CODINGTYPE eCompressionFormat;
  OMX_COLOR_FORMATTYPE eColorFormat;
  OMX_NATIVE_WINDOWTYPE pNativeWindow;
};

struct OMX_VIDEO_PARAM_PORTFORMATTYPE {
  OMX_U32 nSize;
  OMX_VERSIONTYPE nVersion;
  OMX_U32 nPortIndex;
  OMX_U32 nIndex;
  OMX_VIDEO_CODINGTYPE eCompressionFormat;
  OMX_COLOR_FORMATTYPE eColorFormat;
  OMX_U32 xFramerate;
};

struct OMX_VIDEO_PARAM_QUANTIZATIONTYPE {
  OMX_U32 nSize;
  OMX_VERSIONTYPE nVersion;
  OMX_U32 nPortIndex;
  OMX_U32 nQpI;
  OMX_U32 nQpP;
  OMX_U32 nQpB;
};

struct OMX_VIDEO_PARAM_BITRATETYPE {
  OMX_U32 nSize;
  OMX_VERSIONTYPE nVersion;
  OMX_U32 nPortIndex;
  OMX_VIDEO_CONTROLRATETYPE eControlRate;
  OMX_U32 nTargetBitrate;
};

struct OMX_VIDEO_PARAM_INTRAREFRESHTYPE {
  OMX_U32 nSize;
  OMX_VERSIONTYPE nVersion;
  OMX_U32 nPortIndex;
  OMX_VIDEO_INTRAREFRESHTYPE eRefreshMode;
  OMX_U32 nAirMBs;
  OMX_U32 nAirRef;
  OMX_U32 nCirMBs;
};

// eProfile and eLevel are words here: their enumeration depends on the port's coding type.
struct OMX_VIDEO_PARAM_PROFILELEVELTYPE {
  OMX_U32 nSize;
  OMX_VERSIONTYPE nVersion;
  OMX_U32 nPortIndex;
  OMX_U32 eProfile;
  OMX_U32 eLevel;
  OMX_U32 nProfileIndex;
};

// The odd spellings of two fields are the standard's.
struct OMX_VIDEO_PARAM_AVCTYPE {
  OMX_U32 nSize;
  OMX_VERSIONTYPE nVersion;
  OMX_U32 nPortIndex;
  OMX_U32 nSliceHeaderSpacing;
  OMX_U32 nPFrames;
  OMX_U32 nBFrames;
  OMX_BOOL bUseHadamard;
  OMX_U32 nRefFrames;
  OMX_U32 nRefIdx10ActiveMinus1;
  OMX_U32 nRefIdx11ActiveMinus1;
  OMX_BOOL bEnableUEP;
  OMX_BOOL bEnableFMO;
  OMX_BOOL bEnableASO;
  OMX_BOOL bEnableRS;
  OMX_VIDEO_AVCPROFILETYPE eProfile;
  OMX_VIDEO_AVCLEVELTYPE eLevel;
  OMX_U32 nAllowedPictureTypes;
  OMX_BOOL bFrameMBsOnly;
  OMX_BOOL bMBAFF;
  OMX_BOOL bEntropyCodingCABAC;
  OMX_BOOL bWeightedPPrediction;
  OMX_U32 nWeightedBipredicitonMode;
  OMX_BOOL bconstIpred;
  OMX_BOOL bDirect8x8Inference;
  OMX_BOOL bDirectSpatialTemporal;
  OMX_U32 nCabacInitIdc;
  OMX_VIDEO_AVCLOOPFILTERTYPE eLoopFilterMode;
};

struct OMX_VIDEO_CONFIG_BITRATETYPE {
  OMX_U32 nSize;
  OMX_VERSIONTYPE nVersion;
  OMX_U32 nPortIndex;
  OMX_U32 nEncodeBitrate;
};

struct OMX_CONFIG_FRAMERATETYPE {
  OMX_U32 nSize;
  OMX_VERSIONTYPE nVersion;
  OMX_U32 nPortIndex;
  OMX_U32 xEncodeFramerate;
};

struct OMX_CONFIG_INTRAREFRESHVOPTYPE {
  OMX_U32 nSize;
  OMX_VERSIONTYPE nVersion;
  OMX_U32 nPortIndex;
  OMX_BOOL IntraRefreshVOP;
};

struct OMX_VIDEO_CONFIG_AVCINTRAPERIOD {
  OMX_U32 nSize;
  OMX_VERSIONTYPE nVersion;
  OMX_U32 nPortIndex;
  OMX_U32 nIDRPeriod;
  OMX_U32 nPFrames;
};

struct OMX_VIDEO_CONFIG_NALSIZE {
  OMX_U32 nSize;
  OMX_VERSIONTYPE nVersion;
  OMX_U32 nPortIndex;
  OMX_U32 nNaluBytes;
};
