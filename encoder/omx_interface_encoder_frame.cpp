// The way of one raw frame into the component.
#include <limits.h>
#include <sched.h>
#include <string.h>

#include "core/log.h"
#include "core/session_state.h"
#include "encoder/omx_interface_encoder.h"
#include "platform/hardware_version.h"

namespace {

constexpr int kNoBuffer = -1;  // of reserveInputBuffer()
constexpr int kNotSent = -1;

// A frame in an input buffer, in bytes. 64 bits hold any product of two frame sides.
struct FrameLayout {
  int64_t luma;
  int64_t chroma;
  int64_t chromaOffset;

  FrameLayout(int width, int height, uint32_t chromaAlignment)
      : luma(int64_t{width} * height),
        chroma(luma / 2),
        chromaOffset((luma + chromaAlignment - 1) / chromaAlignment * chromaAlignment) {}
  int64_t length() const { return chromaOffset + chroma; }
};

// Kept: the bytes between the planes are 0.
void copyFrame(unsigned char* target, const unsigned char* frame, const FrameLayout& layout) {
  const auto luma = static_cast<size_t>(layout.luma);
  const auto chromaOffset = static_cast<size_t>(layout.chromaOffset);
  memcpy(target, frame, luma);
  memset(target + luma, 0, chromaOffset - luma);
  memcpy(target + chromaOffset, frame + luma, static_cast<size_t>(layout.chroma));
}

}  // namespace

int OmxInterfaceEncoder::sendDataFrame(const unsigned char* frame, int width, int height, int timestamp) {
  const SessionCall call(*_state);
  const FrameLayout layout(width, height, hardwareTraits(getHardwareBaseVersion()).encoderChromaAlignment);
  if (frame == nullptr || width <= 0 || height <= 0) {
    return failWith(kNotSent, "OMXINTERFACE - Frame of %dx%d at %p refused", width, height,
                    static_cast<const void*>(frame));
  }
  {
    // From before the reservation until the buffer is sent: it is not freed while the frame is copied.
    PortUse use(*_state, kOmxInputPort);
    {
      const SessionState::Lock held(_state->lock);
      use.begin(held);
    }
    void* buffer = nullptr;
    void* data = nullptr;
    const int reserved = reserveInputBuffer(&buffer, &data);
    if (reserved == kNoBuffer) return threadError();
    if (reserved == 0) {
      const uint32_t capacity = inputBufferCapacity();
      if (data == nullptr || layout.length() > capacity || layout.length() > INT_MAX) {
        releaseInputBuffer(buffer);
        return failWith(kNotSent, "OMXINTERFACE - Frame of %dx%d does not fit an input buffer of %u bytes",
                        width, height, capacity);
      }
      copyFrame(static_cast<unsigned char*>(data), frame, layout);
      const int sent = sendInputBuffer(buffer, static_cast<int>(layout.length()), timestamp);
      return sent == 0 ? threadError() : kNotSent;
    }
  }
  return awaitFailure();
}

// Kept: a frame that comes after the end of input is tried again until something goes wrong; callers
// rely on it to learn of the failure. The input does not open again, so there is no more to try than
// to look whether one is recorded.
int OmxInterfaceEncoder::awaitFailure() {
  for (;;) {
    const int error = threadError();
    if (error != OMXI_OK) return error;
    {
      const SessionState::Lock held(_state->lock);
      if (_state->ending) return kNotSent;
    }
    sched_yield();
  }
}
