#include "tests/faults/expected.h"

#include <algorithm>
#include <sstream>

#include <utils/String8.h>

#include "omxbridge/omxbridge.h"

namespace omxtest {

namespace {

std::string replaced(std::string text, const std::string& what, const std::string& by) {
  for (size_t at = 0; (at = text.find(what, at)) != text.npos; at += by.size())
    text.replace(at, what.size(), by);
  return text;
}

// A rule's line, with what it says of the call filled in.
std::string filledIn(std::string line, const Subject& subject, const Hit& hit, OMX_U32 port, size_t buffer) {
  const std::pair<const char*, std::string> values[] = {
      {"$status", "-2147483648"},
      {"$hex", "80000000"},
      {"$index", android::String8::format("%x", static_cast<unsigned int>(hit.call.index)).string()},
      {"$name", subject.component()},
      {"$port", std::to_string(port)},
      {"$buffer", std::to_string(buffer)},
      {"$get", hit.call.method == Method::SetParameter ? "set" : "get"},
      {"$side", port == 0 ? "In" : "Out"}};
  for (const auto& [what, by] : values) line = replaced(line, what, by);
  return line;
}

// No session: the last line says so, and why in words.
void addCreationLines(const Subject& subject, const Hit& hit, Expected* result) {
  const auto code = result->results.find(Step::Create);
  if (code == result->results.end()) return;
  const bool configuring =
      hit.call.method >= Method::GetParameter && hit.call.method <= Method::StoreMetaDataInBuffers;
  if (subject.encoding && configuring) {
    result->lines.emplace_back("E OMXINTERFACE - [ENC] Init: failed to setup params!");
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
  if (hit.nth < Life::kFrames) result->results.try_emplace(hit.step, -1);
  if (hit.step == Step::Feed) result->results[Step::FeedMore] = -1;
}

// Where a failure comes out: one of the event thread's when the session is taken down.
Step resultStep(const Hit& hit) {
  return hit.step == Step::Reconfigure ? Step::DeInit : hit.step;
}

Expected refusedCall(const Subject& subject, const Hit& hit) {
  Expected result;
  const Rule* const rule = findRule(subject, hit);
  if (rule == nullptr) {
    result.lines.emplace_back("no rule for this call");
    return result;
  }
  if (rule->code != 0) result.results[resultStep(hit)] = codeOf(*rule, hit.call);
  if (!rule->line.empty()) {
    result.lines.push_back("E " + filledIn(rule->line, subject, hit, hit.port, hit.nth - 1));
  }
  if (rule->effect == Effect::LosesAPicture) result.picturesLost = 1;
  if (rule->effect == Effect::EndsTheOutput) result.stuck = Step::DeInit;
  if (rule->effect == Effect::TakesTheInput) runOutOfInput(subject, hit, &result);
  if (rule->effect == Effect::TakesTheInput && !result.stuck.has_value()) result.picturesLost = 1;
  addCreationLines(subject, hit, &result);
  return result;
}

Expected refusedMemory(const Subject& subject, const Hit& hit) {
  Expected result;
  const bool input = hit.step == Step::Init && hit.nth <= subject.inputs();
  const size_t before = hit.step == Step::Init && !input ? subject.inputs() : 0;
  result.results[resultStep(hit)] = OMXI_ERR_ALLOCATE_MEMORY;
  result.lines.push_back(
      filledIn("E OMXINTERFACE - Memory dealer allocation failed for port $port buffer $buffer\n", subject,
               hit, input ? 0 : 1, hit.nth - 1 - before));
  return result;
}

// Those of the media server are made with the node.
Expected refusedThread(const Subject& subject, const Hit& hit) {
  Expected result;
  if (hit.step == Step::Create) {
    result.results[Step::Create] = OMXI_ERR_ALLOCATE_COMPONENT;
    result.lines.push_back(
        filledIn("E OMXINTERFACE - Could not allocate node: $name -- error $status", subject, hit, 0, 0));
    addCreationLines(subject, hit, &result);
  } else {
    const bool event = !subject.encoding && hit.nth == 1;
    result.results[hit.step] = event ? OMXI_ERR_CREATE_EVENT_THREAD : OMXI_ERR_CREATE_OUTPUT_THREAD;
  }
  return result;
}

// A message that does not come, at least not in time.
Expected missing(const Subject& subject, const Fault& fault, const Hit& hit) {
  Expected result;
  result.picturesLost.reset();
  if (emptyBufferDone()(hit.message)) {
    runOutOfInput(subject, hit, &result);
  } else if (eventIs(OMX_EventBufferFlag)(hit.message)) {
    result.endMarkEvents = 0;
  } else {
    // A state's completion is waited for where it was asked for; a filled buffer, or the rest of a
    // reconfiguration, where the end of the output is.
    result.stuck = commandComplete(OMX_CommandStateSet)(hit.message) ? hit.step : Step::DeInit;
  }
  if (fault.kind == Kind::Withheld) result.endMarkEvents = 1;
  return result;
}

Expected doubled(const Subject& subject, const Hit& hit) {
  Expected result;
  if (emptyBufferDone()(hit.message)) {
    result.lines.emplace_back(
        android::String8::format("W OMXINTERFACE - We already own input buffer %p, yet received an "
                                 "EMPTY_BUFFER_DONE.",
                                 hit.message.u.buffer_data.buffer)
            .string());
  }
  if (eventIs(OMX_EventBufferFlag)(hit.message)) result.endMarkEvents = 2;
  if (!subject.encoding && commandComplete(OMX_CommandPortDisable)(hit.message)) {
    // The port is enabled twice, and gets more buffers than it takes.
    result.results[Step::DeInit] = OMXI_ERR_ALLOCATE_MEMORY;
    result.lines.push_back(filledIn("E " + std::string(kNoBuffer), subject, hit, 1, 0));
    // The first enable may have completed before that is recorded, but the second is still under way.
    result.maybe = filledIn("E " + std::string(kNoFill), subject, hit, 1, 0);
  }
  return result;
}

// Nobody goes by the node of an event, and what is in a buffer that there is not is not looked at.
Expected forged(const Subject& subject, const Fault& fault, const Hit& hit) {
  if (fillBufferDone()(hit.message)) return missing(subject, fault, hit);
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

std::string inWords(const std::map<Step, int>& results) {
  std::string text;
  for (const auto& [step, result] : results)
    text += std::string(" ") + name(step) + " " + std::to_string(result);
  return text.empty() ? " all 0" : text;
}

// Takes lines that begin so out of the log; how many there were.
size_t take(LogLines* log, const std::string& begin) {
  return std::erase_if(*log, [&](const std::string& line) { return line.starts_with(begin); });
}

}  // namespace

Expected expected(const Subject& subject, const Fault& fault, const Hit& hit) {
  if (fault.kind == Kind::Refused) {
    if (fault.place == Place::Memory) return refusedMemory(subject, hit);
    return fault.place == Place::Thread ? refusedThread(subject, hit) : refusedCall(subject, hit);
  }
  if (fault.kind == Kind::Doubled) return doubled(subject, hit);
  if (fault.kind == Kind::Forged) return forged(subject, fault, hit);
  return fault.kind == Kind::Delayed ? Expected() : missing(subject, fault, hit);  // a delay changes nothing
}

std::string differences(const Subject& subject, const Fault& fault, const std::optional<Hit>& hit,
                        const Outcome& outcome, const LogLines& log) {
  if (fault.kind != Kind::None && !hit.has_value()) return "the fault did not happen\n";
  Expected wanted = hit.has_value() ? expected(subject, fault, *hit) : Expected();
  const bool asUsual = wanted.results.empty() && !wanted.stuck.has_value();
  if (wanted.stuck.has_value() && fault.kind != Kind::Withheld) {
    wanted.results[*wanted.stuck] = endedResult(*wanted.stuck, *hit);
  }
  std::ostringstream text;
  const auto compare = [&text](const char* what, const auto& is, const auto& should) {
    if (is != should) text << what << ": " << is << " instead of " << should << "\n";
  };

  std::map<Step, int> results = outcome.results;
  const bool connected = !wanted.results.contains(Step::Create);
  const bool started = connected && !wanted.results.contains(Step::Init);
  const bool ended = !started || wanted.stuck == Step::EndOfInput || results.contains(Step::DeInit);
  compare("destroyed", results.contains(Step::Destroy), connected);
  compare("taken down, if started", ended, true);
  std::erase_if(results, [&](const auto& each) {
    // An encoder's feeder may be told of a failure already, or not yet.
    const auto recorded = wanted.results.find(Step::DeInit);
    const bool told = subject.encoding && each.first == Step::Feed && recorded != wanted.results.end() &&
                      each.second == recorded->second;
    return each.second == 0 || told;
  });
  compare("results", inWords(results), inWords(wanted.results));
  if (!outcome.hang.empty()) text << "HANG: " << outcome.hang << " has what it needs and waits on\n";
  if (outcome.stuck != wanted.stuck) {
    if (outcome.stuck.has_value()) text << "HANG: " << name(*outcome.stuck) << " waits for nothing\n";
    if (wanted.stuck.has_value()) text << name(*wanted.stuck) << " does not wait\n";
  }
  if (wanted.results.empty() && wanted.picturesLost.has_value()) {
    const size_t all = subject.encoding ? Life::kFrames : 2 * Life::kFrames;
    compare("pictures", outcome.pictures, all - *wanted.picturesLost);
  }

  // Lines of every life, as far as it got.
  LogLines lines = log;
  const int result = outcome.results.contains(Step::Init) ? outcome.results.at(Step::Init) : -1;
  const bool threaded =
      connected && result != OMXI_ERR_CREATE_EVENT_THREAD && result != OMXI_ERR_CREATE_OUTPUT_THREAD;
  compare("ends of the output thread",
          take(&lines, std::string("W OMXINTERFACE - ===DataOutputThread over! ") +
                           (subject.encoding ? "enc" : "dec")),
          threaded ? 1u : 0u);
  compare("lines on creation", take(&lines, "4/zol-video enter hardCodec encoder_create: build time:"),
          subject.encoding ? 1u : 0u);
  take(&lines, "E g_hwVersion::OMAP4\n");
  const size_t endMarks = take(&lines, "E Unknown Event (4, 1, 1)");
  const size_t cutShort =
      take(&lines, "E OmxInterfaceDecoder::EventMonitorThread ! _queueThreadMessages==NULL") +
      take(&lines, "E OmxInterfaceDecoder::~OmxInterfaceDecoder semaphorePost");
  if (asUsual) {
    compare("end marks", endMarks, subject.encoding ? 0u : static_cast<size_t>(wanted.endMarkEvents));
    compare("event threads cut short", cutShort, 0u);
  }
  if (!wanted.maybe.empty()) take(&lines, wanted.maybe);
  const auto joined = [](LogLines all) {
    std::sort(all.begin(), all.end());
    std::string together;
    for (const std::string& line : all) together += "\n    " + line;
    return together;
  };
  compare("lines", joined(lines), joined(wanted.lines));
  return text.str();
}

}  // namespace omxtest
