#include "tests/core/session_fixture.h"

#include <string.h>

#include <algorithm>
#include <map>

#include <android/log.h>
#include <utils/String8.h>

namespace omxtest {

namespace {

using android::String8;

bool makesABuffer(const Call& call) {
  return call.method >= Method::UseBuffer && call.method <= Method::AllocateBufferWithBackup;
}

}  // namespace

std::string describe(const Call& call, const std::string& buffer) {
  static constexpr const char* kCommands[] = {"state", "flush", "disable", "enable", "mark"};
  const Method method = call.method;
  const std::string what = name(method);
  if (method == Method::AllocateNode) return what + " " + call.text;
  if (method == Method::SendCommand) {
    return what + String8::format(" %s %d", kCommands[call.command], call.param).string();
  }
  if (method >= Method::GetParameter && method <= Method::SetConfig) {
    // The record's port, and what is unusual about its size and version.
    const Words record = words(call.record);
    std::string text =
        what + String8::format(" %x port %u", static_cast<unsigned>(call.index), record.at(2)).string();
    if (record[0] != call.size) text += " size word " + std::to_string(record[0]);
    if (record[1] != kVersion) text += " version " + std::to_string(record[1]);
    return text;
  }
  if (makesABuffer(call)) return what + " " + buffer + " of " + std::to_string(call.size);
  if (method == Method::FreeBuffer) return what + " " + std::to_string(call.port) + " " + buffer;
  if (method == Method::FillBuffer) return what + " " + buffer;
  if (method != Method::EmptyBuffer) return what;
  return what + String8::format(" %s %u+%u flags 0x%x time %lld", buffer.c_str(), call.offset, call.length,
                                call.flags, static_cast<long long>(call.timestamp))
                    .string();
}

LogLines logLines(const omxhost::LogCapture& capture) {
  LogLines lines;
  for (const omxhost::LogLine& line : capture.lines()) {
    std::string text = std::to_string(line.priority);
    if (line.priority == ANDROID_LOG_ERROR) text = "E";
    if (line.priority == ANDROID_LOG_WARN) text = "W";
    lines.push_back(text + (line.tag.empty() ? " " : "/" + line.tag + " ") + line.text);
  }
  return lines;
}

webrtc::VideoCodec settings() {
  webrtc::VideoCodec codec = {};
  codec.codecType = webrtc::kVideoCodecH264;
  codec.width = 176;
  codec.height = 144;
  codec.startBitrate = 500;
  codec.maxFramerate = 30;
  codec.codecSpecific.H264.profile = 77;
  codec.codecSpecific.H264.keyFrameInterval = 60;
  codec.codecSpecific.H264.referenceFrames = 2;
  codec.codecSpecific.H264.entropyCoding = 1;
  codec.codecSpecific.H264.transform8x8 = 1;
  return codec;
}

Trace SessionTest::trace(size_t from) {
  Trace lines;
  std::map<void*, std::string> names;
  size_t made[2] = {0, 0};
  for (const Call& call : omx().calls()) {
    if (call.method == Method::AllocateNode) made[0] = made[1] = 0;
    if (makesABuffer(call)) {
      names[call.buffer] = (call.port == 0 ? "in" : "out") + std::to_string(made[call.port]++);
    }
    lines.push_back(describe(call, names[call.buffer]) + (call.status != android::OK ? " failed" : ""));
  }
  lines.erase(lines.begin(), lines.begin() + static_cast<ptrdiff_t>(std::min(from, lines.size())));
  return lines;
}

SessionTest::~SessionTest() {
  for (Gate& gate : _gates) gate.open();
  if (_session != nullptr) destroy();
}

int SessionTest::createEncoder(webrtc::VideoCodec codec) {
  if (_session != nullptr) destroy();
  omx().clearCalls();
  _log.clear();
  OmxInterfaceEncoder* created = nullptr;
  const int result = OmxInterfaceEncoder::Create(&created, &codec);
  _session.reset(created);
  if (created != nullptr) _application.attach(*created);
  return result;
}

int SessionTest::createDecoder() {
  _decoding = true;
  OmxInterfaceDecoder* created = nullptr;
  const int result = OmxInterfaceDecoder::Create(&created, "nobody looks at it");
  _session.reset(created);
  if (created != nullptr) _application.attach(*created);
  _application.onOutput([](const Output&) { return 1; });  // of no effect: nobody keeps a decoder's buffer
  return result;
}

void SessionTest::start() {
  ASSERT_EQ(createEncoder(), OMXI_OK);
  ASSERT_EQ(init(), OMXI_OK);
}

std::vector<Call> SessionTest::settingCalls() {
  std::vector<Call> calls = omx().calls();
  std::erase_if(calls, [](const Call& call) {
    return call.method < Method::GetParameter || call.method > Method::StoreMetaDataInBuffers;
  });
  return calls;
}

void SessionTest::endOfStream(int timestamp) {
  ASSERT_EQ(beginEndOfInput(timestamp).result(), 0);
  requireEventually([this]() -> bool { return _session->_endOfOutputReached; }, "the end of output");
}

Later SessionTest::beginDestroy() {
  return {"destruction", [session = _session.release()] { return delete session, 0; }};
}

int SessionTest::feed(const std::string& text, int timestamp) {
  std::string bytes = text;
  return _session->sendInputData(bytes.data(), static_cast<unsigned int>(bytes.size()), timestamp);
}

void SessionTest::feedThrough(const std::string& text, int timestamp) {
  const size_t before = _application.outputs().size();
  ASSERT_EQ(feed(text, timestamp), 0);
  _application.waitForOutputs(before + 1);
}

size_t SessionTest::busyCount(int port) const {
  const SessionState::Lock held(_session->_state->lock);
  const auto& records = _session->_portBuffers[port];
  return static_cast<size_t>(std::count_if(records.begin(), records.end(),
                                           [](const BufferInfo& record) -> bool { return record.busy; }));
}

}  // namespace omxtest
