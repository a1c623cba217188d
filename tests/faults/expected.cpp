#include "tests/faults/expected.h"

#include <fnmatch.h>

#include <algorithm>
#include <string_view>

#include "omxbridge/omxbridge.h"

namespace omxtest {

namespace {

// --- What a refused IOMX call leads to: one row for all calls of a kind. The first row that fits counts. ---

enum class Effect {
  None,
  LosesAPicture,
  EndsTheOutput,  // the end of the stream does not come out, or the component does not let go of its buffers
  TakesTheInput   // a buffer stays handed out
};

struct Rule {
  const char* device;  // null: both
  char session;        // 'E', 'D', or 'B' for both
  Step step;
  const char* method;  // its name's end: "Parameter" for both ways
  OMX_U32 what;        // index, or 100 * (command + 1) + its parameter; 0: any
  int port;            // -1: any
  size_t nth;          // of its like in the step; 0: any further one
  int code;            // the step's result, of a reconfiguration that of the end; see codeOf()
  std::string line;    // of the error log, with the wildcards of fnmatch(); empty: silence
  Effect effect = Effect::None;
};

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
    "OMXINTERFACE - SETUP PORT PARAMETERS: Set Port Definition Failed: -2147483648\n";
constexpr const char* kNoDefinition =
    "OMXINTERFACE - ALLOCATE BUFFERS: Could not get port definition: -2147483648";
constexpr const char* kNoFormat = "[gs]et OMX_IndexParamVideoPortFormat *Port Error:-2147483648";
constexpr const char* kNoPort = "[gs]et OMX_IndexParamPortDefinition *Port Error:-2147483648";
constexpr const char* kNoFill = "OMXINTERFACE - fillBuffer failed w/ error 0x80000000";
constexpr const char* kNoBuffer =
    "OMXINTERFACE - Could not allocate memory: port * buffer * error -2147483648(0x80000000)\n";
constexpr const char* kNoEmpty = "OMXINTERFACE - ETB::emptyBuffer failed w/ error 0x80000000 \n";

using enum Step;
using enum Effect;

// clang-format off
const Rule kRules[] = {
    // The way to the component.
    {nullptr, 'B', Create, "listNodes", 0, -1, 0, 6, "OMXINTERFACE: CODEC NOT FOUND: OMX.*"},
    {nullptr, 'B', Create, "allocateNode", 0, -1, 0, 4, "OMXINTERFACE - Could not allocate node: OMX.* -- error -2147483648"},

    // An encoder's settings end its creation.
    {kQcom, 'E', Create, "Parameter", kDefinition, 1, 2, 13, "OMXINTERFACE - BITRATE: ERROR [gs]etting port definition: -2147483648"},
    {kQcom, 'E', Create, "getParameter", kDefinition, -1, 0, 13, ""},
    {kQcom, 'E', Create, "setParameter", kDefinition, -1, 0, 14, kGeometry},
    {kQcom, 'E', Create, "Parameter", kAvc, 1, 0, 34, "OMXINTERFACE - RATE CONTROL: ERROR [gs]etting avc parameters: -2147483648"},
    {kQcom, 'E', Create, "Parameter", kRate, 1, 0, 17, "OMXINTERFACE - RATE CONTROL: ERROR [gs]etting bitrate parameters: -2147483648"},
    {kTi, 'E', Create, "getParameter", kFormat, 0, 0, -1, "get OMX_IndexParamVideoPortFormat InPort Error:0x80000000. OMX_ErrorUnsupportedIndex=0x8000101a"},
    {kTi, 'E', Create, "Parameter", kFormat, -1, 0, -1, kNoFormat},
    {kTi, 'E', Create, "Parameter", kDefinition, -1, 0, -1, kNoPort},
    {kTi, 'E', Create, "Parameter", kAvc, 1, 0, -1, "[gs]et OMX_IndexParamVideoAvc failed : -2147483648"},
    {kTi, 'E', Create, "Parameter", kProfile, 1, 0, -1, "[gs]et OMX_IndexParamVideoProfileLevelCurrent failed : -2147483648"},
    {kTi, 'E', Create, "getParameter", kRate, 1, 0, -1, "get OMX_IndexParamVideoBitrate failed : -2147483648"},
    {kTi, 'E', Create, "setParameter", kRate, 1, 0, -1, ""},
    {kTi, 'E', Create, "storeMetaDataInBuffers", 0, 0, 0, -1, "Storing meta data in video buffers is not supported"},

    // A decoder can do without its settings, but not without its size.
    {kQcom, 'D', Create, "setParameter", kPictureOrder, 0, 0, 0, "OMXINTERFACE: Set Decode Order Failed: -2147483648"},
    {kTi, 'D', Create, "Parameter", kFormat, 1, 0, 0, kNoFormat},
    {kTi, 'D', Create, "setParameter", kDefinition, 1, 0, 0, "=====set OMX_IndexParamPortDefinition OutPort Error:-2147483648"},
    {kTi, 'D', Create, "Parameter", kDefinition, -1, 1, 0, kNoPort},
    {nullptr, 'D', Create, "getParameter", kDefinition, 0, 0, 13, ""},
    {nullptr, 'D', Create, "setParameter", kDefinition, 0, 0, 14, kGeometry},

    {nullptr, 'E', Configure, "setConfig", 0, -1, 0, 33, "===qoxtest setConfig Error *!"},
    {nullptr, 'D', Configure, "getParameter", kDefinition, 0, 1, -1, "OMXINTERFACE - Could not get parameters for Video Compression Format (-2147483648)"},
    {nullptr, 'D', Configure, "setParameter", kDefinition, 0, 1, -1, "OMXINTERFACE - Could not set Video Compression Format"},
    {kQcom, 'D', Configure, "setParameter", kPacking, 0, 0, 31, "OMXINTERFACE - Could not set input frame packing format (-2147483648)"},
    {nullptr, 'D', Configure, "getParameter", kDefinition, 0, 2, -1, kNoPort},

    {nullptr, 'B', Init, "sendCommand", state(OMX_StateIdle), -1, 0, 20, ""},
    {nullptr, 'B', Init, "sendCommand", state(OMX_StateExecuting), -1, 0, 21, ""},
    {nullptr, 'B', Init, "getParameter", kDefinition, -1, 0, 13, kNoDefinition},
    {kQcom, 'B', Init, "useBuffer", 0, -1, 0, 15, kNoBuffer},
    {nullptr, 'B', Init, "allocateBufferWithBackup", 0, -1, 0, 15, kNoBuffer},
    {nullptr, 'B', Init, "fillBuffer", 0, -1, 0, 8, kNoFill},

    // Traffic goes on, and does so in both feeding steps.
    {nullptr, 'E', Feed, "emptyBuffer", 0, -1, 0, -1, "OMXINTERFACE - SEND INPUT BUFFER::emptyBuffer failed w/ error 0x80000000 \n", TakesTheInput},
    {nullptr, 'D', Feed, "emptyBuffer", 0, -1, 0, -2, kNoEmpty, TakesTheInput},
    {nullptr, 'D', Feed, "getParameter", kDefinition, 1, 0, 0, "", LosesAPicture},
    {kTi, 'D', Feed, "getConfig", OMX_IndexConfigCommonOutputCrop, 1, 0, 0, "getConfig of OutputCrop: err=80000000", LosesAPicture},
    {nullptr, 'B', Feed, "fillBuffer", 0, -1, 0, 0, kNoFill},

    // A reconfiguration's failure is the session's, or leaves it draining.
    {nullptr, 'D', Reconfigure, "sendCommand", kDisable, -1, 0, 0, "ERROR: PORT SETTING CHANGED - Unable to send command to disable port: error -2147483648\n", EndsTheOutput},
    {nullptr, 'D', Reconfigure, "getParameter", kDefinition, 1, 1, 0, ""},
    {nullptr, 'D', Reconfigure, "freeBuffer", 0, 1, 0, 0, "", EndsTheOutput},
    {nullptr, 'D', Reconfigure, "sendCommand", kEnable, -1, 0, 20, "Unable to send command state enabling port: error -2147483648\n"},
    {nullptr, 'D', Reconfigure, "getParameter", kDefinition, 1, 2, 13, kNoDefinition},
    {nullptr, 'D', Reconfigure, "allocateBufferWithBackup", 0, 1, 0, 15, kNoBuffer},
    {nullptr, 'D', Reconfigure, "fillBuffer", 0, -1, 1, 0, kNoFill, EndsTheOutput},  // nor are the others filled
    {nullptr, 'D', Reconfigure, "fillBuffer", 0, -1, 0, 0, kNoFill},

    {nullptr, 'B', EndOfInput, "emptyBuffer", 0, -1, 0, -2, kNoEmpty, EndsTheOutput},
    {nullptr, 'B', DeInit, "sendCommand", state(OMX_StateIdle), -1, 0, 20, "Error Sending Idle State: -2147483648\n"},
    {nullptr, 'B', DeInit, "sendCommand", state(OMX_StateLoaded), -1, 0, 20, "OMXINTERFACE - Error Sending Loaded State: -2147483648\n"},
    {nullptr, 'B', DeInit, "freeBuffer", 0, -1, 0, 0, "", EndsTheOutput},
    {nullptr, 'B', Destroy, "freeNode", 0, -1, 0, 0, ""},
};
// clang-format on

OMX_U32 whatOf(const Call& call) {
  if (call.method != Method::SendCommand) return static_cast<OMX_U32>(call.index);
  return 100 * (static_cast<OMX_U32>(call.command) + 1) + static_cast<OMX_U32>(call.param);
}

bool fits(const Rule& rule, const Subject& subject, const Hit& hit) {
  return (rule.device == nullptr || std::string_view(rule.device) == subject.device) &&
         (rule.session == 'B' || (rule.session == 'E') == subject.encoding) &&
         rule.step == (hit.step == FeedMore ? Feed : hit.step) &&
         std::string_view(name(hit.call.method)).ends_with(rule.method) &&
         (rule.what == 0 || rule.what == whatOf(hit.call)) &&
         (rule.port < 0 || static_cast<OMX_U32>(rule.port) == hit.port) &&
         (rule.nth == 0 || rule.nth == hit.nth);
}

// Where a row is for both ways its positive code is the get's; the set's is the next one.
int codeOf(const Rule& rule, const Call& refused) {
  const bool set = rule.method == std::string("Parameter") && refused.method == Method::SetParameter;
  return set && rule.code > 0 ? rule.code + 1 : rule.code;
}

// --- What any fault leads to ---

struct Expected {
  std::map<Step, int> results;             // those that are not 0
  std::optional<Step> stuck;               // waits for what the fault keeps back
  LogLines lines;                          // besides those of every life; with wildcards
  std::string maybe;                       // one that depends on who is quicker; empty: none
  std::optional<size_t> picturesLost = 0;  // nothing: does not matter
};

// No session: the last line says so, and why in words.
void addCreationLines(const Subject& subject, const Hit& hit, Expected* result) {
  const auto code = result->results.find(Step::Create);
  if (code == result->results.end()) return;
  const bool configuring =
      hit.call.method >= Method::GetParameter && hit.call.method <= Method::StoreMetaDataInBuffers;
  if (subject.encoding && configuring) {
    result->lines.emplace_back("E OMXINTERFACE - ?ENC? Init: failed to setup params!");
  }
  result->lines.push_back(std::string("E OMXINTERFACE - ERROR creating ") +
                          (subject.encoding ? "encoder: " : "decoder: ") + std::to_string(code->second) +
                          " (" + resultDescription(code->second) + ")");
}

// Without an input buffer nothing more is fed, and the end mark waits for one.
void runOutOfInput(const Subject& subject, const Hit& hit, Expected* result) {
  if (subject.inputs() > 1 || hit.step == Step::EndOfInput) return;
  result->stuck = Step::EndOfInput;
  result->picturesLost.reset();
  if (subject.encoding) return;  // drops the frames without a word
  if (hit.nth < kFrames) result->results.try_emplace(hit.step, -1);
  if (hit.step == Step::Feed) result->results[Step::FeedMore] = -1;
}

Expected refused(const Subject& subject, const Hit& hit) {
  const auto rule = std::find_if(std::begin(kRules), std::end(kRules),
                                 [&](const Rule& each) { return fits(each, subject, hit); });
  Expected result;
  if (rule == std::end(kRules)) {
    result.lines.emplace_back("no rule for this call");
    return result;
  }
  // A failure of the event thread's comes out when the session is taken down.
  const Step step = hit.step == Step::Reconfigure ? Step::DeInit : hit.step;
  if (rule->code != 0) result.results[step] = codeOf(*rule, hit.call);
  if (!rule->line.empty()) result.lines.push_back("E " + rule->line);
  if (rule->effect == Effect::EndsTheOutput) result.stuck = Step::DeInit;
  if (rule->effect == Effect::TakesTheInput) runOutOfInput(subject, hit, &result);
  const bool takesOne = rule->effect == Effect::TakesTheInput && !result.stuck.has_value();
  if (takesOne || rule->effect == Effect::LosesAPicture) result.picturesLost = 1;
  addCreationLines(subject, hit, &result);
  return result;
}

// A message that does not come, at least not in time.
Expected missing(const Subject& subject, const Hit& hit) {
  Expected result;
  result.picturesLost.reset();
  if (emptyBufferDone()(hit.message)) {
    runOutOfInput(subject, hit, &result);
  } else if (!eventIs(OMX_EventBufferFlag)(hit.message)) {
    // A state's completion is waited for where it was asked for; a filled buffer, or the rest of a
    // reconfiguration, where the end of the output is.
    result.stuck = commandComplete(OMX_CommandStateSet)(hit.message) ? hit.step : Step::DeInit;
  }
  return result;
}

Expected doubled(const Subject& subject, const Hit& hit) {
  Expected result;
  if (emptyBufferDone()(hit.message)) {
    result.lines.emplace_back(
        "W OMXINTERFACE - We already own input buffer *, yet received an EMPTY_BUFFER_DONE.");
  }
  if (!subject.encoding && commandComplete(OMX_CommandPortDisable)(hit.message)) {
    // The port is enabled twice, and gets more buffers than it takes.
    result.results[Step::DeInit] = OMXI_ERR_ALLOCATE_MEMORY;
    result.lines.push_back(std::string("E ") + kNoBuffer);
    // The first enable may have completed before that is recorded, but the second is still under way.
    result.maybe = std::string("E ") + kNoFill;
  }
  return result;
}

// Nobody goes by the node of an event, and what is in a buffer that there is not is not looked at.
Expected forged(const Subject& subject, const Hit& hit) {
  if (fillBufferDone()(hit.message)) return missing(subject, hit);
  Expected result;
  if (emptyBufferDone()(hit.message)) {
    result.results[Step::DeInit] = OMXI_ERR_BUFFER_NOT_FOUND;
    result.lines.emplace_back("E OMXINTERFACE - Buffer not found in buffer vector.\n");
  }
  return result;
}

// What a call returns whose session is destroyed while it waits.
int endedResult(Step step, const Hit& hit) {
  if (step == Step::EndOfInput) return -2;
  const bool executing = commandComplete(OMX_CommandStateSet, OMX_StateExecuting)(hit.message);
  return step == Step::Init && executing ? OMXI_ERR_SET_EXECUTION_STATE : OMXI_ERR_SEND_COMMAND_STATE;
}

}  // namespace

void expectAnswered(const Subject& subject, const Fault& fault, const Outcome& outcome, LogLines log) {
  const std::optional<Hit>& hit = outcome.hit;
  ASSERT_EQ(hit.has_value(), fault.kind != Kind::None);
  Expected wanted;  // a delay changes nothing
  if (fault.kind == Kind::Refused) wanted = refused(subject, *hit);
  if (fault.kind == Kind::Doubled) wanted = doubled(subject, *hit);
  if (fault.kind == Kind::Forged) wanted = forged(subject, *hit);
  if (fault.kind == Kind::Late || fault.kind == Kind::Withheld) wanted = missing(subject, *hit);
  if (wanted.stuck.has_value() && fault.kind != Kind::Withheld) {
    wanted.results[*wanted.stuck] = endedResult(*wanted.stuck, *hit);
  }

  std::map<Step, int> results = outcome.results;
  const bool connected = !wanted.results.contains(Step::Create);
  const bool started = connected && !wanted.results.contains(Step::Init);
  EXPECT_EQ(results.contains(Step::Destroy), connected);
  EXPECT_TRUE(!started || wanted.stuck == Step::EndOfInput || results.contains(Step::DeInit));
  std::erase_if(results, [&](const auto& each) {
    // An encoder's feeder may be told of a failure already, or not yet.
    const auto recorded = wanted.results.find(Step::DeInit);
    const bool told = subject.encoding && each.first == Step::Feed && recorded != wanted.results.end() &&
                      each.second == recorded->second;
    return each.second == 0 || told;
  });
  EXPECT_EQ(results, wanted.results);
  EXPECT_FALSE(outcome.hung);
  EXPECT_EQ(outcome.stuck, wanted.stuck);
  if (wanted.results.empty() && wanted.picturesLost.has_value()) {
    EXPECT_EQ(outcome.pictures, (subject.encoding ? kFrames : 2 * kFrames) - *wanted.picturesLost);
  }

  // Lines of every life, as far as it got, and those that are wanted, are taken out of the log.
  const auto take = [&log](const std::string& line) {
    return std::erase_if(log, [&](const auto& each) { return fnmatch(line.c_str(), each.c_str(), 0) == 0; });
  };
  const std::string threadEnd = "W OMXINTERFACE - ===DataOutputThread over! ";
  EXPECT_EQ(take(threadEnd + (subject.encoding ? "enc*" : "dec*")), connected ? 1u : 0u);
  EXPECT_EQ(take("4/zol-video enter hardCodec encoder_create: build time:*"), subject.encoding ? 1u : 0u);
  take("E g_hwVersion::OMAP4\n");
  take("E Unknown Event (4, 1, 1)");                                                // the end mark's
  take("E OmxInterfaceDecoder::EventMonitorThread ! _queueThreadMessages==NULL*");  // an event thread cut
                                                                                    // short
  take("E OmxInterfaceDecoder::~OmxInterfaceDecoder semaphorePost*");
  for (const std::string& line : wanted.lines) EXPECT_EQ(take(line), 1u) << line;
  take(wanted.maybe);
  EXPECT_EQ(log, LogLines());
}

}  // namespace omxtest
