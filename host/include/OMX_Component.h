// A component as OpenMAX IL sees it: the definition of a port of any domain, and the table of
// operations behind a handle.
#pragma once

#include <OMX_Core.h>
#include <OMX_Index.h>
#include <OMX_Video.h>

enum OMX_PORTDOMAINTYPE : uint32_t {
  OMX_PortDomainAudio = 0,
  OMX_PortDomainVideo = 1,
  OMX_PortDomainImage = 2,
  OMX_PortDomainOther = 3,
  OMX_PortDomainMax = 0x7FFFFFF  // Kept: one digit short in the standard too.
};

// Audio, image and other ports appear only as members of the union below: their records fix its
// size, their values are nobody's concern here.
enum OMX_AUDIO_CODINGTYPE : uint32_t {};
enum OMX_IMAGE_CODINGTYPE : uint32_t {};
enum OMX_OTHER_FORMATTYPE : uint32_t {};

struct OMX_AUDIO_PORTDEFINITIONTYPE {
  OMX_STRING cMIMEType;
  OMX_NATIVE_DEVICETYPE pNativeRender;
  OMX_BOOL bFlagErrorConcealment;
  OMX_AUDIO_CODINGTYPE eEncoding;
};

struct OMX_IMAGE_PORTDEFINITIONTYPE {
  OMX_STRING cMIMEType;
  OMX_NATIVE_DEVICETYPE pNativeRender;
  OMX_U32 nFrameWidth;
  OMX_U32 nFrameHeight;
  OMX_S32 nStride;
  OMX_U32 nSliceHeight;
  OMX_BOOL bFlagErrorConcealment;
  OMX_IMAGE_CODINGTYPE eCompressionFormat;
  OMX_COLOR_FORMATTYPE eColorFormat;
  OMX_NATIVE_WINDOWTYPE pNativeWindow;
};

struct OMX_OTHER_PORTDEFINITIONTYPE {
  OMX_OTHER_FORMATTYPE eFormat;
};

struct OMX_PARAM_PORTDEFINITIONTYPE {
  OMX_U32 nSize;
  OMX_VERSIONTYPE nVersion;
  OMX_U32 nPortIndex;
  OMX_DIRTYPE eDir;
  OMX_U32 nBufferCountActual;
  OMX_U32 nBufferCountMin;
  OMX_U32 nBufferSize;  // bytes
  OMX_BOOL bEnabled;
  OMX_BOOL bPopulated;
  OMX_PORTDOMAINTYPE eDomain;
  union {
    OMX_AUDIO_PORTDEFINITIONTYPE audio;
    OMX_VIDEO_PORTDEFINITIONTYPE video;
    OMX_IMAGE_PORTDEFINITIONTYPE image;
    OMX_OTHER_PORTDEFINITIONTYPE other;
  } format;
  OMX_BOOL bBuffersContiguous;
  OMX_U32 nBufferAlignment;
};

struct OMX_PARAM_U32TYPE {
  OMX_U32 nSize;
  OMX_VERSIONTYPE nVersion;
  OMX_U32 nPortIndex;
  OMX_U32 nU32;
};

struct OMX_COMPONENTTYPE {
  OMX_U32 nSize;
  OMX_VERSIONTYPE nVersion;
  OMX_PTR pComponentPrivate;
  OMX_PTR pApplicationPrivate;
  OMX_ERRORTYPE(*GetComponentVersion)
  (OMX_HANDLETYPE, OMX_STRING, OMX_VERSIONTYPE*, OMX_VERSIONTYPE*, OMX_UUIDTYPE*);
  OMX_ERRORTYPE (*SendCommand)(OMX_HANDLETYPE, OMX_COMMANDTYPE, OMX_U32, OMX_PTR);
  OMX_ERRORTYPE (*GetParameter)(OMX_HANDLETYPE, OMX_INDEXTYPE, OMX_PTR);
  OMX_ERRORTYPE (*SetParameter)(OMX_HANDLETYPE, OMX_INDEXTYPE, OMX_PTR);
  OMX_ERRORTYPE (*GetConfig)(OMX_HANDLETYPE, OMX_INDEXTYPE, OMX_PTR);
  OMX_ERRORTYPE (*SetConfig)(OMX_HANDLETYPE, OMX_INDEXTYPE, OMX_PTR);
  OMX_ERRORTYPE (*GetExtensionIndex)(OMX_HANDLETYPE, OMX_STRING, OMX_INDEXTYPE*);
  OMX_ERRORTYPE (*GetState)(OMX_HANDLETYPE, OMX_STATETYPE*);
  OMX_ERRORTYPE(*ComponentTunnelRequest)
  (OMX_HANDLETYPE, OMX_U32, OMX_HANDLETYPE, OMX_U32, OMX_TUNNELSETUPTYPE*);
  OMX_ERRORTYPE (*UseBuffer)(OMX_HANDLETYPE, OMX_BUFFERHEADERTYPE**, OMX_U32, OMX_PTR, OMX_U32, OMX_U8*);
  OMX_ERRORTYPE (*AllocateBuffer)(OMX_HANDLETYPE, OMX_BUFFERHEADERTYPE**, OMX_U32, OMX_PTR, OMX_U32);
  OMX_ERRORTYPE (*FreeBuffer)(OMX_HANDLETYPE, OMX_U32, OMX_BUFFERHEADERTYPE*);
  OMX_ERRORTYPE (*EmptyThisBuffer)(OMX_HANDLETYPE, OMX_BUFFERHEADERTYPE*);
  OMX_ERRORTYPE (*FillThisBuffer)(OMX_HANDLETYPE, OMX_BUFFERHEADERTYPE*);
  OMX_ERRORTYPE (*SetCallbacks)(OMX_HANDLETYPE, OMX_CALLBACKTYPE*, OMX_PTR);
  OMX_ERRORTYPE (*ComponentDeInit)(OMX_HANDLETYPE);
  OMX_ERRORTYPE (*UseEGLImage)(OMX_HANDLETYPE, OMX_BUFFERHEADERTYPE**, OMX_U32, OMX_PTR, void*);
  OMX_ERRORTYPE (*ComponentRoleEnum)(OMX_HANDLETYPE, OMX_U8*, OMX_U32);
};
