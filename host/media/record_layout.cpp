// The layout of every OpenMAX record, checked by the compiler: what crosses IOMX is bytes.
// Numbers with two columns are for 32-bit pointers, as on the devices, and for 64-bit ones. The file
// needs no library, so it also compiles alone for a 32-bit target.
#include <stddef.h>

#include <OMX_Component.h>

namespace {

constexpr size_t bytes(size_t pointers32, size_t pointers64) {
  return sizeof(void*) == 4 ? pointers32 : pointers64;
}

// i386 aligns 64-bit fields of records to 4 bytes, every other target to 8.
constexpr bool kTicksAligned = offsetof(OMX_BUFFERHEADERTYPE, nTimeStamp) % 8 == 0;

static_assert(sizeof(OMX_U8) == 1 && sizeof(OMX_S8) == 1);
static_assert(sizeof(OMX_U16) == 2 && sizeof(OMX_S16) == 2);
static_assert(sizeof(OMX_U32) == 4 && sizeof(OMX_S32) == 4);
static_assert(sizeof(OMX_U64) == 8 && sizeof(OMX_S64) == 8 && sizeof(OMX_TICKS) == 8);
static_assert(sizeof(OMX_BOOL) == 4 && sizeof(OMX_INDEXTYPE) == 4 && sizeof(OMX_ERRORTYPE) == 4);
static_assert(sizeof(OMX_UUIDTYPE) == 128 && sizeof(OMX_VERSIONTYPE) == 4);

static_assert(sizeof(OMX_PORT_PARAM_TYPE) == 16);
static_assert(sizeof(OMX_PRIORITYMGMTTYPE) == 16);
static_assert(sizeof(OMX_PARAM_COMPONENTROLETYPE) == 136);
static_assert(sizeof(OMX_PARAM_BUFFERSUPPLIERTYPE) == 16);
static_assert(sizeof(OMX_TUNNELSETUPTYPE) == 8);
static_assert(sizeof(OMX_PARAM_U32TYPE) == 16);
static_assert(sizeof(OMX_CONFIG_ROTATIONTYPE) == 16);
static_assert(sizeof(OMX_CONFIG_MIRRORTYPE) == 16);
static_assert(sizeof(OMX_CONFIG_RECTTYPE) == 28);
static_assert(sizeof(OMX_CONFIG_FRAMERATETYPE) == 16);
static_assert(sizeof(OMX_CONFIG_INTRAREFRESHVOPTYPE) == 16);
static_assert(sizeof(OMX_VIDEO_PARAM_PORTFORMATTYPE) == 28);
static_assert(sizeof(OMX_VIDEO_PARAM_QUANTIZATIONTYPE) == 24);
static_assert(sizeof(OMX_VIDEO_PARAM_BITRATETYPE) == 20);
static_assert(sizeof(OMX_VIDEO_PARAM_INTRAREFRESHTYPE) == 28);
static_assert(sizeof(OMX_VIDEO_PARAM_PROFILELEVELTYPE) == 24);
static_assert(sizeof(OMX_VIDEO_CONFIG_BITRATETYPE) == 16);
static_assert(sizeof(OMX_VIDEO_CONFIG_AVCINTRAPERIOD) == 20);
static_assert(sizeof(OMX_VIDEO_CONFIG_NALSIZE) == 16);

static_assert(sizeof(OMX_MARKTYPE) == bytes(8, 16));
static_assert(sizeof(OMX_CALLBACKTYPE) == bytes(12, 24));
static_assert(sizeof(OMX_COMPONENTTYPE) == bytes(88, 168));
static_assert(sizeof(OMX_BUFFERHEADERTYPE) == bytes(kTicksAligned ? 80 : 72, 112));
static_assert(sizeof(OMX_AUDIO_PORTDEFINITIONTYPE) == bytes(16, 24));
static_assert(sizeof(OMX_IMAGE_PORTDEFINITIONTYPE) == bytes(40, 56));
static_assert(sizeof(OMX_OTHER_PORTDEFINITIONTYPE) == 4);

using Port = OMX_PARAM_PORTDEFINITIONTYPE;
static_assert(sizeof(Port) == bytes(96, 112));
static_assert(offsetof(Port, nPortIndex) == 8);
static_assert(offsetof(Port, eDir) == 12);
static_assert(offsetof(Port, nBufferCountActual) == 16);
static_assert(offsetof(Port, nBufferCountMin) == 20);
static_assert(offsetof(Port, nBufferSize) == 24);
static_assert(offsetof(Port, bEnabled) == 28);
static_assert(offsetof(Port, bPopulated) == 32);
static_assert(offsetof(Port, eDomain) == 36);
static_assert(offsetof(Port, format) == 40);
static_assert(offsetof(Port, bBuffersContiguous) == bytes(88, 104));
static_assert(offsetof(Port, nBufferAlignment) == bytes(92, 108));

using Video = OMX_VIDEO_PORTDEFINITIONTYPE;
static_assert(sizeof(Video) == bytes(48, 64));
static_assert(offsetof(Video, pNativeRender) == bytes(4, 8));
static_assert(offsetof(Video, nFrameWidth) == bytes(8, 16));
static_assert(offsetof(Video, nFrameHeight) == bytes(12, 20));
static_assert(offsetof(Video, nStride) == bytes(16, 24));
static_assert(offsetof(Video, nSliceHeight) == bytes(20, 28));
static_assert(offsetof(Video, nBitrate) == bytes(24, 32));
static_assert(offsetof(Video, xFramerate) == bytes(28, 36));
static_assert(offsetof(Video, bFlagErrorConcealment) == bytes(32, 40));
static_assert(offsetof(Video, eCompressionFormat) == bytes(36, 44));
static_assert(offsetof(Video, eColorFormat) == bytes(40, 48));
static_assert(offsetof(Video, pNativeWindow) == bytes(44, 56));

using Avc = OMX_VIDEO_PARAM_AVCTYPE;
static_assert(sizeof(Avc) == 108);
static_assert(offsetof(Avc, nSliceHeaderSpacing) == 12);
static_assert(offsetof(Avc, nPFrames) == 16);
static_assert(offsetof(Avc, nBFrames) == 20);
static_assert(offsetof(Avc, bUseHadamard) == 24);
static_assert(offsetof(Avc, nRefFrames) == 28);
static_assert(offsetof(Avc, nRefIdx10ActiveMinus1) == 32);
static_assert(offsetof(Avc, nRefIdx11ActiveMinus1) == 36);
static_assert(offsetof(Avc, bEnableUEP) == 40);
static_assert(offsetof(Avc, bEnableFMO) == 44);
static_assert(offsetof(Avc, bEnableASO) == 48);
static_assert(offsetof(Avc, bEnableRS) == 52);
static_assert(offsetof(Avc, eProfile) == 56);
static_assert(offsetof(Avc, eLevel) == 60);
static_assert(offsetof(Avc, nAllowedPictureTypes) == 64);
static_assert(offsetof(Avc, bFrameMBsOnly) == 68);
static_assert(offsetof(Avc, bMBAFF) == 72);
static_assert(offsetof(Avc, bEntropyCodingCABAC) == 76);
static_assert(offsetof(Avc, bWeightedPPrediction) == 80);
static_assert(offsetof(Avc, nWeightedBipredicitonMode) == 84);
static_assert(offsetof(Avc, bconstIpred) == 88);
static_assert(offsetof(Avc, bDirect8x8Inference) == 92);
static_assert(offsetof(Avc, bDirectSpatialTemporal) == 96);
static_assert(offsetof(Avc, nCabacInitIdc) == 100);
static_assert(offsetof(Avc, eLoopFilterMode) == 104);

// Values that counting up must have reached.
static_assert(OMX_IndexParamStandardComponentRole == 0x01000017);
static_assert(OMX_IndexParamCompBufferSupplier == 0x02000002);
static_assert(OMX_IndexConfigVideoNalSize == 0x0600001A);
static_assert(OMX_IndexConfigCommonRotate == 0x0700000B);
static_assert(OMX_IndexConfigCommonOutputCrop == 0x0700000F);
static_assert(OMX_IndexConfigCommonTransitionEffect == 0x07000022);
static_assert(static_cast<OMX_U32>(OMX_ErrorNoMore) == 0x8000100E);
static_assert(static_cast<OMX_U32>(OMX_ErrorUnsupportedIndex) == 0x8000101A);
static_assert(static_cast<OMX_U32>(OMX_ErrorTunnelingUnsupported) == 0x80001024);
static_assert(static_cast<OMX_U32>(OMX_ErrorVendorStartUnused) == 0x90000000);
static_assert(OMX_COLOR_Format24BitABGR6666 == 43);

}  // namespace
