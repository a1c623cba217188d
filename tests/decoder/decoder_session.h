// The session fixture with a decoder in it: made by Create() on a posed device, its pictures collected with
// their descriptions, and ways to know that the event thread has done its work.
#pragma once

#include <algorithm>
#include <mutex>
#include <vector>

#include <media/IOMX.h>

#include "decoder/omx_interface_decoder.h"
#include "tests/core/session_fixture.h"

namespace omxtest {

// How a decoder takes the event that comes with the end of output.
inline constexpr const char* kEndEvent = "E Unknown Event (4, 1, 1)";

// A picture as the application got it; the description is of the time of the callback.
struct Picture {
  Output output;
  DECODEDDATAINFO info;
};

class DecoderSessionTest : public SessionTest {
 protected:
  static constexpr size_t kInputBuffers = 4;  // of the scripted decoder
  static constexpr size_t kOutputBuffers = 8;

  explicit DecoderSessionTest(const char* device = "msm8960") : SessionTest(device) { _kind = Kind::Decoder; }
  ~DecoderSessionTest() override;

  void create(const char* componentName = nullptr);
  // ... and brings it to Executing, until nothing goes on any more.
  void startDecoder();
  OmxInterfaceDecoder& decoder() { return static_cast<OmxInterfaceDecoder&>(*_session); }

  // endOfStream(), until its event has been handled too.
  void finishStream(int timestamp = 0);
  // The end of a stream comes out of a component that goes on executing.
  void endOfOutput();

  // Sends an event of the test's making, and waits until the event thread has handled it.
  void handleEvent(OMX_EVENTTYPE event, OMX_U32 data1, OMX_U32 data2);
  // Until the event thread has nothing to do, or has ended.
  void waitForEvents();
  void waitForEndOfEventThread();
  // Also waits until the picture is among pictures(): the application counts an output before it handles it.
  void feedThrough(const std::string& text, int timestamp = 0);
  // New settings, told by the test at the moment of its choice, and the session's answer: the command to
  // disable the port has gone out.
  void announceAndDisable() {
    deliverEvent(OMX_EventPortSettingsChanged, kOmxOutputPort, 0);
    requireEventually([this] { return !commands().empty() && commands().back() == "sendCommand disable 1"; },
                      "the disable");
  }
  Trace commands() {
    Trace lines = trace();
    std::erase_if(lines, [](const std::string& line) { return line.find("sendCommand") != 0; });
    return lines;
  }
  size_t freed() { return omx().count(Method::FreeBuffer); }
  void waitForPictures(size_t count);
  std::vector<Picture> pictures() const;
  // What the application's output callback answers.
  void answerOutputs(int result);
  // The log without regard to its order: lines of different threads.
  LogLines sortedLog() const { return sorted(log()); }
  static LogLines sorted(LogLines lines);

 private:
  mutable std::mutex _pictureMutex;
  std::vector<Picture> _pictures;
  int _answer = 0;
};

}  // namespace omxtest
