#include "tests/mediaserver/components/runs.h"

#include "host/mediaserver/components/annex_b.h"

namespace componenttest {

android::status_t DecoderRun::setOrder(QcomOrder order) {
  auto record = makeRecord<mediaserver::QcomPictureOrder>(kInputPort);
  record.eOutputPictureOrder = static_cast<OMX_U32>(order);
  return set(mediaserver::kQcomPictureOrderIndex, record);
}

android::status_t DecoderRun::setPacking(QcomPacking packing) {
  auto record = makeRecord<mediaserver::QcomPortDefinition>(kInputPort);
  record.nFramePackingFormat = static_cast<OMX_U32>(packing);
  return set(mediaserver::kQcomPortDefinitionIndex, record);
}

void DecoderRun::setInput(OMX_VIDEO_CODINGTYPE coding, uint32_t width, uint32_t height) {
  auto definition = node().definition(kInputPort);
  definition.format.video.eCompressionFormat = coding;
  if (width != 0) definition.format.video.nFrameWidth = width;
  if (height != 0) definition.format.video.nFrameHeight = height;
  EXPECT_EQ(node().define(kInputPort, definition), android::OK);
}

void DecoderRun::sendAll(const std::vector<Unit>& units) {
  for (const Unit& unit : units) send(unit.bytes, unit.timestamp);
}

void EncoderRun::setSize(uint32_t width, uint32_t height, uint32_t framesPerSecond) {
  for (const OMX_U32 port : {kInputPort, kOutputPort}) {
    auto definition = node().definition(port);
    definition.format.video.nFrameWidth = width;
    definition.format.video.nFrameHeight = height;
    definition.format.video.xFramerate = framesPerSecond << 16;
    EXPECT_EQ(node().define(port, definition), android::OK);
  }
}

void EncoderRun::setBitRate(uint32_t bitsPerSecond, OMX_VIDEO_CONTROLRATETYPE mode) {
  auto record = makeRecord<OMX_VIDEO_PARAM_BITRATETYPE>(kOutputPort);
  record.eControlRate = mode;
  record.nTargetBitrate = bitsPerSecond;
  EXPECT_EQ(set(OMX_IndexParamVideoBitrate, record), android::OK);
}

OMX_VIDEO_PARAM_AVCTYPE EncoderRun::avc() {
  auto record = makeRecord<OMX_VIDEO_PARAM_AVCTYPE>(kOutputPort);
  EXPECT_EQ(get(OMX_IndexParamVideoAvc, &record), android::OK);
  return record;
}

android::status_t EncoderRun::setAvc(const std::function<void(OMX_VIDEO_PARAM_AVCTYPE&)>& change) {
  OMX_VIDEO_PARAM_AVCTYPE record = avc();
  change(record);
  return set(OMX_IndexParamVideoAvc, record);
}

Output& EncoderRun::encode(const Picture& picture) {
  const size_t before = outputs().size();
  send(packInput(picture, device().components.encoderInput), static_cast<int64_t>(before) * 1000);
  awaitOutputs(before + 1);
  return outputs().back();
}

void EncoderRun::encodeScene(uint32_t width, uint32_t height, uint32_t count) {
  for (uint32_t i = 0; i < count; ++i) encode(scene(width, height, _next++));
}

std::vector<size_t> EncoderRun::keyFrames() const {
  std::vector<size_t> found;
  for (size_t i = 0; i < outputs().size(); ++i) {
    if ((outputs()[i].flags & OMX_BUFFERFLAG_SYNCFRAME) != 0) found.push_back(i);
  }
  return found;
}

std::vector<Unit> EncoderRun::units() const {
  std::vector<Unit> units;
  for (const Output& output : outputs()) units.push_back({output.bytes, output.timestamp});
  return units;
}

double EncoderRun::bits(size_t first, size_t count) const {
  size_t bytes = 0;
  for (size_t i = first; i < first + count; ++i) bytes += outputs().at(i).bytes.size();
  return static_cast<double>(bytes) * 8;
}

void expectSame(const std::vector<Decoded>& got, const std::vector<Decoded>& wanted, bool timed) {
  ASSERT_EQ(got.size(), wanted.size());
  for (size_t i = 0; i < got.size(); ++i) {
    EXPECT_TRUE(got[i].picture == wanted[i].picture)
        << "picture " << i << ": " << got[i].picture.width << "x" << got[i].picture.height << " for "
        << wanted[i].picture.width << "x" << wanted[i].picture.height;
    EXPECT_TRUE(!timed || got[i].timestamp == wanted[i].timestamp) << "picture " << i;
  }
}

std::vector<std::vector<uint8_t>> nals(const std::vector<uint8_t>& stream) {
  std::vector<std::vector<uint8_t>> found;
  mediaserver::Bytes rest(stream);
  for (auto nal = mediaserver::takeNal(&rest); !nal.empty(); nal = mediaserver::takeNal(&rest)) {
    found.emplace_back(nal.begin(), nal.end());
  }
  return found;
}

NalTypes nalTypes(const std::vector<uint8_t>& unit) {
  NalTypes types;
  for (const auto& nal : nals(unit)) types.push_back(mediaserver::nalType(nal));
  return types;
}

mediaserver::SequenceSet sequenceSet(const std::vector<uint8_t>& unit) {
  for (const auto& nal : nals(unit)) {
    if (const auto set = mediaserver::readSequenceSet(nal)) return *set;
  }
  ADD_FAILURE() << "no sequence set";
  return {};
}

}  // namespace componenttest
