#include "tests/faults/rules.h"

#include <cstring>
#include <iterator>

#include "tests/faults/expected.h"

namespace omxtest {

namespace {

constexpr const char* kQcom = "msm8960";
constexpr const char* kTi = "omap4";

constexpr OMX_U32 kDefinition = OMX_IndexParamPortDefinition;
constexpr OMX_U32 kFormat = OMX_IndexParamVideoPortFormat;
constexpr OMX_U32 kAvc = OMX_IndexParamVideoAvc;
constexpr OMX_U32 kRate = OMX_IndexParamVideoBitrate;
constexpr OMX_U32 kProfile = OMX_IndexParamVideoProfileLevelCurrent;
constexpr OMX_U32 kPictureOrder = 0x7F000010;
constexpr OMX_U32 kPacking = 0x7F000002;

constexpr OMX_U32 state(OMX_U32 param) {
  return 100 * (OMX_CommandStateSet + 1) + param;
}
constexpr OMX_U32 kDisable = 100 * (OMX_CommandPortDisable + 1) + 1;
constexpr OMX_U32 kEnable = 100 * (OMX_CommandPortEnable + 1) + 1;

constexpr const char* kGeometry =
    "OMXINTERFACE - SETUP PORT PARAMETERS: Set Port Definition Failed: $status\n";
constexpr const char* kNoDefinition =
    "OMXINTERFACE - ALLOCATE BUFFERS: Could not get port definition: $status";
constexpr const char* kNoEmpty = "OMXINTERFACE - ETB::emptyBuffer failed w/ error 0x$hex \n";

using enum Step;
using enum Method;
using enum Effect;

// clang-format off
const Rule kRules[] = {
    // The way to the component.
    {nullptr, 'B', Create, ListNodes, 0, -1, 0, 6, "OMXINTERFACE: CODEC NOT FOUND: $name"},
    {nullptr, 'B', Create, AllocateNode, 0, -1, 0, 4, "OMXINTERFACE - Could not allocate node: $name -- error $status"},

    // An encoder's settings end its creation.
    {kQcom, 'E', Create, GetParameter, kDefinition, 1, 2, 13, "OMXINTERFACE - BITRATE: ERROR getting port definition: $status"},
    {kQcom, 'E', Create, SetParameter, kDefinition, 1, 2, 14, "OMXINTERFACE - BITRATE: ERROR setting port definition: $status"},
    {kQcom, 'E', Create, GetParameter, kDefinition, -1, 0, 13, ""},
    {kQcom, 'E', Create, SetParameter, kDefinition, -1, 0, 14, kGeometry},
    {kQcom, 'E', Create, GetParameter, kAvc, 1, 0, 34, "OMXINTERFACE - RATE CONTROL: ERROR getting avc parameters: $status"},
    {kQcom, 'E', Create, SetParameter, kAvc, 1, 0, 35, "OMXINTERFACE - RATE CONTROL: ERROR setting avc parameters: $status"},
    {kQcom, 'E', Create, GetParameter, kRate, 1, 0, 17, "OMXINTERFACE - RATE CONTROL: ERROR getting bitrate parameters: $status"},
    {kQcom, 'E', Create, SetParameter, kRate, 1, 0, 18, "OMXINTERFACE - RATE CONTROL: ERROR setting bitrate parameters: $status"},
    {kTi, 'E', Create, GetParameter, kFormat, 0, 0, -1, "get OMX_IndexParamVideoPortFormat InPort Error:0x$hex. OMX_ErrorUnsupportedIndex=0x8000101a"},
    {kTi, 'E', Create, SetParameter, kFormat, 0, 0, -1, "set OMX_IndexParamVideoPortFormat InPort Error:$status"},
    {kTi, 'E', Create, GetParameter, kFormat, 1, 0, -1, "get OMX_IndexParamVideoPortFormat OutPort Error:$status"},
    {kTi, 'E', Create, SetParameter, kFormat, 1, 0, -1, "set OMX_IndexParamVideoPortFormat OutPort Error:$status"},
    {kTi, 'E', Create, GetParameter, kDefinition, 0, 0, -1, "get OMX_IndexParamPortDefinition InPort Error:$status"},
    {kTi, 'E', Create, SetParameter, kDefinition, 0, 0, -1, "set OMX_IndexParamPortDefinition InPort Error:$status"},
    {kTi, 'E', Create, GetParameter, kDefinition, 1, 0, -1, "get OMX_IndexParamPortDefinition OutPort Error:$status"},
    {kTi, 'E', Create, SetParameter, kDefinition, 1, 0, -1, "set OMX_IndexParamPortDefinition OutPort Error:$status"},
    {kTi, 'E', Create, GetParameter, kAvc, 1, 0, -1, "get OMX_IndexParamVideoAvc failed : $status"},
    {kTi, 'E', Create, SetParameter, kAvc, 1, 0, -1, "set OMX_IndexParamVideoAvc failed : $status"},
    {kTi, 'E', Create, GetParameter, kProfile, 1, 0, -1, "get OMX_IndexParamVideoProfileLevelCurrent failed : $status"},
    {kTi, 'E', Create, SetParameter, kProfile, 1, 0, -1, "set OMX_IndexParamVideoProfileLevelCurrent failed : $status"},
    {kTi, 'E', Create, GetParameter, kRate, 1, 0, -1, "get OMX_IndexParamVideoBitrate failed : $status"},
    {kTi, 'E', Create, SetParameter, kRate, 1, 0, -1, ""},
    {kTi, 'E', Create, StoreMetaDataInBuffers, 0, 0, 0, -1, "Storing meta data in video buffers is not supported"},

    // A decoder can do without its settings, but not without its size.
    {kQcom, 'D', Create, SetParameter, kPictureOrder, 0, 0, 0, "OMXINTERFACE: Set Decode Order Failed: $status"},
    {kTi, 'D', Create, GetParameter, kFormat, 1, 0, 0, "get OMX_IndexParamVideoPortFormat OutPort Error:$status"},
    {kTi, 'D', Create, SetParameter, kFormat, 1, 0, 0, "set OMX_IndexParamVideoPortFormat OutPort Error:$status"},
    {kTi, 'D', Create, GetParameter, kDefinition, 0, 1, 0, "get OMX_IndexParamPortDefinition InPort Error:$status"},
    {kTi, 'D', Create, SetParameter, kDefinition, 0, 1, 0, "set OMX_IndexParamPortDefinition InPort Error:$status"},
    {kTi, 'D', Create, GetParameter, kDefinition, 1, 0, 0, "get OMX_IndexParamPortDefinition OutPort Error:$status"},
    {kTi, 'D', Create, SetParameter, kDefinition, 1, 0, 0, "=====set OMX_IndexParamPortDefinition OutPort Error:$status"},
    {nullptr, 'D', Create, GetParameter, kDefinition, 0, 0, 13, ""},
    {nullptr, 'D', Create, SetParameter, kDefinition, 0, 0, 14, kGeometry},

    {nullptr, 'E', Configure, SetConfig, 0, -1, 0, 33, "===qoxtest setConfig Error $index!"},
    {nullptr, 'D', Configure, GetParameter, kDefinition, 0, 1, -1, "OMXINTERFACE - Could not get parameters for Video Compression Format ($status)"},
    {nullptr, 'D', Configure, SetParameter, kDefinition, 0, 1, -1, "OMXINTERFACE - Could not set Video Compression Format"},
    {kQcom, 'D', Configure, SetParameter, kPacking, 0, 0, 31, "OMXINTERFACE - Could not set input frame packing format ($status)"},
    {nullptr, 'D', Configure, GetParameter, kDefinition, 0, 2, -1, "get OMX_IndexParamPortDefinition InPort Error:$status"},

    {nullptr, 'B', Init, SendCommand, state(OMX_StateIdle), -1, 0, 20, ""},
    {nullptr, 'B', Init, SendCommand, state(OMX_StateExecuting), -1, 0, 21, ""},
    {nullptr, 'B', Init, GetParameter, kDefinition, -1, 0, 13, kNoDefinition},
    {kQcom, 'B', Init, UseBuffer, 0, -1, 0, 15, kNoBuffer},
    {nullptr, 'B', Init, AllocateBufferWithBackup, 0, -1, 0, 15, kNoBuffer},
    {nullptr, 'B', Init, FillBuffer, 0, -1, 0, 8, kNoFill},

    // Traffic goes on.
    {nullptr, 'E', Feed, EmptyBuffer, 0, -1, 0, -1, "OMXINTERFACE - SEND INPUT BUFFER::emptyBuffer failed w/ error 0x$hex \n", TakesTheInput},
    {nullptr, 'D', Feed, EmptyBuffer, 0, -1, 0, -2, kNoEmpty, TakesTheInput},
    {nullptr, 'D', FeedMore, EmptyBuffer, 0, -1, 0, -2, kNoEmpty, TakesTheInput},
    {nullptr, 'D', Feed, GetParameter, kDefinition, 1, 0, 0, "", LosesAPicture},
    {nullptr, 'D', FeedMore, GetParameter, kDefinition, 1, 0, 0, "", LosesAPicture},
    {kTi, 'D', Feed, GetConfig, OMX_IndexConfigCommonOutputCrop, 1, 0, 0, "getConfig of OutputCrop: err=$hex", LosesAPicture},
    {kTi, 'D', FeedMore, GetConfig, OMX_IndexConfigCommonOutputCrop, 1, 0, 0, "getConfig of OutputCrop: err=$hex", LosesAPicture},
    {nullptr, 'B', Feed, FillBuffer, 0, -1, 0, 0, kNoFill},
    {nullptr, 'D', FeedMore, FillBuffer, 0, -1, 0, 0, kNoFill},

    // A reconfiguration's failure is the session's, or leaves it draining.
    {nullptr, 'D', Reconfigure, SendCommand, kDisable, -1, 0, 0, "ERROR: PORT SETTING CHANGED - Unable to send command to disable port: error $status\n", EndsTheOutput},
    {nullptr, 'D', Reconfigure, GetParameter, kDefinition, 1, 1, 0, ""},
    {nullptr, 'D', Reconfigure, FreeBuffer, 0, 1, 0, 0, "", EndsTheOutput},
    {nullptr, 'D', Reconfigure, SendCommand, kEnable, -1, 0, 20, "Unable to send command state enabling port: error $status\n"},
    {nullptr, 'D', Reconfigure, GetParameter, kDefinition, 1, 2, 13, kNoDefinition},
    {nullptr, 'D', Reconfigure, AllocateBufferWithBackup, 0, 1, 0, 15, kNoBuffer},
    {nullptr, 'D', Reconfigure, FillBuffer, 0, -1, 1, 0, kNoFill, EndsTheOutput},  // nor are the others filled
    {nullptr, 'D', Reconfigure, FillBuffer, 0, -1, 0, 0, kNoFill},

    {nullptr, 'B', EndOfInput, EmptyBuffer, 0, -1, 0, -2, kNoEmpty, EndsTheOutput},
    {nullptr, 'B', DeInit, SendCommand, state(OMX_StateIdle), -1, 0, 20, "Error Sending Idle State: $status\n"},
    {nullptr, 'B', DeInit, SendCommand, state(OMX_StateLoaded), -1, 0, 20, "OMXINTERFACE - Error Sending Loaded State: $status\n"},
    {nullptr, 'B', DeInit, FreeBuffer, 0, -1, 0, 0, "", EndsTheOutput},
    {nullptr, 'B', Destroy, FreeNode, 0, -1, 0, 0, ""},
};
// clang-format on

OMX_U32 whatOf(const Call& call) {
  if (call.method != SendCommand) return static_cast<OMX_U32>(call.index);
  return 100 * (static_cast<OMX_U32>(call.command) + 1) + static_cast<OMX_U32>(call.param);
}

bool fits(const Rule& rule, const Subject& subject, const Hit& hit) {
  return (rule.device == nullptr || strcmp(rule.device, subject.device) == 0) &&
         (rule.session == 'B' || (rule.session == 'E') == subject.encoding) && rule.step == hit.step &&
         rule.method == hit.call.method && (rule.what == 0 || rule.what == whatOf(hit.call)) &&
         (rule.port < 0 || static_cast<OMX_U32>(rule.port) == hit.port) &&
         (rule.nth == 0 || rule.nth == hit.nth);
}

}  // namespace

const Rule* findRule(const Subject& subject, const Hit& hit) {
  for (const Rule& rule : kRules) {
    if (fits(rule, subject, hit)) return &rule;
  }
  return nullptr;
}

}  // namespace omxtest
