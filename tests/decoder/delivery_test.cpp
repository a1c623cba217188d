// From a filled output buffer to the application: what each hardware generation's pictures look like, and the
// pictures that do not arrive. Whatever happens, the buffer goes back to the component.
#include <string.h>

#include <array>
#include <random>
#include <string>

#include <binder/MemoryHeapBase.h>
#include <media/stagefright/ColorConverter.h>
#include <utils/String8.h>

#include "tests/core/faults.h"
#include "tests/decoder/decoder_session.h"
#include "tests/encoder/encoder_rig.h"

namespace omxtest {
namespace {

constexpr size_t kRgbBytes = 50688;  // of 176x144 pixels
constexpr size_t kTiledBytes = 65536;

class DeliveryTest : public DecoderSessionTest {
 protected:
  explicit DeliveryTest(const char* device = "msm8960") : DecoderSessionTest(device) {}

  // Has the component produce one buffer and waits until it has it back. The calls that this made, but for
  // the one that gives it back.
  Trace producedAndReturned(const std::string& bytes) {
    const size_t before = omx().count();
    const size_t fills = omx().count(Method::FillBuffer);
    componentProduces(bytes);
    waitForFills(fills + 1);
    Trace calls = trace(before);
    EXPECT_EQ(calls.back().substr(0, 10), "fillBuffer");
    calls.pop_back();
    return calls;
  }
  void expectDelivered(const std::string& bytes, const std::array<OMX_U32, 7>& fields) {
    const size_t before = pictures().size();
    static_cast<void>(producedAndReturned(bytes));
    ASSERT_EQ(pictures().size(), before + 1);
    const DECODEDDATAINFO info = pictures().back().info;
    EXPECT_EQ(fields, (std::array<OMX_U32, 7>{info.width, info.height, static_cast<OMX_U32>(info.dataType),
                                              info.cropWidth, info.cropHeight, info.cropLeft, info.cropTop}));
  }
  // The component's next buffer does not reach the application, with these lines alone, and goes back.
  void expectDropped(const std::string& bytes, const LogLines& lines) {
    const size_t delivered = pictures().size();
    _log.clear();
    static_cast<void>(producedAndReturned(bytes));
    EXPECT_EQ(pictures().size(), delivered);
    EXPECT_EQ(log(), lines);
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

TEST_F(DeliveryTest, DropsPicturesWithoutMemoryAndThoseForNobody) {
  startDecoder();
  {
    const faults::Fault failed(faults::Failing::Malloc, kRgbBytes + 16);
    expectDropped("picture", {"E malloc fail in OmxInterfaceDecoder::callOutputCallbackFunction! line:502 "});
  }
  EXPECT_EQ(_session->_outputConvertBuffer, nullptr);
  EXPECT_EQ(_session->_outputConvertBufferSize, kRgbBytes);
  answerOutputs(1);  // of no effect: a decoder lets nobody keep a buffer
  expectDelivered("the next one", {176, 144, DECODED_DATA_NATIVE, 0, 0, 0, 0});
  EXPECT_EQ(producedAndReturned(""), Trace{});
  EXPECT_EQ(pictures().size(), 1u);
  DECODEDDATAINFO info = {};
  _session->registerOutputCallback(nullptr, nullptr);
  EXPECT_EQ(producedAndReturned("nobody looks"), Trace{});
  EXPECT_EQ(decoder().privateCallOutputCallbackFunction(info, this, 0, nullptr, 5), 0);
}

TEST_F(DeliveryTest, TheConversionBufferGrowsAndNeverShrinks) {
  startDecoder();
  const std::array<OMX_U32, 3> steps[] = {{64, 64, 8192},    {64, 32, 8192},     {176, 144, 50688},
                                          {176, 143, 50688}, {320, 240, 153600}, {2, 2, 153600}};
  OMX_U32 before = 0;
  for (const auto& [width, height, size] : steps) {
    tell(width, height);
    const unsigned char* const buffer = _session->_outputConvertBuffer;
    expectDelivered("picture", {width, height, DECODED_DATA_NATIVE, 0, 0, 0, 0});
    EXPECT_EQ(_session->_outputConvertBufferSize, size);
    EXPECT_TRUE(size != before || _session->_outputConvertBuffer == buffer);
    EXPECT_EQ(reinterpret_cast<uintptr_t>(_session->_outputConvertBuffer) % 16, 0u);
    const unsigned char advance = _session->_outputConvertBuffer[-1];
    EXPECT_TRUE(advance >= 1 && advance <= 16) << static_cast<int>(advance);
    memset(_session->_outputConvertBuffer, 0, size);  // all of it is there
    before = size;
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
  static LogLines droppedLine(const char* size, const void* address, size_t capacity) {
    return {
        android::String8::format("E OMXINTERFACE - Picture of %s dropped: address %p, buffer of %zu bytes",
                                 size, address, capacity)
            .string()};
  }
};

TEST_F(ConversionTest, ConvertsAPictureWhereverItIs) {
  startWith(kTiledBytes);
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
    EXPECT_EQ(pictures()[index].output.bufferId, bufferId(1, index));
    EXPECT_TRUE(pictures()[index].output.bytes == expected);
    _session->setMPmemInfo(new android::MemoryHeapBase(4096));
  }
  {
    const SessionState::Lock held(_session->_state->lock);
    outputRecord(2)->data = nullptr;  // as of a component in another process
  }
  expectDropped("picture", droppedLine("176x144", nullptr, kTiledBytes));
}

TEST_F(ConversionTest, DropsAPictureThatItsBufferCannotHold) {
  startWith(kTiledBytes - 1);
  expectDropped("picture", droppedLine("176x144", outputRecord(0)->data, kTiledBytes - 1));
  tell(65536, 32768);  // 4 GiB of RGB565, which leaves 32 bits
  expectDropped("picture", droppedLine("65536x32768", outputRecord(1)->data, kTiledBytes - 1));
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
  EXPECT_EQ(static_cast<OMX_U32>(asked.index), 0x0700000Fu);
  EXPECT_EQ(words(asked.record), (Words{28, kVersion, 1, 0, 0, 0, 0}));
}

}  // namespace
}  // namespace omxtest
