// Parameters and configurations: what ports answer, what may be written when, and how records are checked.

#include <cstring>

#include "tests/mediaserver/node_fixture.h"

namespace omxtest {
namespace {

constexpr auto kTiFormat = static_cast<OMX_COLOR_FORMATTYPE>(0x7F000100);

class Parameters : public NodeTest {
 protected:
  template <typename Record>
  android::status_t get(const OmxClient& node, OMX_INDEXTYPE index, Record* record) {
    return server->getParameter(node.node(), index, record, sizeof(*record));
  }
  template <typename Record>
  android::status_t set(const OmxClient& node, OMX_INDEXTYPE index, const Record& record) {
    return server->setParameter(node.node(), index, &record, sizeof(record));
  }
};

TEST_F(Parameters, FormatsAreEnumeratedToTheirEndAndChosen) {
  const auto node = client();
  OMX_VIDEO_PARAM_PORTFORMATTYPE format{};
  for (format.nPortIndex = 0; format.nPortIndex < kPortCount; ++format.nPortIndex) {
    std::vector<OMX_U32> seen;
    for (format.nIndex = 0; get(*node, OMX_IndexParamVideoPortFormat, &format) == android::OK;
         ++format.nIndex) {
      EXPECT_TRUE(format.eCompressionFormat == 0 || format.eColorFormat == 0);
      seen.push_back(static_cast<OMX_U32>(format.eCompressionFormat) |
                     static_cast<OMX_U32>(format.eColorFormat));
    }
    EXPECT_EQ(seen, format.nPortIndex == kInputPort ? (std::vector<OMX_U32>{7, 4, 3, 5})
                                                    : (std::vector<OMX_U32>{21, kTiFormat}));
  }
  format.nPortIndex = kOutputPort;
  format.eCompressionFormat = OMX_VIDEO_CodingUnused;
  for (const auto& [colour, status] :
       {std::pair{kTiFormat, android::status_t{android::OK}}, {OMX_COLOR_FormatMonochrome, kUnsupported}}) {
    format.eColorFormat = colour;
    EXPECT_EQ(set(*node, OMX_IndexParamVideoPortFormat, format), status);
    EXPECT_EQ(node->definition(kOutputPort).format.video.eColorFormat, kTiFormat);
  }
}

TEST_F(Parameters, ADefinitionTakesWhatClientsMayWriteAndKeepsTheRest) {
  const auto node = client();
  PortDefinition wanted = node->definition(kInputPort);
  const PortDefinition before = wanted;
  wanted.nSize = 0;  // Kept: some clients send no size
  wanted.eDir = OMX_DirOutput;
  wanted.bEnabled = OMX_FALSE;
  wanted.bPopulated = OMX_TRUE;
  wanted.nBufferCountMin = 7;
  wanted.nBufferAlignment = 4096;
  wanted.nBufferCountActual = 3;
  wanted.format.video.pNativeWindow = &wanted;
  wanted.format.video.nFrameWidth = 64;
  wanted.format.video.nFrameHeight = 48;
  wanted.format.video.nSliceHeight = 0;
  wanted.format.video.nBitrate = 1000;
  wanted.format.video.eCompressionFormat = OMX_VIDEO_CodingMPEG4;
  wanted.format.video.eColorFormat = OMX_COLOR_FormatYUV420SemiPlanar;  // of a compressed port: ignored
  ASSERT_EQ(node->define(kInputPort, wanted), android::OK);

  PortDefinition expected = before;
  expected.nBufferCountActual = 3;
  expected.format.video = wanted.format.video;
  expected.format.video.pNativeWindow = nullptr;
  expected.format.video.eColorFormat = OMX_COLOR_FormatUnused;
  const PortDefinition after = node->definition(kInputPort);
  EXPECT_EQ(std::memcmp(&after, &expected, sizeof(after)), 0);
  // The picture's size reaches the other port.
  EXPECT_EQ(node->definition(kOutputPort).format.video.nFrameWidth, 64u);

  // A refused one changes nothing.
  const struct {
    void (*change)(PortDefinition*);
    android::status_t status;
  } refused[] = {
      {[](PortDefinition* d) { d->nBufferCountActual = 0; }, kUnknownError},
      {[](PortDefinition* d) { d->format.video.eCompressionFormat = OMX_VIDEO_CodingRV; }, kUnsupported},
      {[](PortDefinition* d) { d->nPortIndex = 2; }, kUnknownError},
  };
  for (const auto& test : refused) {
    wanted = after;
    wanted.format.video.nFrameWidth = 32;
    test.change(&wanted);
    EXPECT_EQ(set(*node, OMX_IndexParamPortDefinition, wanted), test.status);
    const PortDefinition still = node->definition(kInputPort);
    EXPECT_EQ(std::memcmp(&still, &after, sizeof(after)), 0);
  }
}

TEST_F(Parameters, AreWrittenInLoadedAndOnDisabledPortsAndReadAlways) {
  const struct {
    OMX_STATETYPE state;
    bool disabled;
    bool writable;
  } cases[] = {
      {OMX_StateLoaded, false, true},     {OMX_StateIdle, false, false},    {OMX_StateIdle, true, true},
      {OMX_StateExecuting, false, false}, {OMX_StateExecuting, true, true}, {OMX_StatePause, true, true},
  };
  for (const auto& test : cases) {
    SCOPED_TRACE(::testing::Message() << test.state << (test.disabled ? " disabled" : ""));
    const auto node = client();
    reach(node.get(), test.state);
    if (test.disabled) node->command(OMX_CommandPortDisable, kOutputPort);
    const android::status_t expected = okIf(test.writable);
    PortDefinition definition = node->definition(kOutputPort);
    definition.nBufferCountActual = 5;
    EXPECT_EQ(node->define(kOutputPort, definition), expected);
    EXPECT_EQ(node->definition(kOutputPort).nBufferCountActual, test.writable ? 5u : 2u);
    OMX_VIDEO_PARAM_BITRATETYPE bitrate{};
    bitrate.nPortIndex = kOutputPort;
    EXPECT_EQ(set(*node, OMX_IndexParamVideoBitrate, bitrate), expected);
    EXPECT_EQ(get(*node, OMX_IndexParamVideoBitrate, &bitrate), android::OK);
    bitrate.nPortIndex = kInputPort;  // that one is enabled
    EXPECT_EQ(set(*node, OMX_IndexParamVideoBitrate, bitrate), okIf(test.state == OMX_StateLoaded));
    OMX_VIDEO_CONFIG_BITRATETYPE config{};
    EXPECT_EQ(server->setConfig(node->node(), OMX_IndexConfigVideoBitrate, &config, sizeof(config)),
              android::OK);
    EXPECT_EQ(server->getConfig(node->node(), OMX_IndexConfigVideoBitrate, &config, sizeof(config)),
              android::OK);
  }
}

TEST_F(Parameters, TheSizeArgumentCountsAndNotTheRecordsOwn) {
  const auto node = client();
  const struct {
    OMX_INDEXTYPE index;
    size_t size;
  } cases[] = {
      {OMX_IndexParamPortDefinition, sizeof(PortDefinition)},
      {OMX_IndexParamVideoPortFormat, sizeof(OMX_VIDEO_PARAM_PORTFORMATTYPE)},
      {OMX_IndexParamCompBufferSupplier, sizeof(OMX_PARAM_BUFFERSUPPLIERTYPE)},
      {OMX_IndexParamVideoInit, sizeof(OMX_PORT_PARAM_TYPE)},
      {OMX_IndexParamStandardComponentRole, sizeof(OMX_PARAM_COMPONENTROLETYPE)},
      {OMX_IndexParamVideoAvc, sizeof(OMX_VIDEO_PARAM_AVCTYPE)},
  };
  for (const auto& test : cases) {
    SCOPED_TRACE(::testing::Message() << std::hex << static_cast<OMX_U32>(test.index));
    // Exactly as large as it says, for the sanitizers to see what lies beyond.
    for (const size_t size : {size_t{0}, size_t{4}, size_t{8}, size_t{12}, test.size - 1}) {
      std::vector<uint8_t> record(size, 0);
      const std::vector<uint8_t> before = record;
      EXPECT_EQ(server->getParameter(node->node(), test.index, record.data(), size), kUnknownError) << size;
      EXPECT_EQ(record, before) << size;
      EXPECT_EQ(server->setParameter(node->node(), test.index, record.data(), size), kUnknownError) << size;
    }
    for (const OMX_U32 ownSize : {0u, 1u, 0x41700000u, 0xFFFFFFFFu}) {
      for (const size_t size : {test.size, test.size + 8}) {
        std::vector<uint8_t> record(size, 0);
        std::memcpy(record.data(), &ownSize, sizeof(ownSize));
        EXPECT_EQ(server->getParameter(node->node(), test.index, record.data(), size), android::OK);
        EXPECT_EQ(std::memcmp(record.data(), &ownSize, sizeof(ownSize)), 0) << "the client's word";
      }
    }
    EXPECT_EQ(server->getParameter(node->node(), test.index, nullptr, test.size), kUnknownError);
    EXPECT_EQ(server->setParameter(node->node(), test.index, nullptr, test.size), kUnknownError);
    std::vector<uint8_t> record(test.size, 0);
    EXPECT_EQ(server->getParameter(node->node(), test.index, record.data(), SIZE_MAX), kUnknownError);
  }
}

TEST_F(Parameters, StandardRecordsOfAComponentAreAnswered) {
  const auto node = client();
  OMX_PORT_PARAM_TYPE ports{};
  EXPECT_EQ(get(*node, OMX_IndexParamVideoInit, &ports), android::OK);
  EXPECT_EQ(ports.nPorts, 2u);

  OMX_PARAM_COMPONENTROLETYPE role{};
  EXPECT_EQ(get(*node, OMX_IndexParamStandardComponentRole, &role), android::OK);
  EXPECT_STREQ(reinterpret_cast<const char*>(role.cRole), "video_decoder.avc");
  EXPECT_EQ(set(*node, OMX_IndexParamStandardComponentRole, role), android::OK);
  std::memset(role.cRole, 'x', sizeof(role.cRole));  // without an end
  EXPECT_EQ(set(*node, OMX_IndexParamStandardComponentRole, role), kUnsupported);

  OMX_PARAM_BUFFERSUPPLIERTYPE supplier{};
  for (const OMX_U32 wanted : {OMX_BufferSupplyInput, OMX_BufferSupplyOutput}) {
    supplier.eBufferSupplier = static_cast<OMX_BUFFERSUPPLIERTYPE>(wanted);
    EXPECT_EQ(set(*node, OMX_IndexParamCompBufferSupplier, supplier), android::OK);
    supplier.eBufferSupplier = static_cast<OMX_BUFFERSUPPLIERTYPE>(3);
    EXPECT_EQ(set(*node, OMX_IndexParamCompBufferSupplier, supplier), kUnknownError);
    EXPECT_EQ(get(*node, OMX_IndexParamCompBufferSupplier, &supplier), android::OK);
    EXPECT_EQ(supplier.eBufferSupplier, wanted);
  }

  OMX_INDEXTYPE index{};
  EXPECT_EQ(server->getExtensionIndex(node->node(), "OMX.google.android.index.other", &index), kUnknownError);
  EXPECT_EQ(server->storeMetaDataInBuffers(node->node(), kInputPort, OMX_FALSE), android::OK);
  decoder.setExtensions({});
  EXPECT_EQ(server->storeMetaDataInBuffers(node->node(), kInputPort, OMX_FALSE), kUnknownError);
}

}  // namespace
}  // namespace omxtest
