// What binaries count on without a name: the order of virtual operations.
#include <gtest/gtest.h>

#include <cstring>

#include "core/omx_codec_observer.h"
#include "core/omx_interface.h"
#include "decoder/omx_interface_decoder.h"
#include "platform/board_platform_wrapper.h"

namespace {

// The slot of a virtual operation, from how pointers to members are represented; -1 for one that is not
// virtual.
template <typename Function, typename Class>
int slot(Function Class::*operation) {
  ptrdiff_t words[2];
  static_assert(sizeof(operation) == sizeof(words));
  memcpy(words, &operation, sizeof(words));
#if defined(__arm__) || defined(__aarch64__)
  const bool isVirtual = (words[1] & 1) != 0;
  const ptrdiff_t offset = words[0];
#else
  const bool isVirtual = (words[0] & 1) != 0;
  const ptrdiff_t offset = words[0] - 1;
#endif
  return isVirtual ? static_cast<int>(offset / static_cast<ptrdiff_t>(sizeof(void*))) : -1;
}

// The slots of these, one after the other, begin with `first`.
template <typename... Operations>
void expectSlots(int first, Operations... operations) {
  for (const int found : {slot(operations)...}) EXPECT_EQ(found, first++);
}

TEST(VirtualSlots, AreWhereBinariesCallThem) {
  using Base = OmxInterface;
  using Decoder = OmxInterfaceDecoder;
  using Wrapper = CBoardPlatformWrapper;
  // 0 and 1 are the destructor's two forms.
  expectSlots(2, &Base::setObserver, &Base::setMPmemInfo, &Base::onOmxObserverEvent,
              &Base::onOmxObserverFillBufferDone, &Base::onOmxObserverEmptyBufferDone, &Base::onEvent,
              &Base::init, &Base::deInit, &Base::callOutputCallbackFunction);
  expectSlots(6, &OmxCodecObserverDelegate::onOmxObserverEmptyBufferDone);
  expectSlots(4, &Decoder::onOmxObserverEvent);
  expectSlots(10, &Decoder::callOutputCallbackFunction);
  expectSlots(-1, &Base::setupIOMXConnections);
  expectSlots(0, &Wrapper::configureEncoder, &Wrapper::setConfig, &Wrapper::setPictureOrder,
              &Wrapper::setInputPackingFormat, &Wrapper::setOutputColorFormat);
}

}  // namespace
