#include "tools/h264/headers.h"

#include <algorithm>

#include "tools/base/text.h"
#include "tools/h264/bit_reader.h"

namespace tool {

namespace {

constexpr std::array<uint32_t, 13> kProfilesWithChromaFormat{100, 110, 122, 244, 44,  83, 86,
                                                             118, 128, 138, 139, 134, 135};
constexpr uint32_t kChroma444 = 3;
constexpr uint32_t kExtendedPixelAspect = 255;

void skipScalingList(BitReader& bits, int size) {
  int32_t last = 8;
  int32_t next = 8;
  for (int i = 0; i < size && !bits.overrun(); ++i) {
    if (next != 0)
      next = static_cast<int32_t>(static_cast<uint32_t>(last) + static_cast<uint32_t>(bits.se())) & 255;
    if (next != 0) last = next;
  }
}

// Reads the video usability information up to the timing.
std::optional<FrameRate> readTiming(BitReader& bits) {
  if (bits.bit() != 0 && bits.bits(8) == kExtendedPixelAspect) bits.bits(32);
  if (bits.bit() != 0) bits.bit();  // overscan
  if (bits.bit() != 0) {            // video signal type
    bits.bits(4);
    if (bits.bit() != 0) bits.bits(24);
  }
  if (bits.bit() != 0) {  // chroma location
    bits.ue();
    bits.ue();
  }
  if (bits.bit() == 0) return std::nullopt;
  const uint32_t unitsInTick = bits.bits(32);
  const uint32_t timeScale = bits.bits(32);
  // A tick is the time of a field.
  if (bits.overrun() || unitsInTick > UINT32_MAX / 2) return std::nullopt;
  return makeFrameRate(timeScale, unitsInTick * 2);
}

}  // namespace

std::string profileName(int profile) {
  switch (profile) {
    case 66:
      return "Baseline";
    case 77:
      return "Main";
    case 100:
      return "High";
    default:
      return formatted("profile %d", profile);
  }
}

std::string toText(const SequenceInfo& info) {
  const char* const constrained = info.constrained && info.profile == 66 ? "Constrained " : "";
  return formatted("%s%s, level %d.%d", constrained, profileName(info.profile).c_str(), info.level / 10,
                   info.level % 10);
}

bool beginsPicture(const SliceIdentity& previous, const SliceIdentity& next) {
  if (!previous.complete || !next.complete) {
    return next.firstMacroblock == 0 || previous.isIdr != next.isIdr;
  }
  return previous.pictureParameters != next.pictureParameters || previous.frameNumber != next.frameNumber ||
         previous.isField != next.isField || previous.isBottomField != next.isBottomField ||
         previous.isReference != next.isReference || previous.isIdr != next.isIdr ||
         previous.idrPictureId != next.idrPictureId || previous.orderCount != next.orderCount ||
         previous.orderDeltaBottom != next.orderDeltaBottom || previous.orderDeltas != next.orderDeltas;
}

void ParameterSets::update(std::span<const uint8_t> nal) {
  const NalType type = nalType(nal);
  if (type == kNalSequenceParameters) updateSequence(nal.subspan(1));
  if (type == kNalPictureParameters) updatePicture(nal.subspan(1));
}

void ParameterSets::updateSequence(std::span<const uint8_t> payload) {
  BitReader bits(payload);
  Sequence sequence;
  const uint32_t profile = bits.bits(8);
  bits.bits(16);  // constraints, level
  const uint32_t id = bits.ue();
  if (std::find(kProfilesWithChromaFormat.begin(), kProfilesWithChromaFormat.end(), profile) !=
      kProfilesWithChromaFormat.end()) {
    const uint32_t chromaFormat = bits.ue();
    if (chromaFormat == kChroma444) sequence.separateColourPlanes = bits.bit() != 0;
    bits.ue();  // bit depths
    bits.ue();
    bits.bit();
    if (bits.bit() != 0) {  // scaling matrix
      const int lists = chromaFormat == kChroma444 ? 12 : 8;
      for (int i = 0; i < lists; ++i) {
        if (bits.bit() != 0) skipScalingList(bits, i < 6 ? 16 : 64);
      }
    }
  }
  sequence.frameNumberBits = std::min(bits.ue(), 12U) + 4;
  sequence.orderType = bits.ue();
  if (sequence.orderType == 0) {
    sequence.orderBits = std::min(bits.ue(), 12U) + 4;
  } else if (sequence.orderType == 1) {
    sequence.orderDeltaAlwaysZero = bits.bit() != 0;
    bits.se();
    bits.se();
    const uint32_t offsets = bits.ue();
    for (uint32_t i = 0; i < offsets && !bits.overrun(); ++i) bits.se();
  }
  bits.ue();  // reference frames
  bits.bit();
  bits.ue();  // width
  bits.ue();  // height
  sequence.framesOnly = bits.bit() != 0;
  if (bits.overrun() || id >= _sequences.size()) return;
  _sequences[id] = sequence;

  if (!sequence.framesOnly) bits.bit();
  bits.bit();
  if (bits.bit() != 0) {  // cropping
    for (int side = 0; side < 4; ++side) bits.ue();
  }
  _frameRate = bits.bit() != 0 ? readTiming(bits) : std::nullopt;
}

void ParameterSets::updatePicture(std::span<const uint8_t> payload) {
  BitReader bits(payload);
  const uint32_t id = bits.ue();
  Picture picture;
  picture.sequence = bits.ue();
  bits.bit();
  picture.orderInFramePresent = bits.bit() != 0;
  if (bits.overrun() || id >= _pictures.size() || picture.sequence >= _sequences.size()) return;
  _pictures[id] = picture;
}

SliceIdentity ParameterSets::identify(std::span<const uint8_t> nal) const {
  SliceIdentity slice;
  if (nal.empty()) return slice;
  slice.isIdr = nalType(nal) == kNalIdrSlice;
  slice.isReference = (nal[0] & 0x60) != 0;
  BitReader bits(nal.subspan(1));
  slice.firstMacroblock = bits.ue();
  bits.ue();  // slice type
  slice.pictureParameters = bits.ue();
  if (slice.pictureParameters >= _pictures.size() || !_pictures[slice.pictureParameters]) return slice;
  const Picture& picture = *_pictures[slice.pictureParameters];
  if (!_sequences[picture.sequence]) return slice;
  const Sequence& sequence = *_sequences[picture.sequence];

  if (sequence.separateColourPlanes) bits.bits(2);
  slice.frameNumber = bits.bits(sequence.frameNumberBits);
  if (!sequence.framesOnly) {
    slice.isField = bits.bit() != 0;
    if (slice.isField) slice.isBottomField = bits.bit() != 0;
  }
  if (slice.isIdr) slice.idrPictureId = bits.ue();
  const bool hasBottomDelta = picture.orderInFramePresent && !slice.isField;
  if (sequence.orderType == 0) {
    slice.orderCount = bits.bits(sequence.orderBits);
    if (hasBottomDelta) slice.orderDeltaBottom = bits.se();
  } else if (sequence.orderType == 1 && !sequence.orderDeltaAlwaysZero) {
    slice.orderDeltas[0] = bits.se();
    if (hasBottomDelta) slice.orderDeltas[1] = bits.se();
  }
  slice.complete = !bits.overrun();
  return slice;
}

}  // namespace tool
