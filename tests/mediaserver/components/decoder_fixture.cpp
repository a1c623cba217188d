#include "tests/mediaserver/components/decoder_fixture.h"

#include <algorithm>

namespace componenttest {

using mediaserver::kInputPort;

android::status_t DecoderRun::setOrder(mediaserver::QcomOrder order) {
  auto record = makeRecord<mediaserver::QcomPictureOrder>(kInputPort);
  record.eOutputPictureOrder = static_cast<OMX_U32>(order);
  return set(mediaserver::kQcomPictureOrderIndex, record);
}

android::status_t DecoderRun::setPacking(mediaserver::QcomPacking packing) {
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

void DecoderRun::sendPieces(const std::vector<uint8_t>& stream, size_t bytes) {
  for (size_t at = 0; at < stream.size(); at += bytes) {
    const auto begin = stream.begin() + static_cast<ptrdiff_t>(at);
    send({begin, begin + static_cast<ptrdiff_t>(std::min(bytes, stream.size() - at))}, 0);
  }
}

void expectSamePictures(const std::vector<Decoded>& got, const std::vector<Decoded>& wanted) {
  ASSERT_EQ(got.size(), wanted.size());
  for (size_t i = 0; i < got.size(); ++i) {
    EXPECT_EQ(got[i].picture.width, wanted[i].picture.width) << "picture " << i;
    EXPECT_EQ(got[i].picture.height, wanted[i].picture.height) << "picture " << i;
    EXPECT_TRUE(got[i].picture == wanted[i].picture) << "picture " << i;
  }
}

void expectSame(const std::vector<Decoded>& got, const std::vector<Decoded>& wanted) {
  expectSamePictures(got, wanted);
  for (size_t i = 0; i < std::min(got.size(), wanted.size()); ++i) {
    EXPECT_EQ(got[i].timestamp, wanted[i].timestamp) << "picture " << i;
  }
}

}  // namespace componenttest
