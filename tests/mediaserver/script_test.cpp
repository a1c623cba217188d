// A component does what its script says.

#include "tests/mediaserver/support_fixture.h"

namespace omxtest {
namespace {

using mediaserver::kInputPort;
using mediaserver::kOutputPort;

using ScriptTest = Support;

TEST_F(ScriptTest, AScriptAnswersRefusesAndKeepsWhatWasWritten) {
  const auto node = client();
  OMX_VIDEO_PARAM_AVCTYPE avc{};
  avc.nPortIndex = kOutputPort;
  avc.nRefFrames = 3;
  EXPECT_FALSE(decoder.written<OMX_VIDEO_PARAM_AVCTYPE>(OMX_IndexParamVideoAvc).has_value());
  EXPECT_EQ(omx->setParameter(node->node(), OMX_IndexParamVideoAvc, &avc, sizeof(avc)), android::OK);
  EXPECT_EQ(decoder.written<OMX_VIDEO_PARAM_AVCTYPE>(OMX_IndexParamVideoAvc)->nRefFrames, 3u);
  avc.nRefFrames = 0;
  EXPECT_EQ(omx->getParameter(node->node(), OMX_IndexParamVideoAvc, &avc, sizeof(avc)), android::OK);
  EXPECT_EQ(avc.nRefFrames, 3u) << "as written";
  avc.nRefFrames = 9;
  decoder.answer(OMX_IndexParamVideoAvc, avc);
  EXPECT_EQ(omx->getParameter(node->node(), OMX_IndexParamVideoAvc, &avc, sizeof(avc)), android::OK);
  EXPECT_EQ(avc.nRefFrames, 9u) << "as answered";

  mediaserver::PortDefinition lie = node->definition(kOutputPort);
  lie.nBufferCountActual = 10001;
  decoder.answer(OMX_IndexParamPortDefinition, lie);
  EXPECT_EQ(node->definition(kOutputPort).nBufferCountActual, 10001u);
  EXPECT_EQ(node->definition(kInputPort).nBufferCountActual, 2u);
  decoder.refuse(Access::GetParameter, OMX_IndexParamPortDefinition, OMX_ErrorUndefined, kOutputPort);
  EXPECT_NE(omx->getParameter(node->node(), OMX_IndexParamPortDefinition, &lie, sizeof(lie)), android::OK);
  EXPECT_EQ(node->definition(kInputPort).nBufferCountActual, 2u);

  const auto vendor = static_cast<OMX_INDEXTYPE>(0x7F00ABCD);
  EXPECT_NE(omx->setConfig(node->node(), vendor, &avc, 16), android::OK);
  decoder.accept(Access::SetConfig, vendor);
  EXPECT_EQ(omx->setConfig(node->node(), vendor, &avc, 16), android::OK);
}

TEST_F(ScriptTest, AScriptHoldsAndLetsGoOneByOne) {
  const auto node = running();
  decoder.holdInput();
  decoder.holdOutput();
  node->empty(0, "a");
  node->empty(1, "b");
  settle(node.get());
  EXPECT_EQ(decoder.inputCount(), 0u);
  decoder.releaseInput(1);
  node->expect(emptyBufferDone(), 1);
  EXPECT_TRUE(decoder.waitForInputs(1));
  decoder.passInput();
  node->expect(emptyBufferDone(), 2);
  EXPECT_EQ(decoder.waiting(), 2u);
  EXPECT_EQ(node->messages().count(fillBufferDone()), 0u);
  decoder.releaseOutput(1);
  node->expect(fillBufferDone(), 1);
  settle(node.get());
  EXPECT_EQ(node->messages().count(fillBufferDone()), 1u);
  decoder.passOutput();
  node->expect(fillBufferDone(), 2);
  Packet lie("short");
  lie.lengthToTell = 1000000;
  node->fill(0);
  decoder.produce(lie);
  node->expect(fillBufferDone(), 3);
  EXPECT_EQ(node->messages().all().back().u.extended_buffer_data.range_length, 1000000u);
}

}  // namespace
}  // namespace omxtest
