// Feeding: the copying and the zero-copy way, the end mark, and the input buffers that come back.
#include <limits.h>
#include <string.h>

#include "tests/core/session_fixture.h"

namespace omxtest {
namespace {

constexpr OMX_U32 kCapacity = 38016;  // of an encoder's input buffer

class InputTest : public SessionTest {
 protected:
  struct Reserved {
    void* handle = nullptr;
    void* data = nullptr;
  };

  Reserved reserve(int result = 0) {
    Reserved buffer{this, this};
    EXPECT_EQ(_session->reserveInputBuffer(&buffer.handle, &buffer.data), result);
    EXPECT_EQ(buffer.handle == nullptr && buffer.data == nullptr, result != 0);
    return buffer;
  }
};

TEST_F(InputTest, SendsCopiesAndReservedBuffersTheLowestFirst) {
  ASSERT_EQ(createEncoder(), OMXI_OK);
  reserve(-1);  // none was allocated
  EXPECT_EQ(feed("x"), -1);
  ASSERT_EQ(init(), OMXI_OK);
  script().holdInput();
  const size_t before = omx().count();
  const Reserved released = reserve();
  const Reserved part = reserve();
  EXPECT_EQ(feed("two!", -1), 0);
  _session->releaseInputBuffer(released.handle);
  const Reserved whole = reserve();
  EXPECT_EQ(whole.handle, released.handle);
  EXPECT_EQ(_session->sendInputData(nullptr, 0, INT_MAX), 0);
  EXPECT_EQ(feed("none left"), -1);
  reserve(-1);
  memset(whole.data, 'x', kCapacity);
  EXPECT_EQ(_session->sendInputBuffer(whole.handle, static_cast<int>(kCapacity), -7), 0);
  EXPECT_EQ(_session->sendInputBuffer(part.handle, 4, INT_MIN), 0);
  EXPECT_EQ(trace(before),
            (Trace{"emptyBuffer in2 0+4 flags 0x0 time -1", "emptyBuffer in3 0+0 flags 0x0 time 2147483647",
                   "emptyBuffer in0 0+38016 flags 0x10 time -7",
                   "emptyBuffer in1 0+4 flags 0x10 time -2147483648"}));
  EXPECT_EQ(log(), LogLines{});
  script().passInput();
  ASSERT_TRUE(script().waitForInputs(4));
  EXPECT_EQ(script().inputs()[0].text(), "two!");
  EXPECT_EQ(script().inputs()[2].text(), std::string(kCapacity, 'x'));
  waitForBusy(0, 0);
  EXPECT_EQ(_application.inputCallbacks(), std::vector<void*>(4, _session.get()));
  deliver(makeEmptyBufferDone(bufferId(0, 0)));  // once more
  EXPECT_EQ(log().size(), 1u);
  EXPECT_NE(log()[0].find("yet received an EMPTY_BUFFER_DONE."), std::string::npos);
  // A send leaves its length in the record; the buffer holds as much as before.
  EXPECT_EQ(feed(std::string(kCapacity, 'y')), 0);
}

TEST_F(InputTest, RefusesWhatABufferDoesNotHoldAndWhatIsNoBuffer) {
  start();
  std::vector<char> data(kCapacity + 1);
  const size_t before = omx().count();
  EXPECT_EQ(_session->sendInputData(data.data(), UINT_MAX, 0), -1);
  EXPECT_EQ(_session->sendInputData(data.data(), kCapacity + 1, 0), -1);
  EXPECT_EQ(_session->sendInputData(nullptr, 1, 0), -1);
  EXPECT_EQ(log().back(), "E OMXINTERFACE - Input of 1 bytes at (nil) refused: a buffer holds 38016");
  EXPECT_EQ(busyCount(0), 0u);  // what was free stays free
  const Reserved good = reserve();
  for (const int length : {INT_MIN, -1, INT_MAX, static_cast<int>(kCapacity) + 1}) {
    EXPECT_EQ(_session->sendInputBuffer(good.handle, length, 0), -1);
  }
  EXPECT_EQ(log().back(), "E OMXINTERFACE - 38017 bytes do not fit an input buffer of 38016");
  auto* const table = static_cast<char*>(good.handle);
  for (void* handle : {static_cast<void*>(nullptr), good.data, static_cast<void*>(table + 1),
                       static_cast<void*>(table + kInputs * sizeof(BufferInfo)), bufferId(0, 0)}) {
    EXPECT_EQ(_session->sendInputBuffer(handle, 1, 0), -1);
    EXPECT_EQ(_session->sendFinalBuffer(handle, 0), -1);
    EXPECT_NE(log().back().find("is no input buffer of this session"), std::string::npos);
    _session->releaseInputBuffer(handle);
  }
  EXPECT_EQ(_session->reserveInputBuffer(nullptr, nullptr), -1);
  _session->_portBuffers[0].editItemAt(1).data = nullptr;  // as of a component in another process
  EXPECT_EQ(feed("x"), -1);
  EXPECT_EQ(log().back(), "E OMXINTERFACE - Input refused: the component's buffer has no address here");
  EXPECT_EQ(busyCount(0), 1u);
  EXPECT_EQ(omx().count(), before);
}

TEST_F(InputTest, ClosesWithTheEndMarkButForWhatWasReserved) {
  // A buffer for the mark comes free in one of two ways.
  for (const bool returned : {true, false}) {
    start();
    const Reserved first = reserve();
    const Reserved kept = reserve();
    script().holdInput();
    while (feed("held") == 0) {
    }
    const size_t before = omx().count();
    Later ending = beginEndOfInput(-5);
    waitForSleeper(&SessionState::inputFreeWaiters);
    EXPECT_FALSE(_session->_inputClosed);
    if (returned) script().releaseInput(1);
    if (!returned) _session->releaseInputBuffer(kept.handle);
    EXPECT_EQ(ending.result(), 0);
    reserve(-2);
    EXPECT_EQ(feed("dropped without a word"), 0);
    EXPECT_EQ(log(), LogLines{"E OMXINTERFACE - Client Shutting Down: Input Data ignored"});
    EXPECT_EQ(_session->sendInputBuffer(first.handle, 0, 1), 0);
    Trace calls{std::string("emptyBuffer in") + (returned ? "2" : "1") + " 0+0 flags 0x1 time -5",
                "emptyBuffer in0 0+0 flags 0x10 time 1"};
    if (returned) {
      EXPECT_EQ(_session->sendFinalBuffer(kept.handle, 2), 0);
      calls.emplace_back("emptyBuffer in1 0+0 flags 0x1 time 2");
    }
    EXPECT_EQ(trace(before), calls);
    destroy();
    _log.clear();
    script().passInput();
  }
}

}  // namespace
}  // namespace omxtest
