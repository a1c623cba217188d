// Feeding: the copying and the zero-copy way.
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

TEST_F(InputTest, CopiesDataIntoTheFirstFreeBuffer) {
  start();
  script().holdInput();
  const size_t before = omx().count();
  EXPECT_EQ(feed("one", 10), 0);
  EXPECT_EQ(feed("two!", -1), 0);
  EXPECT_EQ(feed("", INT_MIN), 0);
  EXPECT_EQ(_session->sendInputData(nullptr, 0, INT_MAX), 0);
  EXPECT_EQ(trace(before),
            (Trace{"emptyBuffer in0 0+3 flags 0x0 time 10", "emptyBuffer in1 0+4 flags 0x0 time -1",
                   "emptyBuffer in2 0+0 flags 0x0 time -2147483648",
                   "emptyBuffer in3 0+0 flags 0x0 time 2147483647"}));
  EXPECT_EQ(_session->_portBuffers[0][0].length, kCapacity);  // only the zero-copy sends note theirs
  EXPECT_EQ(feed("none left"), -1);
  EXPECT_EQ(omx().count(), before + 4);
  script().passInput();
  ASSERT_TRUE(script().waitForInputs(4));
  EXPECT_EQ(script().inputs()[1].text(), "two!");
  EXPECT_EQ(script().inputs()[1].timestamp, -1);
  EXPECT_EQ(log(), LogLines{});
}

TEST_F(InputTest, PrefersTheLowestFreeBuffer) {
  start();
  script().holdInput();
  const Reserved first = reserve();
  const Reserved second = reserve();
  EXPECT_EQ(first.data, _session->_portBuffers[0][0].data);
  EXPECT_NE(second.data, first.data);
  _session->releaseInputBuffer(first.handle);
  const Reserved again = reserve();
  EXPECT_EQ(again.handle, first.handle);
  EXPECT_EQ(busyCount(kOmxInputPort), 2u);
}

TEST_F(InputTest, SendsReservedBuffersInPlace) {
  start();
  script().holdInput();
  const size_t before = omx().count();
  const Reserved whole = reserve();
  memset(whole.data, 'x', kCapacity);
  EXPECT_EQ(_session->sendInputBuffer(whole.handle, static_cast<int>(kCapacity), -7), 0);
  EXPECT_EQ(_session->_portBuffers[0][0].length, kCapacity);
  const Reserved part = reserve();
  memcpy(part.data, "part", 4);
  EXPECT_EQ(_session->sendInputBuffer(part.handle, 4, 8), 0);
  EXPECT_EQ(_session->_portBuffers[0][1].length, 4u);
  const Reserved last = reserve();
  memcpy(last.data, "never sent", 10);
  EXPECT_EQ(_session->sendFinalBuffer(last.handle, 9), 0);
  EXPECT_EQ(_session->_portBuffers[0][2].length, 0u);
  EXPECT_EQ(trace(before),
            (Trace{"emptyBuffer in0 0+38016 flags 0x10 time -7", "emptyBuffer in1 0+4 flags 0x10 time 8",
                   "emptyBuffer in2 0+0 flags 0x1 time 9"}));
  script().passInput();
  ASSERT_TRUE(script().waitForInputs(3));
  EXPECT_EQ(script().inputs()[0].text(), std::string(kCapacity, 'x'));
  EXPECT_EQ(script().inputs()[1].text(), "part");
  EXPECT_FALSE(_session->_endOfInputPending);  // that is the end-of-input flag's
  EXPECT_FALSE(_session->_inputClosed);
}

TEST_F(InputTest, RefusesAtOnceWhenNoBufferIsFree) {
  void* handle = this;
  void* data = this;
  connect();
  EXPECT_EQ(_session->reserveInputBuffer(&handle, &data), -1);  // none was allocated
  EXPECT_EQ(handle, nullptr);
  EXPECT_EQ(data, nullptr);
  EXPECT_EQ(feed("x"), -1);
  ASSERT_EQ(init(), OMXI_OK);
  holdInputAllBut(0);
  handle = data = this;
  EXPECT_EQ(_session->reserveInputBuffer(&handle, &data), -1);
  EXPECT_EQ(handle, nullptr);
  EXPECT_EQ(data, nullptr);
  EXPECT_EQ(feed("x"), -1);
  EXPECT_EQ(log(), LogLines{});
  EXPECT_EQ(_session->reserveInputBuffer(nullptr, &data), -1);
  EXPECT_EQ(_session->reserveInputBuffer(&handle, nullptr), -1);
  const std::string nowhere = "E OMXINTERFACE - Nowhere to put the reserved buffer";
  EXPECT_EQ(log(), (LogLines{nowhere, nowhere}));
}

TEST_F(InputTest, RefusesWhatABufferDoesNotHold) {
  start();
  std::vector<char> data(kCapacity + 1);
  const size_t before = omx().count();
  EXPECT_EQ(_session->sendInputData(data.data(), kCapacity + 1, 0), -1);
  EXPECT_EQ(_session->sendInputData(data.data(), UINT_MAX, 0), -1);
  EXPECT_EQ(_session->sendInputData(nullptr, 1, 0), -1);
  EXPECT_EQ(log().size(), 3u);
  EXPECT_EQ(busyCount(kOmxInputPort), 0u);  // what was free stays free

  const Reserved buffer = reserve();
  for (const int length : {-1, INT_MIN, static_cast<int>(kCapacity) + 1, INT_MAX}) {
    EXPECT_EQ(_session->sendInputBuffer(buffer.handle, length, 0), -1);
  }
  EXPECT_EQ(log().size(), 7u);
  EXPECT_EQ(log()[3], "E OMXINTERFACE - -1 bytes do not fit an input buffer of 38016");
  for (const std::string& line : log()) EXPECT_EQ(line.find("E OMXINTERFACE - "), 0u) << line;
  EXPECT_EQ(busyCount(kOmxInputPort), 1u);
  EXPECT_EQ(omx().count(), before);
  // A send leaves its length in the record; the buffer holds as much as before.
  EXPECT_EQ(_session->sendInputBuffer(buffer.handle, 1, 0), 0);
  requireEventually([this] { return busyCount(kOmxInputPort) == 0; }, "the input buffer");
  EXPECT_EQ(_session->inputBufferCapacity(), kCapacity);
  EXPECT_EQ(_session->sendInputData(data.data(), kCapacity, 0), 0);
}

TEST_F(InputTest, DoesNotCopyToABufferWithoutAnAddress) {
  start();
  _session->_portBuffers[0].editItemAt(0).data = nullptr;  // as of a component in another process
  const size_t before = omx().count();
  EXPECT_EQ(feed("x"), -1);
  EXPECT_EQ(log(), LogLines{"E OMXINTERFACE - Input refused: the component's buffer has no address here"});
  EXPECT_EQ(busyCount(kOmxInputPort), 0u);
  EXPECT_EQ(omx().count(), before);
  EXPECT_EQ(feed(""), 0);
}

TEST_F(InputTest, RefusesHandlesThatAreNoneOfItsOwn) {
  start();
  const Reserved good = reserve();
  BufferInfo foreign;
  auto* const table = static_cast<char*>(good.handle);
  const size_t before = omx().count();
  size_t lines = 0;
  for (void* handle : {static_cast<void*>(nullptr), static_cast<void*>(&foreign), good.data,
                       static_cast<void*>(table + 1), static_cast<void*>(table - sizeof(BufferInfo)),
                       static_cast<void*>(table + kInputs * sizeof(BufferInfo)),
                       static_cast<void*>(&_session->_portBuffers[1].editItemAt(0)), bufferId(0, 0)}) {
    EXPECT_EQ(_session->sendInputBuffer(handle, 1, 0), -1);
    EXPECT_EQ(_session->sendFinalBuffer(handle, 0), -1);
    _session->releaseInputBuffer(handle);
    lines += 2;
  }
  EXPECT_EQ(log().size(), lines);
  for (const std::string& line : log()) EXPECT_NE(line.find("is no input buffer of this session"), line.npos);
  EXPECT_EQ(omx().count(), before);
  EXPECT_EQ(busyCount(kOmxInputPort), 1u);
}

TEST_F(InputTest, ReportsWhatTheComponentRefuses) {
  using Send = std::function<int()>;
  const std::string tail = std::string("::emptyBuffer failed w/ error ") + kRefusedHex + " \n";
  Reserved buffer;
  const struct {
    const char* name;
    bool reserving;
    Send send;
    int result;
    std::string line;
  } cases[] = {
      {"copy", false, [&] { return feed("x"); }, -2, "E OMXINTERFACE - ETB" + tail},
      {"in place", true, [&] { return _session->sendInputBuffer(buffer.handle, 1, 0); }, -1,
       "E OMXINTERFACE - SEND INPUT BUFFER" + tail},
      {"final", true, [&] { return _session->sendFinalBuffer(buffer.handle, 0); }, -1,
       "E OMXINTERFACE - ETB" + tail},
      {"end mark", false, [&] { return beginEndOfInput().result(); }, -2, "E OMXINTERFACE - ETB" + tail},
  };
  start();
  size_t out = 0;
  for (const auto& each : cases) {
    SCOPED_TRACE(each.name);
    _log.clear();
    if (each.reserving) buffer = reserve();
    omx().fail(Method::EmptyBuffer);
    EXPECT_EQ(each.send(), each.result);
    EXPECT_EQ(log(), LogLines{each.line});
    EXPECT_EQ(busyCount(kOmxInputPort), ++out);  // it is not free again
    EXPECT_FALSE(_session->_inputClosed);
  }
  EXPECT_TRUE(_session->_endOfInputPending);
}

}  // namespace
}  // namespace omxtest
