#include "tests/faults/expected.h"

#include <fnmatch.h>

#include <algorithm>

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
  const char* where;  // device, kind, step, call and which of its like, with the wildcards of fnmatch()
  int code;           // the step's result, of a reconfiguration that of the end
  std::string line;   // of the error log, with wildcards too; empty: silence
  Effect effect = Effect::None;
};

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

using enum Effect;

// clang-format off
// Indices: 2000001 is the port's definition; 6000001 the format, 6000004 the bitrate, 600000d the settings of
// AVC and 6000010 its level.
const Rule kRules[] = {
    // The way to the component.
    {"* create: listNodes*", 6, "OMXINTERFACE: CODEC NOT FOUND: OMX.*"},
    {"* create: allocateNode*", 4, "OMXINTERFACE - Could not allocate node: OMX.* -- error -2147483648"},

    // An encoder's settings end its creation.
    {"msm8960 encoder create: getParameter 2000001 port 1*, 2", 13, "OMXINTERFACE - BITRATE: ERROR getting port definition: -2147483648"},
    {"msm8960 encoder create: setParameter 2000001 port 1*, 2", 14, "OMXINTERFACE - BITRATE: ERROR setting port definition: -2147483648"},
    {"msm8960 encoder create: getParameter 2000001 *", 13, ""},
    {"msm8960 encoder create: setParameter 2000001 *", 14, kGeometry},
    {"msm8960 encoder create: getParameter 600000d port 1*", 34, "OMXINTERFACE - RATE CONTROL: ERROR getting avc parameters: -2147483648"},
    {"msm8960 encoder create: setParameter 600000d port 1*", 35, "OMXINTERFACE - RATE CONTROL: ERROR setting avc parameters: -2147483648"},
    {"msm8960 encoder create: getParameter 6000004 port 1*", 17, "OMXINTERFACE - RATE CONTROL: ERROR getting bitrate parameters: -2147483648"},
    {"msm8960 encoder create: setParameter 6000004 port 1*", 18, "OMXINTERFACE - RATE CONTROL: ERROR setting bitrate parameters: -2147483648"},
    {"omap4 encoder create: getParameter 6000001 port 0*", -1, "get OMX_IndexParamVideoPortFormat InPort Error:0x80000000. OMX_ErrorUnsupportedIndex=0x8000101a"},
    {"omap4 encoder create: ?etParameter 6000001 *", -1, kNoFormat},
    {"omap4 encoder create: ?etParameter 2000001 *", -1, kNoPort},
    {"omap4 encoder create: ?etParameter 600000d port 1*", -1, "[gs]et OMX_IndexParamVideoAvc failed : -2147483648"},
    {"omap4 encoder create: ?etParameter 6000010 port 1*", -1, "[gs]et OMX_IndexParamVideoProfileLevelCurrent failed : -2147483648"},
    {"omap4 encoder create: getParameter 6000004 port 1*", -1, "get OMX_IndexParamVideoBitrate failed : -2147483648"},
    {"omap4 encoder create: setParameter 6000004 port 1*", -1, ""},
    {"omap4 encoder create: storeMetaDataInBuffers*", -1, "Storing meta data in video buffers is not supported"},

    // A decoder can do without its settings, but not without its size.
    {"msm8960 decoder create: setParameter 7f000010 port 0*", 0, "OMXINTERFACE: Set Decode Order Failed: -2147483648"},
    {"omap4 decoder create: ?etParameter 6000001 port 1*", 0, kNoFormat},
    {"omap4 decoder create: setParameter 2000001 port 1*", 0, "=====set OMX_IndexParamPortDefinition OutPort Error:-2147483648"},
    {"omap4 decoder create: ?etParameter 2000001 *, 1", 0, kNoPort},
    {"* decoder create: getParameter 2000001 port 0*", 13, ""},
    {"* decoder create: setParameter 2000001 port 0*", 14, kGeometry},

    {"* encoder configure: setConfig *", 33, "===qoxtest setConfig Error *!"},
    {"* decoder configure: getParameter 2000001 port 0 size word 0*", -1, "OMXINTERFACE - Could not get parameters for Video Compression Format (-2147483648)"},
    {"* decoder configure: setParameter 2000001 *", -1, "OMXINTERFACE - Could not set Video Compression Format"},
    {"msm8960 decoder configure: setParameter 7f000002 port 0*", 31, "OMXINTERFACE - Could not set input frame packing format (-2147483648)"},
    {"* decoder configure: getParameter 2000001 *", -1, kNoPort},

    {"* init: sendCommand state 2*", 20, ""},
    {"* init: sendCommand state 3*", 21, ""},
    {"* init: getParameter 2000001 *", 13, kNoDefinition},
    {"msm8960 * init: useBuffer*", 15, kNoBuffer},
    {"* init: allocateBufferWithBackup*", 15, kNoBuffer},
    {"* init: fillBuffer*", 8, kNoFill},

    // Traffic goes on, and does so in both feeding steps.
    {"* encoder feed*: emptyBuffer*", -1, "OMXINTERFACE - SEND INPUT BUFFER::emptyBuffer failed w/ error 0x80000000 \n", TakesTheInput},
    {"* decoder feed*: emptyBuffer*", -2, kNoEmpty, TakesTheInput},
    {"* decoder feed*: getParameter 2000001 port 1*", 0, "", LosesAPicture},
    {"omap4 decoder feed*: getConfig 700000f port 1*", 0, "getConfig of OutputCrop: err=80000000", LosesAPicture},
    {"* feed*: fillBuffer*", 0, kNoFill},

    // A reconfiguration's failure is the session's, or leaves it draining.
    {"* reconfigure: sendCommand disable 1*", 0, "ERROR: PORT SETTING CHANGED - Unable to send command to disable port: error -2147483648\n", EndsTheOutput},
    {"* reconfigure: getParameter 2000001 port 1*, 1", 0, ""},
    {"* reconfigure: freeBuffer 1*", 0, "", EndsTheOutput},
    {"* reconfigure: sendCommand enable 1*", 20, "Unable to send command state enabling port: error -2147483648\n"},
    {"* reconfigure: getParameter 2000001 port 1*, 2", 13, kNoDefinition},
    {"* reconfigure: allocateBufferWithBackup*", 15, kNoBuffer},
    {"* reconfigure: fillBuffer*, 1", 0, kNoFill, EndsTheOutput},  // nor are the others filled
    {"* reconfigure: fillBuffer*", 0, kNoFill},

    {"* end of input: emptyBuffer*", -2, kNoEmpty, EndsTheOutput},
    {"* deInit: sendCommand state 2*", 20, "Error Sending Idle State: -2147483648\n"},
    {"* deInit: sendCommand state 1*", 20, "OMXINTERFACE - Error Sending Loaded State: -2147483648\n"},
    {"* deInit: freeBuffer*", 0, "", EndsTheOutput},
    {"* destroy: freeNode*", 0, ""},
};
// clang-format on

bool fits(const std::string& pattern, const std::string& text) {
  return fnmatch(pattern.c_str(), text.c_str(), 0) == 0;
}

// --- What any fault leads to ---

struct Expected {
  std::map<Step, int> results;             // those that are not 0
  std::optional<Step> stuck;               // waits for what the fault keeps back
  LogLines lines;                          // besides those of every life; with wildcards
  std::optional<size_t> picturesLost = 0;  // nothing: does not matter
};

// No session: the last line says so, and why in words.
void addCreationLines(const Subject& subject, const Hit& hit, Expected* result) {
  const auto code = result->results.find(Step::Create);
  if (code == result->results.end()) return;
  if (subject.encoding && !fits("*Node*", hit.what)) {
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
  const std::string where = std::string(subject.device) + (subject.encoding ? " encoder " : " decoder ") +
                            name(hit.step) + ": " + hit.what + ", " + std::to_string(hit.nth);
  const auto rule = std::find_if(std::begin(kRules), std::end(kRules),
                                 [&](const Rule& each) { return fits(each.where, where); });
  Expected result;
  if (rule == std::end(kRules)) {
    result.lines.emplace_back("no rule for " + where);
    return result;
  }
  // A failure of the event thread's comes out when the session is taken down.
  const Step step = hit.step == Step::Reconfigure ? Step::DeInit : hit.step;
  if (rule->code != 0) result.results[step] = rule->code;
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
  if (hit.what == "emptied") {
    runOutOfInput(subject, hit, &result);
  } else if (!fits("flag *", hit.what)) {
    // A state's completion is waited for where it was asked for; a filled buffer, or the rest of a
    // reconfiguration, where the end of the output is.
    result.stuck = fits("complete state *", hit.what) ? hit.step : Step::DeInit;
  }
  return result;
}

// Nobody goes by the node of an event, and what is in a buffer that there is not is not looked at.
Expected forged(const Subject& subject, const Hit& hit) {
  if (hit.what == "filled") return missing(subject, hit);
  Expected result;
  if (hit.what == "emptied") {
    result.results[Step::DeInit] = OMXI_ERR_BUFFER_NOT_FOUND;
    result.lines.emplace_back("E OMXINTERFACE - Buffer not found in buffer vector.\n");
  }
  return result;
}

// What a call returns whose session is destroyed while it waits.
int endedResult(Step step, const Hit& hit) {
  if (step == Step::EndOfInput) return -2;
  return hit.what == "complete state 3" ? OMXI_ERR_SET_EXECUTION_STATE : OMXI_ERR_SEND_COMMAND_STATE;
}

}  // namespace

void expectAnswered(const Subject& subject, const Fault& fault, const Outcome& outcome, LogLines log) {
  const std::optional<Hit>& hit = outcome.hit;
  ASSERT_EQ(hit.has_value(), fault.kind != Kind::None);
  Expected wanted;  // a delay changes nothing
  if (fault.kind == Kind::Refused) wanted = refused(subject, *hit);
  if (fault.kind == Kind::Forged) wanted = forged(subject, *hit);
  if (fault.kind == Kind::Late) wanted = missing(subject, *hit);
  if (wanted.stuck.has_value()) wanted.results[*wanted.stuck] = endedResult(*wanted.stuck, *hit);

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
  EXPECT_EQ(outcome.stuck, wanted.stuck);
  if (wanted.results.empty() && wanted.picturesLost.has_value()) {
    EXPECT_EQ(outcome.pictures, (subject.encoding ? kFrames : 2 * kFrames) - *wanted.picturesLost);
  }

  // Lines of every life, as far as it got, and those that are wanted, are taken out of the log.
  const auto take = [&log](const std::string& line) {
    return std::erase_if(log, [&](const std::string& each) { return fits(line, each); });
  };
  const std::string threadEnd = "W OMXINTERFACE - ===DataOutputThread over! ";
  EXPECT_EQ(take(threadEnd + (subject.encoding ? "enc*" : "dec*")), connected ? 1u : 0u);
  EXPECT_EQ(take("4/zol-video enter hardCodec encoder_create: build time:*"), subject.encoding ? 1u : 0u);
  take("E g_hwVersion::OMAP4\n");
  take("E Unknown Event (4, 1, 1)");  // the end mark's
  // An event thread cut short.
  take("E OmxInterfaceDecoder::EventMonitorThread ! _queueThreadMessages==NULL*");
  take("E OmxInterfaceDecoder::~OmxInterfaceDecoder semaphorePost*");
  for (const std::string& line : wanted.lines) EXPECT_EQ(take(line), 1u) << line;
  EXPECT_EQ(log, LogLines());
}

}  // namespace omxtest
