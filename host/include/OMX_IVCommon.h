// What image and video ports share: colour formats, and the configuration records of geometry.
#pragma once

#include <OMX_Core.h>

enum OMX_COLOR_FORMATTYPE : uint32_t {
  OMX_COLOR_FormatUnused = 0,
  OMX_COLOR_FormatMonochrome,
  OMX_COLOR_Format8bitRGB332,
  OMX_COLOR_Format12bitRGB444,
  OMX_COLOR_Format16bitARGB4444,
  OMX_COLOR_Format16bitARGB1555,
  OMX_COLOR_Format16bitRGB565,
  OMX_COLOR_Format16bitBGR565,
  OMX_COLOR_Format18bitRGB666,
  OMX_COLOR_Format18bitARGB1665,
  OMX_COLOR_Format19bitARGB1666,  // 10
  OMX_COLOR_Format24bitRGB888,
  OMX_COLOR_Format24bitBGR888,
  OMX_COLOR_Format24bitARGB1887,
  OMX_COLOR_Format25bitARGB1888,
  OMX_COLOR_Format32bitBGRA8888,
  OMX_COLOR_Format32bitARGB8888,
  OMX_COLOR_FormatYUV411Planar,
  OMX_COLOR_FormatYUV411PackedPlanar,
  OMX_COLOR_FormatYUV420Planar,
  OMX_COLOR_FormatYUV420PackedPlanar,  // 20
  OMX_COLOR_FormatYUV420SemiPlanar,
  OMX_COLOR_FormatYUV422Planar,
  OMX_COLOR_FormatYUV422PackedPlanar,
  OMX_COLOR_FormatYUV422SemiPlanar,
  OMX_COLOR_FormatYCbYCr,
  OMX_COLOR_FormatYCrYCb,
  OMX_COLOR_FormatCbYCrY,
  OMX_COLOR_FormatCrYCbY,
  OMX_COLOR_FormatYUV444Interleaved,
  OMX_COLOR_FormatRawBayer8bit,  // 30
  OMX_COLOR_FormatRawBayer10bit,
  OMX_COLOR_FormatRawBayer8bitcompressed,
  OMX_COLOR_FormatL2,
  OMX_COLOR_FormatL4,
  OMX_COLOR_FormatL8,
  OMX_COLOR_FormatL16,
  OMX_COLOR_FormatL24,
  OMX_COLOR_FormatL32,
  OMX_COLOR_FormatYUV420PackedSemiPlanar,
  OMX_COLOR_FormatYUV422PackedSemiPlanar,  // 40
  OMX_COLOR_Format18BitBGR666,
  OMX_COLOR_Format24BitARGB6666,
  OMX_COLOR_Format24BitABGR6666,
  OMX_COLOR_FormatKhronosExtensions = 0x6F000000,
  OMX_COLOR_FormatVendorStartUnused = 0x7F000000,
  OMX_TI_COLOR_FormatYUV420PackedSemiPlanar = 0x7F000100,
  OMX_COLOR_FormatAndroidOpaque = 0x7F000789,
  OMX_QCOM_COLOR_FormatYVU420SemiPlanar = 0x7FA30C00
};

enum OMX_MIRRORTYPE : uint32_t {
  OMX_MirrorNone = 0,
  OMX_MirrorVertical = 1,
  OMX_MirrorHorizontal = 2,
  OMX_MirrorBoth = 3
};

struct OMX_CONFIG_ROTATIONTYPE {
  OMX_U32 nSize;
  OMX_VERSIONTYPE nVersion;
  OMX_U32 nPortIndex;
  OMX_S32 nRotation;  // degrees
};

struct OMX_CONFIG_MIRRORTYPE {
  OMX_U32 nSize;
  OMX_VERSIONTYPE nVersion;
  OMX_U32 nPortIndex;
  OMX_MIRRORTYPE eMirror;
};

struct OMX_CONFIG_RECTTYPE {
  OMX_U32 nSize;
  OMX_VERSIONTYPE nVersion;
  OMX_U32 nPortIndex;
  OMX_S32 nLeft;
  OMX_S32 nTop;
  OMX_U32 nWidth;
  OMX_U32 nHeight;
};
