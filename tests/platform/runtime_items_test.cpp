// What each item that can be changed while an encoder runs sends to the component, per vendor.
#include <gtest/gtest.h>

#include "tests/encoder/encoder_rig.h"

namespace omxtest {
namespace {

struct Item {
  CONFIGTYPE type;
  unsigned long value;
  OMX_U32 index;
  Words record;
};

const std::vector<Item> kQcomItems = {
    {CONFIG_BITRATE, 500000, 0x06000011, {16, kVersion, 1, 500000}},
    // The size word is the rate as a float.
    {CONFIG_FRAMERATE, 15, 0x06000012, {0x41700000, kVersion, 1, 0x000F0000}},
    {CONFIG_FRAMERATE, 0, 0x06000012, {0, kVersion, 1, 0}},
    {CONFIG_FRAMERATE, 65536, 0x06000012, {0x47800000, kVersion, 1, 0}},
    {CONFIG_FRAMERATE, 0xFFFFFFFF, 0x06000012, {0x4F800000, kVersion, 1, 0xFFFF8000}},  // saturates
    {CONFIG_INTRA_PERIOD, 30, 0x7F000007, {24, kVersion, 1, 1, 29, 0}},
    {CONFIG_INTRA_PERIOD, 0, 0x7F000007, {24, kVersion, 1, 1, 0xFFFFFFFF, 0}},
    {CONFIG_REQUEST_IFRAME, 77, 0x06000013, {16, kVersion, 1, 1}},
    {CONFIG_ROTATION, ~0UL, 0x0700000B, {16, kVersion, 1, 0xFFFFFFFF}},
};

const std::vector<Item> kTiItems = {
    {CONFIG_BITRATE, 500000, 0x06000011, {16, kVersion, 1, 500000}},
    // The input port.
    {CONFIG_FRAMERATE, 15, 0x06000012, {16, kVersion, 0, 0x000F0000}},
    {CONFIG_FRAMERATE, 1, 0x06000012, {16, kVersion, 0, 0x00020000}},
    {CONFIG_FRAMERATE, 65537, 0x06000012, {16, kVersion, 0, 0x00010000}},
    {CONFIG_REQUEST_IFRAME, 77, 0x06000013, {16, kVersion, 1, 1}},
    {CONFIG_ROTATION, 270, 0x0700000B, {16, kVersion, 1, 270}},
};

class RuntimeItems : public ::testing::TestWithParam<const char*> {};

TEST_P(RuntimeItems, AreOneRecordEach) {
  EncoderRig rig(GetParam());
  ASSERT_EQ(rig.create(), 0);
  const bool isTi = GetParam() == std::string("omap4");
  for (const Item& item : isTi ? kTiItems : kQcomItems) {
    SCOPED_TRACE(testing::Message() << "item " << item.type << " value " << item.value);
    rig.server.omx().clearCalls();
    EXPECT_EQ(rig.session->setConfig(item.type, item.value), 0);
    EXPECT_EQ(logLines(rig.log), LogLines());
    const std::vector<Call> calls = rig.server.omx().calls();
    ASSERT_EQ(calls.size(), 1U);
    EXPECT_EQ(calls[0].method, Method::SetConfig);
    EXPECT_EQ(static_cast<OMX_U32>(calls[0].index), item.index);
    EXPECT_EQ(words(calls[0].record), item.record);
  }
  rig.server.omx().clearCalls();
  for (const int type : {5, 6, 0x7FFFFFFF}) {
    EXPECT_EQ(rig.session->setConfig(static_cast<CONFIGTYPE>(type), 1), OMXI_ERR_SET_CONFIG);
  }
  if (isTi) {
    EXPECT_EQ(rig.session->setConfig(CONFIG_INTRA_PERIOD, 30), 0);  // without a call
    EXPECT_EQ(rig.server.omx().count(), 0U);
  }
  EXPECT_EQ(logLines(rig.log), LogLines());
}

INSTANTIATE_TEST_SUITE_P(Vendors, RuntimeItems, ::testing::Values("msm8960", "omap4"));

}  // namespace
}  // namespace omxtest
