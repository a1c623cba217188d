// Moments at which threads of a session meet, each brought about on purpose.
#include <atomic>
#include <thread>

#include "tests/core/session_fixture.h"

namespace omxtest {
namespace {

using InterleavingTest = SessionTest;

TEST_F(InterleavingTest, NobodyFindsARecordOfAPortThatIsBeingFreed) {
  // Whoever used a record on its way out would use freed memory, or hand the component a buffer that is gone.
  start();
  void* const output = bufferId(1, 0);
  void* handle = nullptr;
  void* data = nullptr;
  ASSERT_EQ(_session->reserveInputBuffer(&handle, &data), 0);
  ASSERT_EQ(_session->sendInputBuffer(handle, 0, 0), 0);
  endOfStream();
  const size_t fills = omx().count(Method::FillBuffer);
  const size_t empties = omx().count(Method::EmptyBuffer);
  omx().before(Method::FreeBuffer, [&](const Call&) {
    _session->returnIomxOutputBuffer(output);
    deliver(makeFillBufferDone(output, 1, OMX_BUFFERFLAG_EOS));
    EXPECT_EQ(_session->fillOutputBuffers(), OMXI_OK);
    if (omx().count(Method::FreeBuffer) < kOutputs) return;
    EXPECT_EQ(_session->sendInputBuffer(handle, 1, 0), -1);
    _session->releaseInputBuffer(handle);
  });
  EXPECT_EQ(deInit(), OMXI_OK);
  EXPECT_EQ(omx().count(Method::FillBuffer), fills);
  EXPECT_EQ(omx().count(Method::EmptyBuffer), empties);
}

TEST_F(InterleavingTest, ABufferGivenBackInsideItsCallbackGoesBackOnceAndHasBeenReadBefore) {
  // A second fillBuffer would send the component a buffer that it has; and with the buffer the record's end
  // mark is cleared: looked at afterwards it would be gone, and the stream would never end.
  start();
  _application.onOutput([this](const Output& output) {
    _session->returnIomxOutputBuffer(output.bufferId);
    return 0;
  });
  for (const char* text : {"a", "b", "c"}) feedThrough(text);
  componentProduces("the end", 0, OMX_BUFFERFLAG_EOS);
  EXPECT_EQ(deInit(), OMXI_OK);
  EXPECT_EQ(omx().count(Method::FillBuffer), kOutputs + 4);
}

TEST_F(InterleavingTest, AnOutputCallbackMayWaitForAnInputBuffer) {
  // If queueing the second picture had to wait for the callback's end, neither would ever come.
  start();
  holdInputAllBut(0);
  Gate& returned = newGate();
  std::atomic<int> fed{-9};
  _application.onInput([&] { returned.open(); });
  _application.onOutput([&](const Output& output) {
    if (output.bytes == "first") {
      returned.pass();
      fed = feed("from the callback");
    }
    return 0;
  });
  componentProduces("first");
  returned.waitForArrival();
  componentProduces("second");
  require(messages().waitForDelivered(fillBufferDone(), 2), "a filled buffer during a callback");
  script().releaseInput(1);
  _application.waitForOutputs(2);
  EXPECT_EQ(fed, 0);
}

TEST_F(InterleavingTest, ACallbackGetsTheContextItWasRegisteredWith) {
  // Replaced while buffers come: a callback that got the other's context would take it for its own.
  start();
  std::atomic<bool> over{false};
  std::thread registrar([&] {
    while (!over) {
      _session->registerInputCallback(
          [](void*, void* context) {
            EXPECT_EQ(context, nullptr);
            return 0;
          },
          nullptr);
      _application.attach(*_session);
    }
  });
  for (int i = 0; i < 300; ++i) static_cast<void>(feed("i"));
  over = true;
  registrar.join();
}

TEST_F(InterleavingTest, PicturesInFlightComeFirstAndThenTheEnd) {
  // A component that owes more pictures than it has buffers keeps its end mark for ever.
  start();
  script().holdOutput();
  for (size_t i = 0; i < kOutputs + 1; ++i) {
    requireEventually([this] { return busyCount(0) < kInputs; }, "a free input buffer");
    ASSERT_EQ(feed("owed"), 0);
  }
  ASSERT_EQ(beginEndOfInput().result(), 0);
  Later<int> ending = beginDeInit();
  waitForSleeper(&SessionState::endOfOutputWaiters);
  script().passOutput();
  _application.waitForOutputs(kOutputs);
  waitForBusy(1, 0);
  requireEventually([this] { return script().waiting() > 0; }, "the picture that has no buffer");
  EXPECT_FALSE(_session->_endOfOutputReached);
  // A failure ends the wait, although deInit() has looked for one before.
  _session->setThreadError(OMXI_ERR_APPLICATION);
  EXPECT_EQ(ending.result(), OMXI_ERR_APPLICATION);
}

}  // namespace
}  // namespace omxtest
