// The session fixture with a decoder in it: made by Create() on a posed device, its pictures collected with
// their descriptions, and ways to know that the event thread has done its work.
#pragma once

#include <algorithm>
#include <mutex>
#include <vector>

#include "decoder/omx_interface_decoder.h"
#include "tests/core/session_fixture.h"

namespace omxtest {

// A picture as the application got it; the description is of the time of the callback.
struct Picture {
  Output output;
  DECODEDDATAINFO info;
};

class DecoderSessionTest : public SessionTest {
 protected:
  static constexpr size_t kInputBuffers = 4;  // of the scripted decoder
  static constexpr size_t kOutputBuffers = 8;

  explicit DecoderSessionTest(const char* device = "msm8960") : SessionTest(device) { _decoding = true; }
  ~DecoderSessionTest() override;

  void create(const char* componentName = nullptr);
  // ... and brings it to Executing, until nothing goes on any more.
  void startDecoder();
  OmxInterfaceDecoder& decoder() { return static_cast<OmxInterfaceDecoder&>(*_session); }

  // The end of a stream comes out of a component that goes on executing.
  void endOfOutput();
  // Sends an event of the test's making, and waits until the event thread has handled it.
  void handleEvent(OMX_EVENTTYPE event, OMX_U32 data1, OMX_U32 data2);
  // Until the event thread has nothing to do, or has ended.
  void waitForEvents();
  void waitForEndOfEventThread() {
    requireUnderLock([](SessionState& state) { return !state.eventThread.running; },
                     "the event thread's end");
  }
  // Also waits until the picture is among pictures(): the application counts an output before it handles
  // it.
  void feedThrough(const std::string& text, int timestamp = 0);
  // New settings, told by the test at the moment of its choice, and the session's answer: the command to
  // disable the port has gone out.
  void announceAndDisable();
  Trace commands();
  size_t freed() { return omx().count(Method::FreeBuffer); }
  std::vector<Picture> pictures() const {
    const std::lock_guard<std::mutex> lock(_pictureMutex);
    return _pictures;
  }
  // The log without regard to its order: lines of different threads.
  LogLines sortedLog() const { return sorted(log()); }
  static LogLines sorted(LogLines lines) {
    std::sort(lines.begin(), lines.end());
    return lines;
  }

 private:
  mutable std::mutex _pictureMutex;
  std::vector<Picture> _pictures;
};

}  // namespace omxtest
