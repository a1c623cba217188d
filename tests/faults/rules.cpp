#include <cstring>
#include <string_view>

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
constexpr const char* kNoFormat = "$get OMX_IndexParamVideoPortFormat $sidePort Error:$status";
constexpr const char* kNoPort = "$get OMX_IndexParamPortDefinition $sidePort Error:$status";
constexpr const char* kNoEmpty = "OMXINTERFACE - ETB::emptyBuffer failed w/ error 0x$hex \n";

using enum Step;
using enum Effect;

// clang-format off
const Rule kRules[] = {
    // The way to the component.
    {nullptr, 'B', Create, "listNodes", 0, -1, 0, 6, "OMXINTERFACE: CODEC NOT FOUND: $name"},
    {nullptr, 'B', Create, "allocateNode", 0, -1, 0, 4, "OMXINTERFACE - Could not allocate node: $name -- error $status"},

    // An encoder's settings end its creation.
    {kQcom, 'E', Create, "Parameter", kDefinition, 1, 2, 13, "OMXINTERFACE - BITRATE: ERROR $getting port definition: $status"},
    {kQcom, 'E', Create, "getParameter", kDefinition, -1, 0, 13, ""},
    {kQcom, 'E', Create, "setParameter", kDefinition, -1, 0, 14, kGeometry},
    {kQcom, 'E', Create, "Parameter", kAvc, 1, 0, 34, "OMXINTERFACE - RATE CONTROL: ERROR $getting avc parameters: $status"},
    {kQcom, 'E', Create, "Parameter", kRate, 1, 0, 17, "OMXINTERFACE - RATE CONTROL: ERROR $getting bitrate parameters: $status"},
    {kTi, 'E', Create, "getParameter", kFormat, 0, 0, -1, "get OMX_IndexParamVideoPortFormat InPort Error:0x$hex. OMX_ErrorUnsupportedIndex=0x8000101a"},
    {kTi, 'E', Create, "Parameter", kFormat, -1, 0, -1, kNoFormat},
    {kTi, 'E', Create, "Parameter", kDefinition, -1, 0, -1, kNoPort},
    {kTi, 'E', Create, "Parameter", kAvc, 1, 0, -1, "$get OMX_IndexParamVideoAvc failed : $status"},
    {kTi, 'E', Create, "Parameter", kProfile, 1, 0, -1, "$get OMX_IndexParamVideoProfileLevelCurrent failed : $status"},
    {kTi, 'E', Create, "getParameter", kRate, 1, 0, -1, "get OMX_IndexParamVideoBitrate failed : $status"},
    {kTi, 'E', Create, "setParameter", kRate, 1, 0, -1, ""},
    {kTi, 'E', Create, "storeMetaDataInBuffers", 0, 0, 0, -1, "Storing meta data in video buffers is not supported"},

    // A decoder can do without its settings, but not without its size.
    {kQcom, 'D', Create, "setParameter", kPictureOrder, 0, 0, 0, "OMXINTERFACE: Set Decode Order Failed: $status"},
    {kTi, 'D', Create, "Parameter", kFormat, 1, 0, 0, kNoFormat},
    {kTi, 'D', Create, "setParameter", kDefinition, 1, 0, 0, "=====set OMX_IndexParamPortDefinition OutPort Error:$status"},
    {kTi, 'D', Create, "Parameter", kDefinition, -1, 1, 0, kNoPort},
    {nullptr, 'D', Create, "getParameter", kDefinition, 0, 0, 13, ""},
    {nullptr, 'D', Create, "setParameter", kDefinition, 0, 0, 14, kGeometry},

    {nullptr, 'E', Configure, "setConfig", 0, -1, 0, 33, "===qoxtest setConfig Error $index!"},
    {nullptr, 'D', Configure, "getParameter", kDefinition, 0, 1, -1, "OMXINTERFACE - Could not get parameters for Video Compression Format ($status)"},
    {nullptr, 'D', Configure, "setParameter", kDefinition, 0, 1, -1, "OMXINTERFACE - Could not set Video Compression Format"},
    {kQcom, 'D', Configure, "setParameter", kPacking, 0, 0, 31, "OMXINTERFACE - Could not set input frame packing format ($status)"},
    {nullptr, 'D', Configure, "getParameter", kDefinition, 0, 2, -1, kNoPort},

    {nullptr, 'B', Init, "sendCommand", state(OMX_StateIdle), -1, 0, 20, ""},
    {nullptr, 'B', Init, "sendCommand", state(OMX_StateExecuting), -1, 0, 21, ""},
    {nullptr, 'B', Init, "getParameter", kDefinition, -1, 0, 13, kNoDefinition},
    {kQcom, 'B', Init, "useBuffer", 0, -1, 0, 15, kNoBuffer},
    {nullptr, 'B', Init, "allocateBufferWithBackup", 0, -1, 0, 15, kNoBuffer},
    {nullptr, 'B', Init, "fillBuffer", 0, -1, 0, 8, kNoFill},

    // Traffic goes on, and does so in both feeding steps.
    {nullptr, 'E', Feed, "emptyBuffer", 0, -1, 0, -1, "OMXINTERFACE - SEND INPUT BUFFER::emptyBuffer failed w/ error 0x$hex \n", TakesTheInput},
    {nullptr, 'D', Feed, "emptyBuffer", 0, -1, 0, -2, kNoEmpty, TakesTheInput},
    {nullptr, 'D', Feed, "getParameter", kDefinition, 1, 0, 0, "", LosesAPicture},
    {kTi, 'D', Feed, "getConfig", OMX_IndexConfigCommonOutputCrop, 1, 0, 0, "getConfig of OutputCrop: err=$hex", LosesAPicture},
    {nullptr, 'B', Feed, "fillBuffer", 0, -1, 0, 0, kNoFill},

    // A reconfiguration's failure is the session's, or leaves it draining.
    {nullptr, 'D', Reconfigure, "sendCommand", kDisable, -1, 0, 0, "ERROR: PORT SETTING CHANGED - Unable to send command to disable port: error $status\n", EndsTheOutput},
    {nullptr, 'D', Reconfigure, "getParameter", kDefinition, 1, 1, 0, ""},
    {nullptr, 'D', Reconfigure, "freeBuffer", 0, 1, 0, 0, "", EndsTheOutput},
    {nullptr, 'D', Reconfigure, "sendCommand", kEnable, -1, 0, 20, "Unable to send command state enabling port: error $status\n"},
    {nullptr, 'D', Reconfigure, "getParameter", kDefinition, 1, 2, 13, kNoDefinition},
    {nullptr, 'D', Reconfigure, "allocateBufferWithBackup", 0, 1, 0, 15, kNoBuffer},
    {nullptr, 'D', Reconfigure, "fillBuffer", 0, -1, 1, 0, kNoFill, EndsTheOutput},  // nor are the others filled
    {nullptr, 'D', Reconfigure, "fillBuffer", 0, -1, 0, 0, kNoFill},

    {nullptr, 'B', EndOfInput, "emptyBuffer", 0, -1, 0, -2, kNoEmpty, EndsTheOutput},
    {nullptr, 'B', DeInit, "sendCommand", state(OMX_StateIdle), -1, 0, 20, "Error Sending Idle State: $status\n"},
    {nullptr, 'B', DeInit, "sendCommand", state(OMX_StateLoaded), -1, 0, 20, "OMXINTERFACE - Error Sending Loaded State: $status\n"},
    {nullptr, 'B', DeInit, "freeBuffer", 0, -1, 0, 0, "", EndsTheOutput},
    {nullptr, 'B', Destroy, "freeNode", 0, -1, 0, 0, ""},
};
// clang-format on

OMX_U32 whatOf(const Call& call) {
  if (call.method != Method::SendCommand) return static_cast<OMX_U32>(call.index);
  return 100 * (static_cast<OMX_U32>(call.command) + 1) + static_cast<OMX_U32>(call.param);
}

bool fits(const Rule& rule, const Subject& subject, const Hit& hit) {
  return (rule.device == nullptr || strcmp(rule.device, subject.device) == 0) &&
         (rule.session == 'B' || (rule.session == 'E') == subject.encoding) &&
         rule.step == (hit.step == FeedMore ? Feed : hit.step) &&
         std::string_view(name(hit.call.method)).ends_with(rule.method) &&
         (rule.what == 0 || rule.what == whatOf(hit.call)) &&
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
