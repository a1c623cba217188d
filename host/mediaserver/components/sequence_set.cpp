#include "host/mediaserver/components/sequence_set.h"

#include <algorithm>

#include "host/mediaserver/components/avc_level.h"

namespace mediaserver {

namespace {

constexpr uint32_t kMostMacroblocks = 1U << 20;  // beyond all levels; keeps products inside a word

// Profiles whose sets carry chroma format, bit depth and scaling lists.
bool isHigh(int profileIdc) {
  switch (profileIdc) {
    case kProfileHigh:
    case 110:
    case 122:
    case 244:
    case 44:
    case 83:
    case 86:
    case 118:
    case 128:
      return true;
    default:
      return false;
  }
}

void skipScalingList(BitReader* reader, unsigned size) {
  int32_t last = 8;
  int32_t next = 8;
  for (unsigned i = 0; i < size && next != 0; ++i) {
    next = (last + reader->se() % 256 + 256) % 256;
    if (next != 0) last = next;
  }
}

void skipHighFields(BitReader* reader) {
  const uint32_t chromaFormat = reader->ue();
  if (chromaFormat == 3) reader->flag();
  reader->ue();  // bit depths
  reader->ue();
  reader->flag();
  if (!reader->flag()) return;
  const unsigned lists = chromaFormat == 3 ? 12 : 8;
  for (unsigned i = 0; i < lists; ++i) {
    if (reader->flag()) skipScalingList(reader, i < 6 ? 16 : 64);
  }
}

void skipPictureOrder(BitReader* reader, uint32_t type) {
  if (type == 0) {
    reader->ue();
  } else if (type == 1) {
    reader->flag();
    reader->se();
    reader->se();
    const uint32_t cycle = reader->ue();
    for (uint32_t i = 0; i < cycle && !reader->overrun(); ++i) reader->se();
  }
}

void skipHrd(BitReader* reader) {
  const uint32_t last = reader->ue();
  reader->bits(8);
  for (uint32_t i = 0; i <= last && !reader->overrun(); ++i) {
    reader->ue();
    reader->ue();
    reader->flag();
  }
  reader->bits(20);
}

std::optional<uint32_t> readReorderFrames(BitReader* reader) {
  constexpr uint32_t kExtendedSar = 255;
  if (reader->flag() && reader->bits(8) == kExtendedSar) reader->bits(32);
  if (reader->flag()) reader->flag();  // overscan
  if (reader->flag()) {                // video signal
    reader->bits(4);
    if (reader->flag()) reader->bits(24);
  }
  if (reader->flag()) {  // chroma location
    reader->ue();
    reader->ue();
  }
  if (reader->flag()) {  // timing
    reader->bits(32);
    reader->bits(32);
    reader->flag();
  }
  const bool nalHrd = reader->flag();
  if (nalHrd) skipHrd(reader);
  const bool vclHrd = reader->flag();
  if (vclHrd) skipHrd(reader);
  if (nalHrd || vclHrd) reader->flag();
  reader->flag();
  if (!reader->flag()) return std::nullopt;
  reader->flag();
  for (int i = 0; i < 4; ++i) reader->ue();
  const uint32_t frames = reader->ue();
  return reader->overrun() ? std::nullopt : std::make_optional(frames);
}

}  // namespace

std::optional<SequenceSet> readSequenceSet(Bytes nal) {
  if (nalType(nal) != kNalSequenceSet) return std::nullopt;
  const std::vector<uint8_t> payload = unescape(nal);
  BitReader reader(payload);
  SequenceSet set;
  set.profileIdc = static_cast<int>(reader.bits(8));
  reader.bits(8);
  set.levelIdc = static_cast<int>(reader.bits(8));
  reader.ue();
  if (isHigh(set.profileIdc)) skipHighFields(&reader);
  reader.ue();
  set.pictureOrderType = reader.ue();
  skipPictureOrder(&reader, set.pictureOrderType);
  set.referenceFrames = reader.ue();
  reader.flag();
  const uint64_t columns = uint64_t{reader.ue()} + 1;
  const uint64_t mapUnits = uint64_t{reader.ue()} + 1;
  const bool framesOnly = reader.flag();
  if (!framesOnly) reader.flag();
  const uint64_t rows = framesOnly ? mapUnits : 2 * mapUnits;
  if (columns > kMostMacroblocks || rows > kMostMacroblocks || columns * rows > kMostMacroblocks) {
    return std::nullopt;
  }
  set.macroblocks = static_cast<uint32_t>(columns * rows);
  reader.flag();
  if (reader.flag()) {
    for (int i = 0; i < 4; ++i) reader.ue();  // cropping
  }
  if (reader.flag()) set.reorderFrames = readReorderFrames(&reader);
  return reader.overrun() ? std::nullopt : std::make_optional(set);
}

uint32_t reorderDepth(const SequenceSet& set) {
  if (set.pictureOrderType == 2) return 0;
  const uint32_t most = decodedPictureBuffer(set.levelIdc, set.macroblocks);
  if (set.reorderFrames) return std::min(*set.reorderFrames, most);
  return set.profileIdc == kProfileBaseline ? 0 : most;
}

void appendSequenceSet(Bytes nal, int profileIdc, std::vector<uint8_t>* stream) {
  std::vector<uint8_t> payload = unescape(nal);
  if (payload.size() < 3 || payload[0] >= profileIdc) {
    appendNal(nal[0], payload, stream);
    return;
  }
  const bool extend = isHigh(profileIdc) && !isHigh(payload[0]);
  payload[0] = static_cast<uint8_t>(profileIdc);
  // The constraint flags name the profiles below that would do, too; declaring none is always right.
  payload[1] = 0;
  if (!extend) {
    appendNal(nal[0], payload, stream);
    return;
  }
  BitReader reader(payload);
  BitWriter writer;
  writer.bits(reader.bits(24), 24);
  writer.ue(reader.ue());
  writer.ue(1).ue(0).ue(0).bits(0, 2);  // 4:2:0, eight bits, no bypass, no scaling lists
  // The rest as it is, up to the stop bit: the last one that is set.
  size_t end = payload.size() * 8;
  while (end > 0 && (unsigned{payload[(end - 1) / 8]} >> (7 - (end - 1) % 8) & 1U) == 0) --end;
  while (reader.position() + 1 < end) writer.bits(reader.bits(1), 1);
  appendNal(nal[0], writer.finish().bytes(), stream);
}

}  // namespace mediaserver
