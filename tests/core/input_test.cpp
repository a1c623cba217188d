// Feeding: the copying and the zero-copy way, the end mark, and the input buffers that come back.
#include <limits.h>
#include <string.h>

#include <atomic>

#include "tests/core/session_fixture.h"

namespace omxtest {
namespace {

constexpr OMX_U32 kCapacity = 38016;  // of an encoder's input buffer
constexpr const char* kShuttingDown = "E OMXINTERFACE - Client Shutting Down: Input Data ignored";

class InputTest : public SessionTest {
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
  void expectNothingReserved(int result) {
    Reserved buffer{this, this};
    EXPECT_EQ(_session->reserveInputBuffer(&buffer.handle, &buffer.data), result);
    EXPECT_TRUE(buffer.handle == nullptr && buffer.data == nullptr);
  }
};

TEST_F(InputTest, CopiesDataIntoTheFirstFreeBuffer) {
  connect();
  expectNothingReserved(-1);  // none was allocated
  EXPECT_EQ(feed("x"), -1);
  ASSERT_EQ(init(), OMXI_OK);
  script().holdInput();
  const size_t before = omx().count();
  EXPECT_EQ(feed("one", 10), 0);
  EXPECT_EQ(feed("two!", -1), 0);
  EXPECT_EQ(feed("", INT_MIN), 0);
  EXPECT_EQ(_session->sendInputData(nullptr, 0, INT_MAX), 0);
  EXPECT_EQ(feed("none left"), -1);
  expectNothingReserved(-1);
  EXPECT_EQ(trace(before),
            (Trace{"emptyBuffer in0 0+3 flags 0x0 time 10", "emptyBuffer in1 0+4 flags 0x0 time -1",
                   "emptyBuffer in2 0+0 flags 0x0 time -2147483648",
                   "emptyBuffer in3 0+0 flags 0x0 time 2147483647"}));
  EXPECT_EQ(_session->_portBuffers[0][0].length, kCapacity);  // only the zero-copy sends note theirs
  script().passInput();
  ASSERT_TRUE(script().waitForInputs(4));
  EXPECT_EQ(script().inputs()[1].text(), "two!");
  EXPECT_EQ(log(), LogLines{});
}

TEST_F(InputTest, SendsReservedBuffersInPlaceTheLowestFirst) {
  start();
  script().holdInput();
  const Reserved released = reserve();
  EXPECT_EQ(released.data, _session->_portBuffers[0][0].data);
  const Reserved part = reserve();
  _session->releaseInputBuffer(released.handle);
  const Reserved whole = reserve();
  EXPECT_EQ(whole.handle, released.handle);
  EXPECT_EQ(busyCount(0), 2u);
  const size_t before = omx().count();
  memset(whole.data, 'x', kCapacity);
  EXPECT_EQ(_session->sendInputBuffer(whole.handle, static_cast<int>(kCapacity), -7), 0);
  memcpy(part.data, "part", 4);
  EXPECT_EQ(_session->sendInputBuffer(part.handle, 4, 8), 0);
  EXPECT_EQ(_session->_portBuffers[0][1].length, 4u);
  EXPECT_EQ(_session->sendFinalBuffer(reserve().handle, 9), 0);
  EXPECT_EQ(_session->_portBuffers[0][2].length, 0u);
  EXPECT_EQ(trace(before),
            (Trace{"emptyBuffer in0 0+38016 flags 0x10 time -7", "emptyBuffer in1 0+4 flags 0x10 time 8",
                   "emptyBuffer in2 0+0 flags 0x1 time 9"}));
  script().passInput();
  ASSERT_TRUE(script().waitForInputs(3));
  EXPECT_EQ(script().inputs()[0].text(), std::string(kCapacity, 'x'));
  EXPECT_EQ(script().inputs()[1].text(), "part");
  EXPECT_FALSE(_session->_endOfInputPending || _session->_inputClosed);  // that is the end-of-input flag's
}

TEST_F(InputTest, RefusesWhatABufferDoesNotHold) {
  start();
  std::vector<char> data(kCapacity + 1);
  const size_t before = omx().count();
  EXPECT_EQ(_session->sendInputData(data.data(), kCapacity + 1, 0), -1);
  EXPECT_EQ(_session->sendInputData(data.data(), UINT_MAX, 0), -1);
  EXPECT_EQ(_session->sendInputData(nullptr, 1, 0), -1);
  EXPECT_EQ(log().back(), "E OMXINTERFACE - Input of 1 bytes at (nil) refused: a buffer holds 38016");
  EXPECT_EQ(busyCount(0), 0u);  // what was free stays free
  const Reserved buffer = reserve();
  for (const int length : {-1, INT_MIN, static_cast<int>(kCapacity) + 1, INT_MAX}) {
    EXPECT_EQ(_session->sendInputBuffer(buffer.handle, length, 0), -1);
  }
  EXPECT_EQ(log().size(), 7u);
  EXPECT_EQ(log()[3], "E OMXINTERFACE - -1 bytes do not fit an input buffer of 38016");
  EXPECT_EQ(busyCount(0), 1u);
  EXPECT_EQ(omx().count(), before);
  // A send leaves its length in the record; the buffer holds as much as before.
  EXPECT_EQ(_session->sendInputBuffer(buffer.handle, 1, 0), 0);
  waitForBusy(0, 0);
  EXPECT_EQ(_session->inputBufferCapacity(), kCapacity);
  EXPECT_EQ(_session->sendInputData(data.data(), kCapacity, 0), 0);
}

TEST_F(InputTest, RefusesHandlesThatAreNoneOfItsOwnAndBuffersWithoutAnAddress) {
  start();
  const Reserved good = reserve();
  BufferInfo foreign;
  auto* const table = static_cast<char*>(good.handle);
  const size_t before = omx().count();
  size_t lines = 0;
  for (void* handle : {static_cast<void*>(nullptr), static_cast<void*>(&foreign), good.data,
                       static_cast<void*>(table + 1), static_cast<void*>(table - sizeof(BufferInfo)),
                       static_cast<void*>(table + kInputs * sizeof(BufferInfo)),
                       static_cast<void*>(outputRecord(0)), bufferId(0, 0)}) {
    EXPECT_EQ(_session->sendInputBuffer(handle, 1, 0), -1);
    EXPECT_EQ(_session->sendFinalBuffer(handle, 0), -1);
    _session->releaseInputBuffer(handle);
    lines += 2;
  }
  EXPECT_EQ(log().size(), lines);
  for (const std::string& line : log()) EXPECT_NE(line.find("is no input buffer of this session"), line.npos);
  EXPECT_EQ(busyCount(0), 1u);
  _log.clear();
  void* pointer = nullptr;
  EXPECT_EQ(_session->reserveInputBuffer(nullptr, &pointer), -1);
  EXPECT_EQ(_session->reserveInputBuffer(&pointer, nullptr), -1);
  _session->_portBuffers[0].editItemAt(1).data = nullptr;  // as of a component in another process
  EXPECT_EQ(feed("x"), -1);
  const std::string nowhere = "E OMXINTERFACE - Nowhere to put the reserved buffer";
  EXPECT_EQ(log(), (LogLines{nowhere, nowhere,
                             "E OMXINTERFACE - Input refused: the component's buffer has no address here"}));
  EXPECT_EQ(busyCount(0), 1u);
  EXPECT_EQ(omx().count(), before);
  EXPECT_EQ(feed(""), 0);
}

TEST_F(InputTest, ReportsAFinalBufferThatTheComponentRefuses) {
  start();
  omx().fail(Method::EmptyBuffer);
  EXPECT_EQ(_session->sendFinalBuffer(reserve().handle, 0), -1);
  EXPECT_EQ(log(), LogLines{std::string("E OMXINTERFACE - ETB::emptyBuffer failed w/ error ") + kRefusedHex +
                            " \n"});
  EXPECT_FALSE(_session->_inputClosed);
  EXPECT_EQ(busyCount(0), 1u);  // it is not free again
}

TEST_F(InputTest, ClosesWithTheEndMarkButForWhatWasReserved) {
  start();
  script().holdInput();
  const Reserved first = reserve();
  const Reserved second = reserve();
  const size_t before = omx().count();
  EXPECT_EQ(beginEndOfInput(-5).result(), 0);
  EXPECT_TRUE(_session->_inputClosed);
  expectNothingReserved(-2);
  EXPECT_EQ(log(), LogLines{kShuttingDown});
  EXPECT_EQ(feed("dropped without a word"), 0);
  EXPECT_EQ(_session->sendInputBuffer(first.handle, 0, 1), 0);
  EXPECT_EQ(_session->sendFinalBuffer(second.handle, 2), 0);
  EXPECT_EQ(trace(before),
            (Trace{"emptyBuffer in2 0+0 flags 0x1 time -5", "emptyBuffer in0 0+0 flags 0x10 time 1",
                   "emptyBuffer in1 0+0 flags 0x1 time 2"}));
  EXPECT_EQ(log(), LogLines{kShuttingDown});
}

TEST_F(InputTest, WaitsForAFreeBufferForTheEndMark) {
  // A buffer comes free in one of two ways.
  for (const bool returned : {true, false}) {
    start();
    const Reserved kept = reserve();
    holdInputAllBut(1);
    const size_t before = omx().count();
    Later<int> ending = beginEndOfInput(3);
    waitForSleeper(&SessionState::inputFreeWaiters);
    EXPECT_EQ(omx().count(), before);
    EXPECT_TRUE(_session->_endOfInputPending);
    EXPECT_FALSE(_session->_inputClosed);
    if (returned) script().releaseInput(1);
    if (!returned) _session->releaseInputBuffer(kept.handle);
    EXPECT_EQ(ending.result(), 0);
    EXPECT_EQ(trace(before),
              Trace{std::string("emptyBuffer in") + (returned ? "1" : "0") + " 0+0 flags 0x1 time 3"});
    destroy();
    script().passInput();
  }
}

TEST_F(InputTest, TellsTheApplicationOfEachBufferThatIsFreeAgain) {
  start();
  holdInputAllBut(0);
  std::atomic<int> fed{-9};
  _application.onInput([&] { fed = feed("from the callback"); });
  script().releaseInput(1);
  requireEventually([&] { return fed != -9; }, "the input callback");
  EXPECT_EQ(fed, 0);
  _application.onInput(nullptr);
  script().passInput();
  waitForBusy(0, 0);
  _application.waitForInputCallbacks(5);
  EXPECT_EQ(_application.inputCallbacks(), std::vector<void*>(5, _session.get()));
  EXPECT_EQ(valueOf(_session->_semInputBufferFree), 0);  // nobody waits for one
  EXPECT_EQ(valueOf(_session->_semInputBuffersReturned), 0);
}

TEST_F(InputTest, FailsForABufferThatItDoesNotKnow) {
  connect();
  deliver(makeEmptyBufferDone(this));  // no table yet
  EXPECT_EQ(_session->threadError(), OMXI_ERR_BUFFER_NOT_FOUND);
  ASSERT_EQ(init(), OMXI_OK);
  for (void* id : {static_cast<void*>(nullptr), bufferId(1, 0)}) deliver(makeEmptyBufferDone(id));
  EXPECT_EQ(log(), LogLines(3, "E OMXINTERFACE - Buffer not found in buffer vector.\n"));
}

TEST_F(InputTest, TellsWhoeverWaitsForTheInputBuffersOrTheEndMark) {
  start();
  script().holdInput();
  for (const char* text : {"a", "b"}) ASSERT_EQ(feed(text), 0);
  const auto posts = [this](size_t index) {
    deliver(makeEmptyBufferDone(bufferId(0, index)));
    return std::pair(valueOf(_session->_semInputBuffersReturned), valueOf(_session->_semInputBufferFree));
  };
  _session->_portReconfiguring = true;
  EXPECT_FALSE(_session->portBuffersHaveBeenReturned(0));
  EXPECT_EQ(posts(0), std::pair(0, 0));  // one is still out
  EXPECT_EQ(posts(1), std::pair(1, 0));
  EXPECT_TRUE(_session->portBuffersHaveBeenReturned(0));
  EXPECT_FALSE(_session->portBuffersHaveBeenReturned(1));
  _session->_portReconfiguring = false;
  EXPECT_EQ(posts(1), std::pair(1, 0));
  _session->_endOfOutputReached = true;
  EXPECT_EQ(posts(1), std::pair(2, 0));
  _session->_endOfInputPending = true;
  EXPECT_EQ(posts(1), std::pair(3, 1));
}

}  // namespace
}  // namespace omxtest
