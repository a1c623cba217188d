#include "tests/decoder/decoder_session.h"

namespace omxtest {

// Here already: the session's threads deliver into what is gone in the base's destructor.
DecoderSessionTest::~DecoderSessionTest() {
  for (Gate& gate : _gates) gate.open();
  if (_session != nullptr) destroy();
}

void DecoderSessionTest::create(const char* componentName) {
  OmxInterfaceDecoder* created = nullptr;
  ASSERT_EQ(OmxInterfaceDecoder::Create(&created, componentName), OMXI_OK);
  _session.reset(created);
  _application.attach(*_session);
  _application.onOutput([this](const Output& output) {
    const std::lock_guard<std::mutex> lock(_pictureMutex);
    _pictures.push_back({output, *static_cast<const DECODEDDATAINFO*>(output.first)});
    return 1;  // of no effect: a decoder lets nobody keep a buffer
  });
}

void DecoderSessionTest::startDecoder() {
  const Match executing = commandComplete(OMX_CommandStateSet, OMX_StateExecuting);
  const size_t before = messages().deliveredCount(executing);
  ASSERT_NO_FATAL_FAILURE(create());
  ASSERT_EQ(init(), OMXI_OK);
  // init() comes back in the middle of that message.
  require(messages().waitForDelivered(executing, before + 1), "the delivery of Executing");
  waitForEvents();
}

void DecoderSessionTest::endOfOutput() {
  componentProduces("", 0, OMX_BUFFERFLAG_EOS);
  requireEventually([this]() -> bool { return _session->_endOfOutputReached; }, "the end of output");
}

void DecoderSessionTest::handleEvent(OMX_EVENTTYPE event, OMX_U32 data1, OMX_U32 data2) {
  deliverEvent(event, data1, data2);
  waitForEvents();
}

void DecoderSessionTest::waitForEvents() {
  requireUnderLock(
      [this](SessionState& state) {
        if (!state.eventThread.running) return true;
        SimpleQueue& queue = *decoder()._queueThreadMessages;
        queue.lock();
        const bool empty = queue.isEmpty();
        queue.unlock();
        return empty && !state.handlingEvent;
      },
      "the end of the event thread's work");
}

void DecoderSessionTest::feedThrough(const std::string& text, int timestamp) {
  const size_t before = pictures().size();
  ASSERT_EQ(feed(text, timestamp), 0);
  requireEventually([&] { return pictures().size() > before; }, "a picture");
}

void DecoderSessionTest::announceAndDisable() {
  deliverEvent(OMX_EventPortSettingsChanged, kOmxOutputPort, 0);
  requireEventually([this] { return !commands().empty() && commands().back() == "sendCommand disable 1"; },
                    "the disable");
}

Trace DecoderSessionTest::commands() {
  Trace lines = trace();
  std::erase_if(lines, [](const std::string& line) { return line.find("sendCommand") != 0; });
  return lines;
}

}  // namespace omxtest
