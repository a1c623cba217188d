// Moments at which threads of a session meet, each brought about on purpose.
#include <atomic>
#include <thread>

#include "tests/core/session_fixture.h"

namespace omxtest {
namespace {

using InterleavingTest = SessionTest;

TEST_F(InterleavingTest, AFailureWakesADeInitThatHasLookedForOneBefore) {
  // deInit() has found no failure and sleeps until the end of output. The stream that failed now never
  // ends: without a wake-up deInit() would not either.
  start();
  Later<int> ending = beginDeInit();
  waitForSleeper(&SessionState::endOfOutputWaiters);
  deliver(makeEmptyBufferDone(this));
  EXPECT_EQ(ending.result(), OMXI_ERR_BUFFER_NOT_FOUND);
}

TEST_F(InterleavingTest, NobodyFindsARecordOfAPortThatIsBeingFreed) {
  // While deInit() frees a port, record by record, the application gives buffers back and feeds and the
  // server sends messages again. Whoever used a record that is going would use freed memory, or hand the
  // component a buffer that it does not know any more.
  start();
  std::vector<void*> inputs;
  std::vector<void*> outputs;
  for (size_t i = 0; i < kInputs; ++i) inputs.push_back(bufferId(0, i));
  for (size_t i = 0; i < kOutputs; ++i) outputs.push_back(bufferId(1, i));
  void* handle = nullptr;
  void* data = nullptr;
  ASSERT_EQ(_session->reserveInputBuffer(&handle, &data), 0);
  ASSERT_EQ(_session->sendInputBuffer(handle, 0, 0), 0);
  endOfStream();
  const size_t fills = omx().count(Method::FillBuffer);
  const size_t empties = omx().count(Method::EmptyBuffer);
  size_t freed = 0;
  omx().before(Method::FreeBuffer, [&](const Call& call) {
    if (call.port == 1) {
      for (void* id : outputs) {
        _session->returnIomxOutputBuffer(id);
        deliver(makeFillBufferDone(id, 1, OMX_BUFFERFLAG_EOS));
      }
      EXPECT_EQ(_session->fillOutputBuffers(), OMXI_OK);
    } else {
      EXPECT_EQ(_session->sendInputBuffer(handle, 1, 0), -1);
      EXPECT_EQ(_session->sendFinalBuffer(handle, 0), -1);
      _session->releaseInputBuffer(handle);
      for (size_t i = 0; i < kInputs - freed; ++i) deliver(makeEmptyBufferDone(inputs[i]));
      ++freed;
    }
  });
  EXPECT_EQ(deInit(), OMXI_OK);
  EXPECT_EQ(freed, kInputs);
  EXPECT_EQ(omx().count(Method::FillBuffer), fills);
  EXPECT_EQ(omx().count(Method::EmptyBuffer), empties);
}

TEST_F(InterleavingTest, ABufferGivenBackInsideItsCallbackGoesBackOnceAndHasBeenReadBefore) {
  // The callback returned the buffer itself and then says that the session may have it: a second fillBuffer
  // would send the component a buffer that it has. And with the buffer the record's end mark is cleared:
  // looked at afterwards it would be gone, and the stream would never end.
  start();
  _application.onOutput([this](const Output& output) {
    _session->returnIomxOutputBuffer(output.bufferId);
    return 0;
  });
  for (const char* text : {"a", "b", "c"}) feedThrough(text);
  componentProduces("the end", 0, OMX_BUFFERFLAG_EOS);
  EXPECT_EQ(deInit(), OMXI_OK);
  EXPECT_EQ(omx().count(Method::FillBuffer), kOutputs + 4);
  EXPECT_EQ(_application.outputTexts(), (std::vector<std::string>{"a", "b", "c", "the end"}));
  EXPECT_EQ(log(), LogLines{kEncoderOver});
}

TEST_F(InterleavingTest, AnOutputCallbackMayWaitForAnInputBuffer) {
  // The callback waits for the input callback, which comes behind another filled buffer. If queueing that
  // one had to wait for the callback's end, neither would ever come.
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
  Application other;
  const auto input = [](void*, void* context) {
    EXPECT_EQ(context, nullptr);
    return 0;
  };
  const auto output = [](void*, void*, unsigned, void*, void* context, unsigned) {
    EXPECT_EQ(context, nullptr);
    return 0;
  };
  start();
  std::atomic<bool> over{false};
  std::thread registrar([&] {
    while (!over) {
      _session->registerInputCallback(input, nullptr);
      _session->registerOutputCallback(output, nullptr);
      other.attach(*_session);
    }
  });
  for (int i = 0; i < 300; ++i) {
    componentProduces("o");
    static_cast<void>(feed("i"));
  }
  require(messages().waitForDelivered(fillBufferDone(), 300), "the outputs");
  over = true;
  registrar.join();
  destroy();
}

TEST_F(InterleavingTest, PicturesInFlightComeFirstAndThenTheEnd) {
  // Once the end of input is pending, output goes to the component no more. A component that owes more
  // pictures than it has buffers keeps its end mark for ever: so the application lets them come first.
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
  EXPECT_GT(script().waiting(), 0u);
  EXPECT_FALSE(_session->_endOfOutputReached);
  _session->setThreadError(OMXI_ERR_APPLICATION);
  EXPECT_EQ(ending.result(), OMXI_ERR_APPLICATION);
}

TEST_F(InterleavingTest, ADoubledMessageCountsOnce) {
  // Taken twice, a filled buffer would be delivered twice and then be with the application and the
  // component at once, and a state would be thought reached before it is.
  messages().setFilter([](const android::omx_message&) { return Fate::Repeat; });
  start();
  _application.onOutput([](const Output&) { return 1; });
  for (size_t i = 1; i <= 4; ++i) {
    componentProduces("output");
    require(messages().waitForDelivered(fillBufferDone(), 2 * i), "the doubles");
  }
  _application.waitForOutputs(4);
  EXPECT_EQ(busyCount(1), kOutputs - 4);
  componentProduces("", 0, OMX_BUFFERFLAG_EOS);
  EXPECT_EQ(deInit(), OMXI_OK);
  EXPECT_EQ(_application.outputs().size(), 5u);
}

}  // namespace
}  // namespace omxtest
