// Commands, states, events, error codes, buffer flags, and the records that belong to no domain.
#pragma once

#include <OMX_Types.h>

#define OMX_MAX_STRINGNAME_SIZE 128  // terminator included

enum OMX_COMMANDTYPE : uint32_t {
  OMX_CommandStateSet = 0,
  OMX_CommandFlush = 1,
  OMX_CommandPortDisable = 2,
  OMX_CommandPortEnable = 3,
  OMX_CommandMarkBuffer = 4
};

enum OMX_STATETYPE : uint32_t {
  OMX_StateInvalid = 0,
  OMX_StateLoaded = 1,
  OMX_StateIdle = 2,
  OMX_StateExecuting = 3,
  OMX_StatePause = 4,
  OMX_StateWaitForResources = 5
};

enum OMX_EVENTTYPE : uint32_t {
  OMX_EventCmdComplete = 0,
  OMX_EventError = 1,
  OMX_EventMark = 2,
  OMX_EventPortSettingsChanged = 3,
  OMX_EventBufferFlag = 4,
  OMX_EventResourcesAcquired = 5,
  OMX_EventComponentResumed = 6,
  OMX_EventDynamicResourcesAvailable = 7,
  OMX_EventPortFormatDetected = 8
};

enum OMX_BUFFERSUPPLIERTYPE : uint32_t {
  OMX_BufferSupplyUnspecified = 0,
  OMX_BufferSupplyInput = 1,
  OMX_BufferSupplyOutput = 2
};

// Signed, so that a failure is negative.
enum OMX_ERRORTYPE : int32_t {
  OMX_ErrorNone = 0,
  OMX_ErrorInsufficientResources = INT32_MIN + 0x1000,  // 0x80001000
  OMX_ErrorUndefined,
  OMX_ErrorInvalidComponentName,
  OMX_ErrorComponentNotFound,
  OMX_ErrorInvalidComponent,
  OMX_ErrorBadParameter,
  OMX_ErrorNotImplemented,
  OMX_ErrorUnderflow,
  OMX_ErrorOverflow,
  OMX_ErrorHardware,
  OMX_ErrorInvalidState,
  OMX_ErrorStreamCorrupt,
  OMX_ErrorPortsNotCompatible,
  OMX_ErrorResourcesLost,
  OMX_ErrorNoMore,
  OMX_ErrorVersionMismatch,
  OMX_ErrorNotReady,  // 0x80001010
  OMX_ErrorTimeout,
  OMX_ErrorSameState,
  OMX_ErrorResourcesPreempted,
  OMX_ErrorPortUnresponsiveDuringAllocation,
  OMX_ErrorPortUnresponsiveDuringDeallocation,
  OMX_ErrorPortUnresponsiveDuringStop,
  OMX_ErrorIncorrectStateTransition,
  OMX_ErrorIncorrectStateOperation,
  OMX_ErrorUnsupportedSetting,
  OMX_ErrorUnsupportedIndex,  // 0x8000101A
  OMX_ErrorBadPortIndex,
  OMX_ErrorPortUnpopulated,
  OMX_ErrorComponentSuspended,
  OMX_ErrorDynamicResourcesUnavailable,
  OMX_ErrorMbErrorsInFrame,
  OMX_ErrorFormatNotDetected,  // 0x80001020
  OMX_ErrorContentPipeOpenFailed,
  OMX_ErrorContentPipeCreationFailed,
  OMX_ErrorSeperateTablesUsed,
  OMX_ErrorTunnelingUnsupported,
  OMX_ErrorKhronosExtensions = INT32_MIN + 0x0F000000,  // 0x8F000000
  OMX_ErrorVendorStartUnused = INT32_MIN + 0x10000000   // 0x90000000
};

#define OMX_BUFFERFLAG_EOS 0x00000001u
#define OMX_BUFFERFLAG_STARTTIME 0x00000002u
#define OMX_BUFFERFLAG_DECODEONLY 0x00000004u
#define OMX_BUFFERFLAG_DATACORRUPT 0x00000008u
#define OMX_BUFFERFLAG_ENDOFFRAME 0x00000010u
#define OMX_BUFFERFLAG_SYNCFRAME 0x00000020u  // a key frame
#define OMX_BUFFERFLAG_EXTRADATA 0x00000040u
#define OMX_BUFFERFLAG_CODECCONFIG 0x00000080u  // parameter sets

struct OMX_PORT_PARAM_TYPE {
  OMX_U32 nSize;
  OMX_VERSIONTYPE nVersion;
  OMX_U32 nPorts;
  OMX_U32 nStartPortNumber;
};

struct OMX_PRIORITYMGMTTYPE {
  OMX_U32 nSize;
  OMX_VERSIONTYPE nVersion;
  OMX_U32 nGroupPriority;
  OMX_U32 nGroupID;
};

struct OMX_PARAM_COMPONENTROLETYPE {
  OMX_U32 nSize;
  OMX_VERSIONTYPE nVersion;
  OMX_U8 cRole[OMX_MAX_STRINGNAME_SIZE];
};

struct OMX_PARAM_BUFFERSUPPLIERTYPE {
  OMX_U32 nSize;
  OMX_VERSIONTYPE nVersion;
  OMX_U32 nPortIndex;
  OMX_BUFFERSUPPLIERTYPE eBufferSupplier;
};

struct OMX_TUNNELSETUPTYPE {
  OMX_U32 nTunnelFlags;
  OMX_BUFFERSUPPLIERTYPE eSupplier;
};

struct OMX_BUFFERHEADERTYPE {
  OMX_U32 nSize;
  OMX_VERSIONTYPE nVersion;
  OMX_U8* pBuffer;
  OMX_U32 nAllocLen;
  OMX_U32 nFilledLen;
  OMX_U32 nOffset;
  OMX_PTR pAppPrivate;
  OMX_PTR pPlatformPrivate;
  OMX_PTR pInputPortPrivate;
  OMX_PTR pOutputPortPrivate;
  OMX_HANDLETYPE hMarkTargetComponent;
  OMX_PTR pMarkData;
  OMX_U32 nTickCount;
  OMX_TICKS nTimeStamp;
  OMX_U32 nFlags;
  OMX_U32 nOutputPortIndex;
  OMX_U32 nInputPortIndex;
};

struct OMX_CALLBACKTYPE {
  OMX_ERRORTYPE(*EventHandler)
  (OMX_HANDLETYPE hComponent, OMX_PTR pAppData, OMX_EVENTTYPE eEvent, OMX_U32 nData1, OMX_U32 nData2,
   OMX_PTR pEventData);
  OMX_ERRORTYPE(*EmptyBufferDone)
  (OMX_HANDLETYPE hComponent, OMX_PTR pAppData, OMX_BUFFERHEADERTYPE* pBuffer);
  OMX_ERRORTYPE (*FillBufferDone)(OMX_HANDLETYPE hComponent, OMX_PTR pAppData, OMX_BUFFERHEADERTYPE* pBuffer);
};
