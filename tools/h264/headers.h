// As much of H.264's parameter sets and slice headers as it takes to tell where one picture ends and the
// next begins, and at what rate they are meant to be shown.
#pragma once

#include <stdint.h>

#include <array>
#include <optional>
#include <span>
#include <string>

#include "tools/base/units.h"

namespace tool {

// Types of NAL units.
enum NalType : uint8_t {
  kNalSlice = 1,
  kNalPartitionA = 2,
  kNalIdrSlice = 5,
  kNalSei = 6,
  kNalSequenceParameters = 7,
  kNalPictureParameters = 8,
  kNalDelimiter = 9,
  kNalPrefix = 14,
  kNalReserved18 = 18,
};

inline NalType nalType(std::span<const uint8_t> nal) {
  return static_cast<NalType>(nal.empty() ? 0 : nal[0] & 31);
}

// A slice, or the first partition of one, of a coded picture.
inline bool isSlice(NalType type) {
  return type == kNalSlice || type == kNalPartitionA || type == kNalIdrSlice;
}

// The fields by which slices of different pictures differ; those that a stream does not have are 0.
struct SliceIdentity {
  uint32_t firstMacroblock = 0;  // not one of them
  uint32_t pictureParameters = 0;
  uint32_t frameNumber = 0;
  bool isField = false;
  bool isBottomField = false;
  bool isReference = false;
  bool isIdr = false;
  uint32_t idrPictureId = 0;
  uint32_t orderCount = 0;
  int32_t orderDeltaBottom = 0;
  std::array<int32_t, 2> orderDeltas{};
  bool complete = false;  // all of it could be read; else only firstMacroblock and isIdr count
};

// Whether `next`, which follows `previous` in the stream, begins another picture.
bool beginsPicture(const SliceIdentity& previous, const SliceIdentity& next);

// What sequence parameters say of a stream.
struct SequenceInfo {
  int profile = 0;           // profile_idc
  bool constrained = false;  // Baseline without what hardly any decoder has
  int level = 0;             // ten times the number: 31 is level 3.1
};

// "Constrained Baseline, level 3.1"
std::string toText(const SequenceInfo& info);
// "Baseline"; the number where it has no name.
std::string profileName(int profile);

// The parameter sets seen so far. Damaged ones are ignored.
class ParameterSets {
 public:
  // Takes a NAL unit (without its start code) in, whatever it is.
  void update(std::span<const uint8_t> nal);
  // `nal` is a slice.
  SliceIdentity identify(std::span<const uint8_t> nal) const;
  // What the last sequence parameters say.
  std::optional<FrameRate> frameRate() const { return _frameRate; }

 private:
  struct Sequence {
    bool separateColourPlanes = false;
    unsigned int frameNumberBits = 0;
    uint32_t orderType = 0;
    unsigned int orderBits = 0;
    bool orderDeltaAlwaysZero = false;
    bool framesOnly = true;
  };
  struct Picture {
    uint32_t sequence = 0;
    bool orderInFramePresent = false;
  };

  void updateSequence(std::span<const uint8_t> payload);
  void updatePicture(std::span<const uint8_t> payload);

  std::array<std::optional<Sequence>, 32> _sequences;
  std::array<std::optional<Picture>, 256> _pictures;
  std::optional<FrameRate> _frameRate;
};

}  // namespace tool
