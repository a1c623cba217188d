// The basic types of OpenMAX IL 1.1. Every word has the width it has on the devices, also where the
// host's pointers are wider, so records without pointers have one layout everywhere.
// Enumerations have a fixed type of 32 bits: any value that arrives from elsewhere can be held.
#pragma once

#include <stdint.h>

#define OMX_API extern
#define OMX_IN
#define OMX_OUT
#define OMX_INOUT

// The port number that means every port.
#define OMX_ALL 0xFFFFFFFFu

typedef uint8_t OMX_U8;
typedef int8_t OMX_S8;
typedef uint16_t OMX_U16;
typedef int16_t OMX_S16;
typedef uint32_t OMX_U32;
typedef int32_t OMX_S32;
typedef uint64_t OMX_U64;
typedef int64_t OMX_S64;

enum OMX_BOOL : uint32_t { OMX_FALSE = 0, OMX_TRUE = 1, OMX_BOOL_MAX = 0x7FFFFFFF };

typedef void* OMX_PTR;
typedef char* OMX_STRING;
typedef uint8_t* OMX_BYTE;
typedef uint8_t OMX_UUIDTYPE[128];

typedef void* OMX_HANDLETYPE;
typedef void* OMX_NATIVE_DEVICETYPE;
typedef void* OMX_NATIVE_WINDOWTYPE;

// Microseconds.
typedef OMX_S64 OMX_TICKS;
#define OMX_TICKS_PER_SECOND 1000000

enum OMX_DIRTYPE : uint32_t { OMX_DirInput = 0, OMX_DirOutput = 1 };

struct OMX_MARKTYPE {
  OMX_HANDLETYPE hMarkTargetComponent;
  OMX_PTR pMarkData;
};

// 1.1.0.0 reads as the word 0x00000101.
union OMX_VERSIONTYPE {
  struct {
    OMX_U8 nVersionMajor;
    OMX_U8 nVersionMinor;
    OMX_U8 nRevision;
    OMX_U8 nStep;
  } s;
  OMX_U32 nVersion;
};
