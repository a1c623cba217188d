// The end mark, and the input buffers that come back.
#include <atomic>
#include <map>
#include <thread>

#include <utils/String8.h>

#include "tests/core/session_fixture.h"

namespace omxtest {
namespace {

constexpr const char* kShuttingDown = "E OMXINTERFACE - Client Shutting Down: Input Data ignored";

class InputEndTest : public SessionTest {
 protected:
  struct Reserved {
    void* handle = nullptr;
    void* data = nullptr;
  };

  Reserved reserve() {
    Reserved buffer;
    EXPECT_EQ(_session->reserveInputBuffer(&buffer.handle, &buffer.data), 0);
    return buffer;
  }
  // Keeps the component from returning input, and lets all but `left` buffers go to it.
  void holdInputAllBut(size_t left) {
    script().holdInput();
    for (size_t i = left; i < kInputs; ++i) ASSERT_EQ(feed("held"), 0);
    ASSERT_EQ(busyCount(kOmxInputPort), kInputs - left);
  }
  std::string lastCall() { return trace().back(); }
};

TEST_F(InputEndTest, ClosesWithTheEndMark) {
  start();
  script().holdInput();
  const size_t before = omx().count();
  EXPECT_EQ(beginEndOfInput(-5).result(), 0);
  EXPECT_EQ(trace(before), Trace{"emptyBuffer in0 0+0 flags 0x1 time -5"});
  EXPECT_TRUE(_session->_inputClosed);
  void* handle = this;
  void* data = this;
  EXPECT_EQ(_session->reserveInputBuffer(&handle, &data), -2);
  EXPECT_EQ(handle, nullptr);
  EXPECT_EQ(log(), LogLines{kShuttingDown});
  EXPECT_EQ(feed("dropped without a word"), 0);
  EXPECT_EQ(omx().count(), before + 1);
  EXPECT_EQ(log(), LogLines{kShuttingDown});
}

TEST_F(InputEndTest, StillSendsWhatWasReservedBeforeTheEndMark) {
  start();
  script().holdInput();
  const Reserved first = reserve();
  const Reserved second = reserve();
  ASSERT_EQ(beginEndOfInput().result(), 0);
  const size_t before = omx().count();
  EXPECT_EQ(_session->sendInputBuffer(first.handle, 0, 1), 0);
  EXPECT_EQ(_session->sendFinalBuffer(second.handle, 2), 0);
  EXPECT_EQ(trace(before),
            (Trace{"emptyBuffer in0 0+0 flags 0x10 time 1", "emptyBuffer in1 0+0 flags 0x1 time 2"}));
}

TEST_F(InputEndTest, WaitsForAFreeBufferForTheEndMark) {
  // A buffer comes free in one of two ways.
  for (const bool returned : {true, false}) {
    start();
    const Reserved kept = reserve();
    script().holdInput();
    for (size_t i = 1; i < kInputs; ++i) ASSERT_EQ(feed("held"), 0);
    const size_t before = omx().count();
    Later<int> ending = beginEndOfInput(3);
    waitForSleeper(&SessionState::inputFreeWaiters);
    EXPECT_EQ(omx().count(), before);
    EXPECT_TRUE(_session->_endOfInputPending);
    EXPECT_FALSE(_session->_inputClosed);
    if (returned) {
      script().releaseInput(1);
    } else {
      _session->releaseInputBuffer(kept.handle);
    }
    EXPECT_EQ(ending.result(), 0);
    EXPECT_EQ(trace(before),
              Trace{std::string("emptyBuffer in") + (returned ? "1" : "0") + " 0+0 flags 0x1 time 3"});
    destroy();
    script().passInput();
  }
}

TEST_F(InputEndTest, TellsTheApplicationOfEachBufferThatComesBack) {
  start();
  for (const size_t count : {1u, 2u, 3u}) {
    ASSERT_EQ(feed("x"), 0);
    _application.waitForInputCallbacks(count);
    EXPECT_EQ(_application.inputSession(), _session.get());
  }
  requireEventually([this] { return busyCount(kOmxInputPort) == 0; }, "the input buffers");
  EXPECT_EQ(_application.inputCallbacks(), 3u);
  EXPECT_EQ(valueOf(_session->_semInputBufferFree), 0);  // nobody waits for one
  EXPECT_EQ(valueOf(_session->_semInputBuffersReturned), 0);
}

TEST_F(InputEndTest, HasTheBufferFreeWhenTheApplicationIsTold) {
  start();
  holdInputAllBut(0);
  std::atomic<int> fed{-9};
  _application.onInput([&] { fed = feed("from the callback"); });
  script().releaseInput(1);
  requireEventually([&] { return fed != -9; }, "the input callback");
  EXPECT_EQ(fed, 0);
  _application.onInput(nullptr);
}

TEST_F(InputEndTest, WarnsOfABufferReturnedTwiceAndGoesOn) {
  start();
  void* const id = bufferId(0, 2);
  deliver(makeEmptyBufferDone(id));
  EXPECT_EQ(log(), LogLines{android::String8::format("W OMXINTERFACE - We already own input buffer %p, yet "
                                                     "received an EMPTY_BUFFER_DONE.",
                                                     id)
                                .string()});
  EXPECT_EQ(_application.inputCallbacks(), 1u);
  EXPECT_EQ(_session->threadError(), OMXI_OK);
}

TEST_F(InputEndTest, RecordsAFailureForABufferItDoesNotKnow) {
  connect();
  const std::string line = "E OMXINTERFACE - Buffer not found in buffer vector.\n";
  deliver(makeEmptyBufferDone(this));  // no table yet
  EXPECT_EQ(log(), LogLines{line});
  EXPECT_EQ(_session->threadError(), OMXI_ERR_BUFFER_NOT_FOUND);
  EXPECT_EQ(_application.inputCallbacks(), 1u);
  ASSERT_EQ(init(), OMXI_OK);
  for (void* id : {static_cast<void*>(nullptr), bufferId(1, 0)}) {
    _log.clear();
    deliver(makeEmptyBufferDone(id));
    EXPECT_EQ(log(), LogLines{line});
  }
  EXPECT_EQ(_application.inputCallbacks(), 3u);
}

TEST_F(InputEndTest, TellsWhoeverWaitsForTheInputBuffersOrTheEndMark) {
  start();
  script().holdInput();
  ASSERT_EQ(feed("a"), 0);
  ASSERT_EQ(feed("b"), 0);
  _session->_portReconfiguring = true;
  deliver(makeEmptyBufferDone(bufferId(0, 0)));
  EXPECT_EQ(valueOf(_session->_semInputBuffersReturned), 0);  // one is still out
  deliver(makeEmptyBufferDone(bufferId(0, 1)));
  EXPECT_EQ(valueOf(_session->_semInputBuffersReturned), 1);
  _session->_portReconfiguring = false;
  deliver(makeEmptyBufferDone(bufferId(0, 1)));
  EXPECT_EQ(valueOf(_session->_semInputBuffersReturned), 1);
  _session->_endOfOutputReached = true;
  deliver(makeEmptyBufferDone(bufferId(0, 1)));
  EXPECT_EQ(valueOf(_session->_semInputBuffersReturned), 2);
  EXPECT_EQ(valueOf(_session->_semInputBufferFree), 0);
  _session->_endOfInputPending = true;
  deliver(makeEmptyBufferDone(bufferId(0, 1)));
  EXPECT_EQ(valueOf(_session->_semInputBufferFree), 1);
}

TEST_F(InputEndTest, LetsSeveralThreadsFeed) {
  start();
  // Two threads that took the same buffer would send the component a buffer that it has.
  constexpr int kThreads = 4;
  constexpr int kEach = 200;
  std::vector<std::thread> feeders;
  for (int thread = 0; thread < kThreads; ++thread) {
    feeders.emplace_back([this, thread] {
      for (int i = 0; i < kEach;) {
        const std::string text = std::to_string(thread) + ":" + std::to_string(i);
        const int result = feed(text, i);
        EXPECT_TRUE(result == 0 || result == -1) << result;
        if (result == 0) ++i;
        if (result == -1) std::this_thread::yield();
      }
    });
  }
  for (std::thread& feeder : feeders) feeder.join();
  ASSERT_TRUE(script().waitForInputs(kThreads * kEach));
  std::map<char, int> next;
  for (const Packet& input : script().inputs()) {
    EXPECT_EQ(input.text().substr(2), std::to_string(next[input.text()[0]]++));
  }
  EXPECT_EQ(next.size(), static_cast<size_t>(kThreads));
  EXPECT_EQ(log(), LogLines{});
}

}  // namespace
}  // namespace omxtest
