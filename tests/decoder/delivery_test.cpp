// From a filled output buffer to the application: what each hardware generation's pictures look like, and the
// pictures that do not arrive. Whatever happens, the buffer goes back to the component.
#include <string.h>

#include <array>
#include <random>
#include <string>

#include <binder/MemoryHeapBase.h>
#include <utils/String8.h>

#include "platform/hardware_version.h"
#include "tests/core/faults.h"
#include "tests/decoder/decoder_session.h"
#include "tests/encoder/encoder_rig.h"

namespace omxtest {
namespace {

constexpr size_t kRgbBytes = 50688;  // of 176x144 pixels
constexpr size_t kTiledBytes = 65536;

using Definition = OMX_PARAM_PORTDEFINITIONTYPE;

class DeliveryTest : public DecoderSessionTest {
 protected:
  explicit DeliveryTest(const char* device = "msm8960") : DecoderSessionTest(device) {}

  // Has the component produce one buffer and waits until it has it back. The calls that this made.
  Trace producedAndReturned(const std::string& bytes, OMX_TICKS timestamp = 0) {
    const size_t before = omx().count();
    const size_t fills = omx().count(Method::FillBuffer);
    componentProduces(bytes, timestamp);
    waitForFills(fills + 1);
    Trace calls = trace(before);
    EXPECT_FALSE(calls.empty());
    if (calls.empty()) return calls;
    EXPECT_EQ(calls.back().substr(0, 10), "fillBuffer");
    calls.pop_back();
    return calls;
  }

  // What the component says of its output from now on.
  void tell(OMX_U32 width, OMX_U32 height) {
    Definition definition = {};
    definition.nPortIndex = 1;
    definition.format.video.nFrameWidth = width;
    definition.format.video.nFrameHeight = height;
    script().answer(OMX_IndexParamPortDefinition, definition);
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
};

void expectInfo(const DECODEDDATAINFO& info, const std::array<OMX_U32, 7>& fields) {
  const std::array<OMX_U32, 7> found{info.width,     info.height,     static_cast<OMX_U32>(info.dataType),
                                     info.cropWidth, info.cropHeight, info.cropLeft,
                                     info.cropTop};
  EXPECT_EQ(found, fields);
}

// --- Every generation ---

struct Generation {
  const char* device;
  int version;
  int dataType;
};

void PrintTo(const Generation& generation, std::ostream* stream) {
  *stream << generation.device;
}

class GenerationTest : public DeliveryTest, public ::testing::WithParamInterface<Generation> {
 protected:
  GenerationTest() : DeliveryTest(GetParam().device) {
    script().editPort(1, [](mediaserver::PortDefinition& port) { port.nBufferSize = kTiledBytes; });
  }
};

TEST_P(GenerationTest, DeliversAPictureWithItsDescriptionAndKeepsNoBuffer) {
  startDecoder();
  answerOutputs(1);  // of no effect
  const bool converted = GetParam().dataType == DECODED_DATA_RGB565;
  Trace expected{"getParameter definition of port 1"};
  if (GetParam().version == HW_VERSION_OMAP4) expected.emplace_back("getConfig");
  for (unsigned int i = 0; i < 2 * kOutputBuffers; ++i) {
    const std::string bytes = "picture " + std::to_string(i);
    EXPECT_EQ(producedAndReturned(bytes, i), expected);
    ASSERT_EQ(pictures().size(), i + 1);
    const Picture picture = pictures()[i];
    EXPECT_EQ(picture.output.timestamp, i);
    EXPECT_EQ(picture.output.bufferId, bufferId(1, i % kOutputBuffers));
    EXPECT_EQ(picture.info.width, 176u);
    EXPECT_EQ(picture.info.height, 144u);
    EXPECT_EQ(picture.info.dataType, GetParam().dataType);
    const BufferInfo& record = _session->_portBuffers[1][i % kOutputBuffers];
    EXPECT_EQ(picture.output.data, converted ? _session->_outputConvertBuffer : record.data);
    EXPECT_EQ(picture.output.length, converted ? kRgbBytes : bytes.size());
    if (!converted) {
      EXPECT_EQ(picture.output.bytes, bytes);
    }
  }
  // Needed or not, the conversion buffer is there on every device.
  EXPECT_EQ(_session->_outputConvertBufferSize, kRgbBytes);
  EXPECT_EQ(producedAndReturned(""), Trace{});
  EXPECT_EQ(pictures().size(), 2 * kOutputBuffers);  // nothing empty
}

TEST_P(GenerationTest, DropsAPictureOfUnknownSizeOrWithoutMemoryForItsConversion) {
  startDecoder();
  {
    const faults::Fault failed(faults::Failing::Malloc, kRgbBytes + 16);
    expectDropped("picture", {"E malloc fail in OmxInterfaceDecoder::callOutputCallbackFunction! line:502 "});
  }
  EXPECT_EQ(_session->_outputConvertBuffer, nullptr);
  EXPECT_EQ(_session->_outputConvertBufferSize, kRgbBytes);
  omx().fail(Method::GetParameter);
  expectDropped("picture", {});
  static_cast<void>(producedAndReturned("the next one"));
  EXPECT_EQ(pictures().size(), 1u);
  EXPECT_NE(_session->_outputConvertBuffer, nullptr);
  _session->registerOutputCallback(nullptr, nullptr);
  EXPECT_EQ(producedAndReturned("nobody looks"), Trace{});
}

INSTANTIATE_TEST_SUITE_P(All, GenerationTest,
                         ::testing::Values(Generation{"msm-unknown", HW_VERSION_UNKNOWN, DECODED_DATA_NATIVE},
                                           Generation{"msm8960", HW_VERSION_QCOM_OTHER, DECODED_DATA_NATIVE},
                                           Generation{"msm7x30", HW_VERSION_MSM7X30, DECODED_DATA_NATIVE},
                                           Generation{"msm8x55", HW_VERSION_MSM8X55, DECODED_DATA_NATIVE},
                                           Generation{"msm8x60", HW_VERSION_MSM8X60, DECODED_DATA_RGB565},
                                           Generation{"omap4", HW_VERSION_OMAP4, DECODED_DATA_CROPPED}));

// --- The component's own layout ---

TEST_F(DeliveryTest, TheConversionBufferGrowsAndNeverShrinks) {
  startDecoder();
  const struct {
    OMX_U32 width;
    OMX_U32 height;
    OMX_U32 size;
  } steps[] = {{64, 64, 8192},    {64, 32, 8192},     {176, 144, 50688},
               {176, 143, 50688}, {320, 240, 153600}, {2, 2, 153600}};
  OMX_U32 before = 0;
  for (const auto& step : steps) {
    SCOPED_TRACE(::testing::Message() << step.width << "x" << step.height);
    tell(step.width, step.height);
    const unsigned char* const buffer = _session->_outputConvertBuffer;
    static_cast<void>(producedAndReturned("picture"));
    expectInfo(pictures().back().info, {step.width, step.height, DECODED_DATA_NATIVE, 0, 0, 0, 0});
    EXPECT_EQ(_session->_outputConvertBufferSize, step.size);
    if (step.size == before) {
      EXPECT_EQ(_session->_outputConvertBuffer, buffer);
    }
    const auto address = reinterpret_cast<uintptr_t>(_session->_outputConvertBuffer);
    EXPECT_EQ(address % 16, 0u);
    const unsigned char advance = _session->_outputConvertBuffer[-1];
    EXPECT_TRUE(advance >= 1 && advance <= 16) << static_cast<int>(advance);
    memset(_session->_outputConvertBuffer, 0, step.size);  // all of it is there
    before = step.size;
  }
}

TEST_F(DeliveryTest, CallsNobodyWithoutACallback) {
  create();
  DECODEDDATAINFO info = {};
  char data = 'd';
  _session->registerOutputCallback(nullptr, nullptr);
  EXPECT_EQ(decoder().privateCallOutputCallbackFunction(info, &data, 1, nullptr, 5), 0);
  _application.attach(*_session);
  answerOutputs(7);
  EXPECT_EQ(decoder().privateCallOutputCallbackFunction(info, &data, 1, &info, 5), 0);
  ASSERT_EQ(_application.outputs().size(), 1u);
  const Output output = _application.outputs()[0];
  EXPECT_EQ(output.first, &info);
  EXPECT_EQ(output.data, &data);
  EXPECT_EQ(output.length, 1u);
  EXPECT_EQ(output.bufferId, &info);
  EXPECT_EQ(output.timestamp, 5u);
}

// --- MSM8x60: tiles to RGB565 ---

// A picture of 176x144: rounded up to 256x160, so 4 by 5 tiles of 64x32 luma bytes, chroma behind.
constexpr size_t kTile = 64 * 32;
constexpr size_t kChroma = 20 * kTile;
constexpr size_t kLumaTiles[5][4] = {
    {0, 1, 6, 7}, {2, 3, 4, 5}, {8, 9, 14, 15}, {10, 11, 12, 13}, {16, 17, 18, 19}};
constexpr size_t kChromaTiles[3][4] = {{0, 1, 6, 7}, {2, 3, 4, 5}, {8, 9, 10, 11}};

int byteAt(const std::string& picture, size_t offset) {
  return static_cast<unsigned char>(picture[offset]);
}

uint16_t rgbPixel(const std::string& picture, size_t x, size_t y) {
  const size_t inTile = y % 32 * 64 + x % 64;
  const int luma = 298 * (byteAt(picture, kLumaTiles[y / 32][x / 64] * kTile + inTile) - 16);
  const size_t column = x / 2 * 2;
  const size_t row = y / 2;
  const size_t pair = kChroma + kChromaTiles[row / 32][column / 64] * kTile + row % 32 * 64 + column % 64;
  const int cb = byteAt(picture, pair) - 128;
  const int cr = byteAt(picture, pair + 1) - 128;
  const int red = std::clamp((luma + 409 * cr) / 256, 0, 255);
  const int green = std::clamp((luma - 208 * cr - 100 * cb) / 256, 0, 255);
  const int blue = std::clamp((luma + 517 * cb) / 256, 0, 255);
  return static_cast<uint16_t>((red >> 3) << 11 | (green >> 2) << 5 | blue >> 3);
}

class ConversionTest : public DeliveryTest {
 protected:
  ConversionTest() : DeliveryTest("msm8x60") {}

  void startWith(OMX_U32 bufferSize) {
    script().editPort(1, [=](mediaserver::PortDefinition& port) { port.nBufferSize = bufferSize; });
    startDecoder();
  }
  static std::string randomPicture() {
    std::mt19937 random(160);
    std::string picture(kTiledBytes, '\0');
    for (char& byte : picture) byte = static_cast<char>(random());
    return picture;
  }
  static void expectConverted(const Picture& picture, const std::string& source) {
    expectInfo(picture.info, {176, 144, DECODED_DATA_RGB565, 0, 0, 0, 0});
    ASSERT_EQ(picture.output.bytes.size(), kRgbBytes);
    size_t different = 0;
    for (size_t y = 0; y < 144; ++y) {
      for (size_t x = 0; x < 176; ++x) {
        uint16_t pixel = 0;
        memcpy(&pixel, picture.output.bytes.data() + 2 * (y * 176 + x), sizeof(pixel));
        if (pixel != rgbPixel(source, x, y)) ++different;
      }
    }
    EXPECT_EQ(different, 0u) << "pixels";
  }
  LogLines droppedLine(const char* size, const void* address, OMX_U32 capacity) const {
    return {android::String8::format("E OMXINTERFACE - Picture of %s dropped: address %p, buffer of %u bytes",
                                     size, address, capacity)
                .string()};
  }
};

TEST_F(ConversionTest, ConvertsEveryPixelWhereverThePictureIs) {
  startWith(kTiledBytes);
  const std::string source = randomPicture();
  // By its address, and by its id alone when the component has a heap of its own.
  for (const size_t index : {0u, 1u}) {
    static_cast<void>(producedAndReturned(source));
    ASSERT_EQ(pictures().size(), index + 1);
    EXPECT_EQ(pictures()[index].output.bufferId, bufferId(1, index));
    expectConverted(pictures()[index], source);
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
  expectDropped("picture", droppedLine("176x144", _session->_portBuffers[1][0].data, kTiledBytes - 1));
  tell(65536, 32768);  // 4 GiB of RGB565, which leaves 32 bits
  expectDropped("picture", droppedLine("65536x32768", _session->_portBuffers[1][1].data, kTiledBytes - 1));
  tell(128, 64);
  static_cast<void>(producedAndReturned("fits"));
  EXPECT_EQ(pictures().size(), 1u);
}

// --- OMAP4: the crop rectangle ---

class CropTest : public DeliveryTest {
 protected:
  CropTest() : DeliveryTest("omap4") {}
};

TEST_F(CropTest, SaysWhichPartIsVisible) {
  startDecoder();
  OMX_CONFIG_RECTTYPE crop = {};
  crop.nPortIndex = 1;
  crop.nLeft = 32;
  crop.nTop = 24;
  crop.nWidth = 120;
  crop.nHeight = 80;
  script().answer(OMX_IndexConfigCommonOutputCrop, crop);
  std::vector<Call> asked;
  omx().before(Method::GetConfig, [&](const Call& call) { asked.push_back(call); });
  static_cast<void>(producedAndReturned("picture"));
  omx().before(Method::GetConfig, nullptr);
  ASSERT_EQ(asked.size(), 1u);
  EXPECT_EQ(static_cast<OMX_U32>(asked[0].index), 0x0700000Fu);
  EXPECT_EQ(asked[0].size, 28u);
  EXPECT_EQ(words(asked[0].record), (Words{28, kVersion, 1, 0, 0, 0, 0}));
  expectInfo(pictures().at(0).info, {176, 144, DECODED_DATA_CROPPED, 120, 80, 32, 24});
}

TEST_F(CropTest, DropsAPictureWithoutOne) {
  startDecoder();
  omx().fail(Method::GetConfig);
  expectDropped("picture", {"E getConfig of OutputCrop: err=80000000"});
  static_cast<void>(producedAndReturned("the next one"));
  EXPECT_EQ(pictures().size(), 1u);
}

}  // namespace
}  // namespace omxtest
