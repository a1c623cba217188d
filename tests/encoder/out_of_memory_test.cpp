// Creation when memory runs out: a code, never an exception.
#include <gtest/gtest.h>

#include "core/session_state.h"
#include "tests/encoder/encoder_rig.h"
#include "tests/encoder/failing_allocation.h"

namespace {

using namespace omxtest;

TEST(OutOfMemory, MakesCreationFail) {
  ScriptedMediaServer server("msm8960");
  const size_t parts[] = {sizeof(OmxInterfaceEncoder), sizeof(SessionState)};
  for (const size_t size : parts) {
    SCOPED_TRACE(size);
    webrtc::VideoCodec codec = settings();
    int unused = 0;
    auto* session = reinterpret_cast<OmxInterfaceEncoder*>(&unused);
    failingSize = size;
    EXPECT_EQ(OmxInterfaceEncoder::Create(&session, &codec), OMXI_ERR_CREATE_INTERFACE);
    EXPECT_EQ(failingSize, 0U) << "nothing of this size was asked for";
    failingSize = 0;
    EXPECT_EQ(session, nullptr);
    EXPECT_EQ(server.omx().count(), 0U);
  }
}

}  // namespace
