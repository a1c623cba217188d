// What differs between the chip generations for a session: callers ask for the property they need,
// not for a chip's number.
#pragma once

#include <stdint.h>

#include "omxbridge/hardware_version.h"

struct HardwareTraits {
  int decoderInputWidth;   // pixels: the largest picture that a decoder's input port is set up for
  int decoderInputHeight;  // pixels
  // Bytes: the chroma plane of a frame in an encoder's input buffer begins at a multiple of this.
  uint32_t encoderChromaAlignment;
  bool encoderBaselineOnly;  // the encoder does neither other profiles nor CABAC nor the 8x8 transform
};

// The traits of a generation (a HardwareBaseVersion). Any thread.
const HardwareTraits& hardwareTraits(int hardwareVersion);
