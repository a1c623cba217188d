// The device that this host poses as: one row of a table a generation.
//
// Chosen by the environment variable OMXBRIDGE_DEVICE or by setDevice(); msm8960 where neither says
// anything. Product code detects some of it once per process, so choose before the first session.
// Any thread may call these functions.
#pragma once

#include <stddef.h>
#include <stdint.h>

#include <optional>
#include <span>
#include <string>
#include <string_view>

namespace omxhost {

enum class Vendor { Qualcomm, Ti };

// How a raw picture, 4:2:0 with Cb and Cr alternating, lies in a buffer.
enum class PictureLayout {
  SemiPlanar,         // luma rows, chroma rows behind them
  SemiPlanarAligned,  // the same with chroma at a multiple of 2048 bytes
  Tiled,              // tiles of 64 bytes by 32 rows
  TiPacked,           // semi-planar with a pitch of its own
  TiPadded,           // semi-planar with borders, the visible picture inside
};

struct BufferCounts {
  uint32_t input;
  uint32_t output;
};

// What a generation's components are like.
struct ComponentTraits {
  Vendor vendor;  // whose settings they know
  PictureLayout encoderInput;
  PictureLayout decoderOutput;
  bool baselineOnly;            // of the profiles, the encoder knows this one alone
  uint32_t largestPicture;      // macroblocks of 16x16 pixels
  BufferCounts encoderBuffers;  // before a client sets its own
  BufferCounts decoderBuffers;
};

struct Device {
  const char* name;
  const char* boardPlatform;     // property ro.board.platform
  const char* buildId;           // content of the build id file; null: the file is missing
  const char* decoderComponent;  // H.264 components in the media server; null: none
  const char* encoderComponent;
  ComponentTraits components;  // without meaning where there are none
};

std::span<const Device> devices();
const Device* findDevice(std::string_view name);

// The device in force. The first use settles it: an unknown name in the environment is reported to
// the log, and the default stands.
const Device& posedDevice();

// Poses as another device from now on: sets its properties and its build id. False, with nothing
// changed, for an unknown name.
[[nodiscard]] bool setDevice(std::string_view name);

// Replaces the content of the build id file until the next setDevice(); nothing: the file is missing.
void setBuildId(std::optional<std::string> content);

// Reads up to `count` bytes of the build id file from its beginning. Returns how many were read, or -1
// where the file is missing.
int readSocBuildId(char* bytes, size_t count);

}  // namespace omxhost
