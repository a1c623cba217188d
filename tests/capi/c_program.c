#include "tests/capi/c_program.h"

#include <pthread.h>
#include <string.h>
#include <time.h>

#include "omxbridge/omxbridge.h"

enum { kFrames = 20, kWidth = 176, kHeight = 144, kFrameBytes = kWidth * kHeight * 3 / 2, kWaitSeconds = 20 };

// What the callbacks saw.
struct Seen {
  pthread_mutex_t lock;
  pthread_cond_t changed;
  int inputs;
  int outputs;
  int faults;
  void* session;
  uint32_t width;  // of the pictures to come
  uint32_t height;
  unsigned int length;  // of the encoder's output to come, bytes
};

typedef struct VideoCodec VideoCodec;
typedef struct VideoCodecH264 VideoCodecH264;
const size_t cRecordLayout[] = RECORD_LAYOUT;
const size_t cRecordLayoutCount = sizeof(cRecordLayout) / sizeof(cRecordLayout[0]);

#define CHECK(condition)               \
  do {                                 \
    if (!(condition)) return __LINE__; \
  } while (0)

static void initSeen(struct Seen* seen) {
  memset(seen, 0, sizeof(*seen));
  pthread_mutex_init(&seen->lock, NULL);
  pthread_cond_init(&seen->changed, NULL);
}

static void count(struct Seen* seen, int* counter, int fault) {
  pthread_mutex_lock(&seen->lock);
  ++*counter;
  seen->faults += fault;
  pthread_cond_broadcast(&seen->changed);
  pthread_mutex_unlock(&seen->lock);
}

static int waitFor(struct Seen* seen, const int* counter, int value) {
  struct timespec limit;
  clock_gettime(CLOCK_REALTIME, &limit);
  limit.tv_sec += kWaitSeconds;
  pthread_mutex_lock(&seen->lock);
  int error = 0;
  while (*counter < value && error == 0) error = pthread_cond_timedwait(&seen->changed, &seen->lock, &limit);
  const int reached = *counter >= value;
  pthread_mutex_unlock(&seen->lock);
  return reached;
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

  struct Seen seen;
  initSeen(&seen);
  seen.length = length;
  int result = -1;
  void* encoder = encoder_create(&result, &codec);
  CHECK(encoder != NULL && result == OMXI_OK);
  seen.session = encoder;
  CHECK(omx_interface_register_input_callback(encoder, onInput, &seen) == 0);
  CHECK(omx_interface_register_output_callback(encoder, onEncoded, &seen) == 0);
  CHECK(omx_interface_init(encoder) == 0);
  unsigned char frame[kFrameBytes];
  for (int i = 0; i < kFrames; ++i) {
    memset(frame, i, sizeof(frame));
    CHECK(omx_send_data_frame_to_encoder(encoder, frame, kWidth, kHeight, i) == 0);
    CHECK(waitFor(&seen, &seen.inputs, i + 1));
    CHECK(omx_interface_set_config(encoder, CONFIG_BITRATE, 100000) == 0);
  }
  CHECK(waitFor(&seen, &seen.outputs, kFrames));
  CHECK(omx_interface_send_end_of_input_flag(encoder, kFrames) == 0);
  CHECK(omx_interface_deinit(encoder) == 0);
  CHECK(waitFor(&seen, &seen.outputs, kFrames + 1));
  CHECK(omx_interface_error(encoder) == 0);
  CHECK(omx_interface_set_config(encoder, CONFIG_BITRATE, 1) == OMXI_ERR_NO_PLATFORM_WRAPPER);
  CHECK(omx_interface_destroy(encoder) == 0);
  CHECK(seen.faults == 0 && seen.outputs == kFrames + 1);
  return 0;
}

int runDecoderInC(unsigned int width, unsigned int height) {
  struct Seen seen;
  initSeen(&seen);
  seen.width = width;
  seen.height = height;
  int result = -1;
  void* decoder = decoder_create(&result, NULL);
  CHECK(decoder != NULL && result == OMXI_OK);
  seen.session = decoder;
  CHECK(omx_interface_get_buffer_number(decoder) > 0);
  CHECK(omx_interface_register_input_callback(decoder, onInput, &seen) == 0);
  CHECK(omx_interface_register_output_callback(decoder, onDecoded, &seen) == 0);
  CHECK(omx_interface_init(decoder) == 0);
  char unit[] = "abc";
  for (int i = 0; i < kFrames; ++i) {
    if (i % 2 == 0) {
      CHECK(omx_interface_send_input_data(decoder, unit, 3, i) == 0);
    } else {
      void* buffer = NULL;
      void* data = NULL;
      CHECK(omx_interface_reserve_input_buffer(decoder, &buffer, &data) == 0);
      memcpy(data, unit, 3);
      CHECK(omx_interface_send_input_buffer(decoder, buffer, 3, i) == 0);
    }
    CHECK(waitFor(&seen, &seen.inputs, i + 1));
    CHECK(waitFor(&seen, &seen.outputs, i + 1));
  }
  CHECK(omx_interface_send_end_of_input_flag(decoder, kFrames) == 0);
  CHECK(omx_interface_deinit(decoder) == 0);
  CHECK(omx_interface_destroy(decoder) == 0);
  CHECK(seen.faults == 0 && seen.outputs == kFrames);  // the end of the stream is no picture
  return 0;
}
