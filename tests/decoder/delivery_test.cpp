// What can be set of a decoder, and from a filled output buffer to the application: what each hardware
// generation's pictures look like, and the pictures that do not arrive. Whatever happens, the buffer goes
// back to the component.
#include <limits.h>
#include <string.h>

#include <array>
#include <random>

#include <binder/MemoryHeapBase.h>
#include <media/stagefright/ColorConverter.h>
#include <utils/String8.h>

#include "tests/decoder/decoder_session.h"

namespace omxtest {
namespace {

constexpr size_t kRgbBytes = 50688;  // of 176x144 pixels
constexpr size_t kTiledBytes = 65536;

class DeliveryTest : public DecoderSessionTest {
 protected:
  explicit DeliveryTest(const char* device = "msm8960") : DecoderSessionTest(device) {}

  // Has the component produce one buffer and waits until it has it back. How many pictures came of it.
  size_t produce(const std::string& bytes) {
    const size_t before = _application.outputs().size();
    const size_t fills = omx().count(Method::FillBuffer);
    componentProduces(bytes);
    waitForFills(fills + 1);
    return _application.outputs().size() - before;
  }
  void expectDelivered(const std::string& bytes, const std::array<OMX_U32, 7>& fields) {
    ASSERT_EQ(produce(bytes), 1u);
    const DECODEDDATAINFO info = _application.outputs().back().info;
    EXPECT_EQ(fields, (std::array<OMX_U32, 7>{info.width, info.height, static_cast<OMX_U32>(info.dataType),
                                              info.cropWidth, info.cropHeight, info.cropLeft, info.cropTop}));
  }
  void expectDropped(const std::string& line) {
    _log.clear();
    EXPECT_EQ(produce("picture"), 0u);
    EXPECT_EQ(log(), LogLines{"E " + line});
    EXPECT_EQ(_session->threadError(), OMXI_OK);
  }
  // What the component says of its output from now on.
  void tell(OMX_U32 width, OMX_U32 height) {
    OMX_PARAM_PORTDEFINITIONTYPE definition = {};
    definition.nPortIndex = 1;
    definition.format.video.nFrameWidth = width;
    definition.format.video.nFrameHeight = height;
    script().answer(OMX_IndexParamPortDefinition, definition);
  }
};

TEST_F(DeliveryTest, TheConversionBufferGrowsAndNeverShrinks) {
  startDecoder();
  const std::array<OMX_U32, 3> steps[] = {
      {176, 144, kRgbBytes}, {176, 143, kRgbBytes}, {320, 240, 153600}, {2, 2, 153600}};
  OMX_U32 before = 0;
  for (const auto& [width, height, size] : steps) {
    tell(width, height);
    const unsigned char* const buffer = _session->_outputConvertBuffer;
    expectDelivered("picture", {width, height, DECODED_DATA_NATIVE, 0, 0, 0, 0});
    EXPECT_EQ(_session->_outputConvertBufferSize, size);
    EXPECT_TRUE(size != before || _session->_outputConvertBuffer == buffer);
    EXPECT_EQ(reinterpret_cast<uintptr_t>(_session->_outputConvertBuffer) % 16, 0u);
    memset(_session->_outputConvertBuffer, 0, size);  // all of it is there
    before = size;
  }
  // For nobody.
  EXPECT_EQ(produce(""), 0u);
  _session->registerOutputCallback(nullptr, nullptr);
  EXPECT_EQ(produce("nobody looks"), 0u);
}

TEST_F(DeliveryTest, TheCompressionFormatIsWrittenIntoTheComponentsDefinition) {
  using Definition = OMX_PARAM_PORTDEFINITIONTYPE;
  create();
  // Another number leaves it as it is.
  const std::pair<int, OMX_VIDEO_CODINGTYPE> formats[] = {
      {4, OMX_VIDEO_CodingAVC},  {1, OMX_VIDEO_CodingMPEG4}, {INT_MIN, OMX_VIDEO_CodingMPEG4},
      {2, OMX_VIDEO_CodingH263}, {3, OMX_VIDEO_CodingWMV},   {0, OMX_VIDEO_CodingAVC}};
  for (const auto& [format, coding] : formats) {
    omx().clearCalls();
    EXPECT_EQ(decoder().setInputCompressionFormat(format), 0);
    const std::vector<Call> calls = omx().calls();
    EXPECT_EQ(words(calls[0].record)[0], 0u);  // components go by the size that the caller says
    EXPECT_EQ(calls[1].record, edited<Definition>(calls[0],
                                                  [value = coding](Definition& port) {
                                                    port.format.video.eCompressionFormat = value;
                                                  }))
        << format;
  }
}

// MSM8x60: tiles to RGB565.
class ConversionTest : public DeliveryTest {
 protected:
  ConversionTest() : DeliveryTest("msm8x60") {}

  void startWith(OMX_U32 bufferSize) {
    script().editPort(1, [=](mediaserver::PortDefinition& port) { port.nBufferSize = bufferSize; });
    startDecoder();
  }
  static std::string dropped(const char* size, const void* address, size_t capacity) {
    return android::String8::format("OMXINTERFACE - Picture of %s dropped: address %p, buffer of %zu bytes",
                                    size, address, capacity)
        .string();
  }
};

TEST_F(ConversionTest, ConvertsAPictureWhereverItIs) {
  startWith(kTiledBytes);
  EXPECT_EQ(trace()[3], "setParameter 7f000002 port 0");  // whole frames
  std::mt19937 random(160);
  std::string source(kTiledBytes, '\0');
  for (char& byte : source) byte = static_cast<char>(random());
  std::string expected(kRgbBytes, '\0');
  android::ColorConverter converter(static_cast<OMX_COLOR_FORMATTYPE>(0x7FA30C03),
                                    OMX_COLOR_Format16bitRGB565);
  converter.convert(source.data(), 256, 160, 0, 0, 175, 143, expected.data(), 176, 144, 0, 0, 175, 143);
  // By its address, and by its id alone when the component has a heap of its own.
  for (const size_t index : {0u, 1u}) {
    expectDelivered(source, {176, 144, DECODED_DATA_RGB565, 0, 0, 0, 0});
    EXPECT_EQ(_application.outputs()[index].bufferId, bufferId(1, index));
    EXPECT_TRUE(_application.outputs()[index].bytes == expected);
    _session->setMPmemInfo(new android::MemoryHeapBase(4096));
  }
}

TEST_F(ConversionTest, DropsAPictureThatItsBufferCannotHold) {
  startWith(kTiledBytes - 1);
  expectDropped(dropped("176x144", outputRecord(0)->data, kTiledBytes - 1));
  tell(65536, 32768);  // 4 GiB of RGB565, which leaves 32 bits
  expectDropped(dropped("65536x32768", outputRecord(1)->data, kTiledBytes - 1));
  tell(128, 64);
  expectDelivered("fits", {128, 64, DECODED_DATA_RGB565, 0, 0, 0, 0});
}

// OMAP4: the crop rectangle.
class CropTest : public DeliveryTest {
 protected:
  CropTest() : DeliveryTest("omap4") {}
};

TEST_F(CropTest, SaysWhichPartIsVisible) {
  startDecoder();
  OMX_CONFIG_RECTTYPE crop = {};
  crop.nLeft = 32;
  crop.nTop = 24;
  crop.nWidth = 120;
  crop.nHeight = 80;
  script().answer(OMX_IndexConfigCommonOutputCrop, crop);
  Call asked;
  omx().before(Method::GetConfig, [&](const Call& call) { asked = call; });
  expectDelivered("picture", {176, 144, DECODED_DATA_CROPPED, 120, 80, 32, 24});
  EXPECT_EQ(words(asked.record), (Words{28, kVersion, 1, 0, 0, 0, 0}));
}

}  // namespace
}  // namespace omxtest
