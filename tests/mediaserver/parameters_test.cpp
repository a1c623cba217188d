// Parameters: what may be written when, and how records are checked.

#include <cstring>

#include "tests/mediaserver/node_fixture.h"

namespace omxtest {
namespace {

class Parameters : public NodeTest {
 protected:
  bool inputIs(const PortDefinition& expected) {
    const PortDefinition present = node->definition(kInputPort);
    return std::memcmp(&present, &expected, sizeof(present)) == 0;
  }

  std::unique_ptr<OmxClient> node = client();
};

TEST_F(Parameters, ADefinitionTakesWhatClientsMayWriteAndKeepsTheRest) {
  PortDefinition wanted = node->definition(kInputPort);
  PortDefinition expected = wanted;
  wanted.nSize = 0;  // Kept: some clients send no size
  wanted.eDir = OMX_DirOutput;
  wanted.bEnabled = OMX_FALSE;
  wanted.nBufferCountMin = 7;
  wanted.nBufferCountActual = expected.nBufferCountActual = 3;
  auto& video = wanted.format.video;
  video.nFrameWidth = 64;
  video.nFrameHeight = 48;
  video.nSliceHeight = 0;
  video.nBitrate = 1000;
  video.eCompressionFormat = OMX_VIDEO_CodingMPEG4;
  expected.format.video = video;
  video.pNativeWindow = &wanted;
  video.eColorFormat = OMX_COLOR_FormatYUV420SemiPlanar;  // of a compressed port: ignored
  ASSERT_EQ(node->define(kInputPort, wanted), kOk);
  EXPECT_TRUE(inputIs(expected));

  wanted = expected;
  wanted.format.video.nFrameWidth = 32;
  wanted.nBufferCountActual = 0;
  EXPECT_EQ(node->define(kInputPort, wanted), kUnknownError);
  EXPECT_TRUE(inputIs(expected)) << "nothing of it was taken";
}

TEST_F(Parameters, AreWrittenInLoadedAndOnDisabledPortsAndReadAlways) {
  for (const OMX_STATETYPE state : {OMX_StateLoaded, OMX_StateIdle, OMX_StateExecuting, OMX_StatePause}) {
    for (const bool disabled : {false, true}) {
      SCOPED_TRACE(::testing::Message() << state << (disabled ? " disabled" : ""));
      node = client();
      reach(node.get(), state);
      if (disabled) node->command(OMX_CommandPortDisable, kOutputPort);
      const bool writable = disabled || state == OMX_StateLoaded;
      PortDefinition definition = node->definition(kOutputPort);
      definition.nBufferCountActual = 5;
      EXPECT_EQ(node->define(kOutputPort, definition), okIf(writable));
      EXPECT_EQ(node->definition(kOutputPort).nBufferCountActual, writable ? 5u : 2u);
      OMX_VIDEO_PARAM_BITRATETYPE bitrate{};
      bitrate.nPortIndex = kInputPort;  // that one is enabled
      EXPECT_EQ(node->set(OMX_IndexParamVideoBitrate, bitrate), okIf(state == OMX_StateLoaded));
    }
  }
}

TEST_F(Parameters, TheSizeArgumentCountsAndNotTheRecordsOwn) {
  const std::pair<OMX_INDEXTYPE, size_t> records[] = {
      {OMX_IndexParamPortDefinition, sizeof(PortDefinition)},
      {OMX_IndexParamVideoPortFormat, sizeof(OMX_VIDEO_PARAM_PORTFORMATTYPE)},
      {OMX_IndexParamStandardComponentRole, sizeof(OMX_PARAM_COMPONENTROLETYPE)},
  };
  for (const auto& [index, whole] : records) {
    SCOPED_TRACE(::testing::Message() << std::hex << static_cast<OMX_U32>(index));
    // Exactly as large as it says, for the sanitizers to see what lies beyond.
    for (const size_t size : {size_t{0}, size_t{4}, size_t{8}, size_t{12}, whole - 1}) {
      std::vector<uint8_t> record(size, 0);
      EXPECT_EQ(server->getParameter(node->node(), index, record.data(), size), kUnknownError) << size;
      EXPECT_EQ(record, std::vector<uint8_t>(size, 0)) << size;
      EXPECT_EQ(server->setParameter(node->node(), index, record.data(), size), kUnknownError) << size;
    }
    std::vector<OMX_U32> record(whole / sizeof(OMX_U32), 0);
    record[0] = 0xFFFFFFFF;
    EXPECT_EQ(server->getParameter(node->node(), index, record.data(), whole), kOk);
    EXPECT_EQ(record[0], 0xFFFFFFFF) << "the client's word";
    EXPECT_EQ(server->getParameter(node->node(), index, nullptr, whole), kUnknownError);
    EXPECT_EQ(server->setParameter(node->node(), index, nullptr, whole), kUnknownError);
    EXPECT_EQ(server->getParameter(node->node(), index, record.data(), SIZE_MAX), kUnknownError);
  }
  OMX_PARAM_COMPONENTROLETYPE role{};
  std::memset(role.cRole, 'x', sizeof(role.cRole));  // without an end
  EXPECT_EQ(node->set(OMX_IndexParamStandardComponentRole, role), kUnsupported);
}

}  // namespace
}  // namespace omxtest
