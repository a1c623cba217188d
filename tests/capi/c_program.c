#include "tests/capi/c_program.h"

#include <string.h>
#include <time.h>

#include "omxbridge/omxbridge.h"

enum { kFrames = 20, kWidth = 176, kHeight = 144, kFrameBytes = kWidth * kHeight * 3 / 2, kWaitSeconds = 20 };

typedef struct VideoCodec VideoCodec;
typedef struct VideoCodecH264 VideoCodecH264;
// What the callbacks saw; counted atomically.
struct Seen {
  int inputs;
  int outputs;
  int faults;
  void* session;
  uint32_t width;  // of the pictures to come
  uint32_t height;
  unsigned int length;  // of the encoder's output to come, bytes
};

#define CHECK(condition)               \
  do {                                 \
    if (!(condition)) return __LINE__; \
  } while (0)

static void count(struct Seen* seen, int* counter, int fault) {
  __atomic_add_fetch(&seen->faults, fault, __ATOMIC_SEQ_CST);
  __atomic_add_fetch(counter, 1, __ATOMIC_SEQ_CST);
}

static int waitFor(const int* counter, int value) {
  const struct timespec moment = {0, 100000};
  for (int left = kWaitSeconds * 10000; left > 0; --left) {
    if (__atomic_load_n(counter, __ATOMIC_SEQ_CST) >= value) return 1;
    nanosleep(&moment, NULL);
  }
  return 0;
}

static int onInput(void* session, void* context) {
  struct Seen* seen = context;
  count(seen, &seen->inputs, session != seen->session);
  return 0;
}

static int onEncoded(void* session, void* data, unsigned int length, void* bufferId, void* context,
                     unsigned int timestamp) {
  struct Seen* seen = context;
  // The last one is the empty end of the stream.
  const int last = timestamp == kFrames;
  const int fault = session != seen->session || bufferId == NULL || length != (last ? 0 : seen->length) ||
                    (!last && ((unsigned char*)data)[0] != timestamp);
  count(seen, &seen->outputs, fault);
  return 0;
}

static int onDecoded(void* info, void* data, unsigned int length, void* bufferId, void* context,
                     unsigned int timestamp) {
  struct Seen* seen = context;
  const DECODEDDATAINFO* picture = info;
  const int fault = picture->width != seen->width || picture->height != seen->height ||
                    picture->dataType != DECODED_DATA_NATIVE || picture->cropWidth != 0 || length != 3 ||
                    bufferId == NULL || memcmp(data, "abc", 3) != 0 || timestamp >= kFrames;
  count(seen, &seen->outputs, fault);
  return 1;  // of no effect
}

int runEncoderInC(unsigned int length) {
  VideoCodec codec = {.codecType = kVideoCodecH264, .width = kWidth, .height = kHeight, .startBitrate = 500};
  codec.maxFramerate = 30;
  codec.codecSpecific.H264.profile = 66;
  struct Seen seen = {.length = length};
  int result = -1;
  void* encoder = seen.session = encoder_create(&result, &codec);
  CHECK(encoder != NULL && result == OMXI_OK);
  CHECK(omx_interface_register_input_callback(encoder, onInput, &seen) == 0);
  CHECK(omx_interface_register_output_callback(encoder, onEncoded, &seen) == 0);
  CHECK(omx_interface_init(encoder) == 0);
  unsigned char frame[kFrameBytes];
  for (int i = 0; i < kFrames; ++i) {
    memset(frame, i, sizeof(frame));
    CHECK(omx_send_data_frame_to_encoder(encoder, frame, kWidth, kHeight, i) == 0);
    CHECK(waitFor(&seen.inputs, i + 1));
    CHECK(omx_interface_set_config(encoder, CONFIG_BITRATE, 100000) == 0);
  }
  CHECK(waitFor(&seen.outputs, kFrames));
  CHECK(omx_interface_send_end_of_input_flag(encoder, kFrames) == 0);
  CHECK(omx_interface_deinit(encoder) == 0);
  CHECK(omx_interface_error(encoder) == 0);
  CHECK(omx_interface_set_config(encoder, CONFIG_BITRATE, 1) == OMXI_ERR_NO_PLATFORM_WRAPPER);
  CHECK(omx_interface_destroy(encoder) == 0);
  CHECK(seen.faults == 0 && seen.outputs == kFrames + 1);
  return 0;
}

int runDecoderInC(unsigned int width, unsigned int height) {
  struct Seen seen = {.width = width, .height = height};
  int result = -1;
  void* decoder = seen.session = decoder_create(&result, NULL);
  CHECK(decoder != NULL && result == OMXI_OK);
  CHECK(omx_interface_register_input_callback(decoder, onInput, &seen) == 0);
  CHECK(omx_interface_register_output_callback(decoder, onDecoded, &seen) == 0);
  CHECK(omx_interface_init(decoder) == 0);
  char unit[] = "abc";
  for (int i = 0; i < kFrames; ++i) {
    CHECK(omx_interface_send_input_data(decoder, unit, 3, i) == 0);
    CHECK(waitFor(&seen.inputs, i + 1));
    CHECK(waitFor(&seen.outputs, i + 1));
  }
  CHECK(omx_interface_send_end_of_input_flag(decoder, kFrames) == 0);
  CHECK(omx_interface_deinit(decoder) == 0);
  CHECK(omx_interface_destroy(decoder) == 0);
  CHECK(seen.faults == 0 && seen.outputs == kFrames);  // the end of the stream is no picture
  return 0;
}
