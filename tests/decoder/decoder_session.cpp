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
    return _answer;
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

void DecoderSessionTest::finishStream(int timestamp) {
  const size_t before = messages().deliveredCount(eventIs(OMX_EventBufferFlag));
  ASSERT_NO_FATAL_FAILURE(endOfStream(timestamp));
  require(messages().waitForDelivered(eventIs(OMX_EventBufferFlag), before + 1), "the end mark's event");
  waitForEvents();
}

void DecoderSessionTest::endOfOutput() {
  componentProduces("", 0, OMX_BUFFERFLAG_EOS);
  requireEventually([this]() -> bool { return _session->_endOfOutputReached; }, "the end of output");
}

void DecoderSessionTest::waitForEndOfEventThread() {
  requireUnderLock([](SessionState& state) { return !state.eventThread.running; }, "the event thread's end");
}

void DecoderSessionTest::handleEvent(OMX_EVENTTYPE event, OMX_U32 data1, OMX_U32 data2) {
  deliverEvent(event, data1, data2);
  waitForEvents();
}

void DecoderSessionTest::waitForEvents() {
  const auto idle = [this] {
    const SessionState::Lock held(_session->_state->lock);
    if (!_session->_state->eventThread.running) return true;
    SimpleQueue& queue = *decoder()._queueThreadMessages;
    queue.lock();
    const bool empty = queue.isEmpty();
    queue.unlock();
    return empty && !_session->_state->handlingEvent;
  };
  requireEventually(idle, "the end of the event thread's work");
}

void DecoderSessionTest::feedThrough(const std::string& text, int timestamp) {
  const size_t before = pictures().size();
  ASSERT_NO_FATAL_FAILURE(SessionTest::feedThrough(text, timestamp));
  waitForPictures(before + 1);
}

void DecoderSessionTest::waitForPictures(size_t count) {
  requireEventually([&] { return pictures().size() >= count; }, "a picture");
}

std::vector<Picture> DecoderSessionTest::pictures() const {
  const std::lock_guard<std::mutex> lock(_pictureMutex);
  return _pictures;
}

void DecoderSessionTest::answerOutputs(int result) {
  const std::lock_guard<std::mutex> lock(_pictureMutex);
  _answer = result;
}

LogLines DecoderSessionTest::sorted(LogLines lines) {
  std::sort(lines.begin(), lines.end());
  return lines;
}

}  // namespace omxtest
