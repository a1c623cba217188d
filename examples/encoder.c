/* A minimal encoder: ten seconds of a moving pattern, through the device's H.264 encoder, into a file.
 *
 *   encoder OUTPUT.264
 */
#include <omxbridge/omxbridge.h>
#include <pthread.h>
#include <stdio.h>
#include <stdlib.h>
#include <string.h>

enum { kWidth = 640, kHeight = 480, kFramesPerSecond = 30, kFrames = 10 * kFramesPerSecond };

typedef struct Encoder {
  FILE* file;
  pthread_mutex_t mutex; /* guards what follows */
  pthread_cond_t moved;
  int returned; /* input buffers that came back */
  int outputs;
} Encoder;

/* On a thread of the platform's: an input buffer is free again, or something failed. */
static int onInput(void* session, void* context) {
  Encoder* encoder = context;
  (void)session;
  pthread_mutex_lock(&encoder->mutex);
  ++encoder->returned;
  pthread_cond_broadcast(&encoder->moved);
  pthread_mutex_unlock(&encoder->mutex);
  return 0;
}

/* On the session's output thread: a coded picture. 0 gives the buffer back to the component. */
static int onOutput(void* session, void* data, unsigned int length, void* bufferId, void* context,
                    unsigned int timestamp) {
  Encoder* encoder = context;
  (void)session, (void)bufferId, (void)timestamp;
  if (length == 0) return 0;
  fwrite(data, 1, length, encoder->file);
  pthread_mutex_lock(&encoder->mutex);
  ++encoder->outputs;
  pthread_cond_broadcast(&encoder->moved);
  pthread_mutex_unlock(&encoder->mutex);
  return 0;
}

/* A semi-planar frame: a diagonal that wanders, on grey. */
static void draw(unsigned char* frame, int number) {
  for (int y = 0; y < kHeight; ++y) {
    for (int x = 0; x < kWidth; ++x) frame[y * kWidth + x] = (unsigned char)(x + y + 4 * number);
  }
  memset(frame + kWidth * kHeight, 128, kWidth * kHeight / 2);
}

/* Sends a frame as soon as a buffer is free. */
static int sendFrame(void* session, Encoder* encoder, const unsigned char* frame, int number) {
  for (;;) {
    pthread_mutex_lock(&encoder->mutex);
    const int before = encoder->returned;
    pthread_mutex_unlock(&encoder->mutex);
    const int timestamp = (int)(1000000LL * number / kFramesPerSecond);
    const int sent =
        omx_interface_send_input_data(session, (void*)frame, kWidth * kHeight * 3 / 2, timestamp);
    if (sent != -1 || omx_interface_error(session) != OMXI_OK) return sent;
    pthread_mutex_lock(&encoder->mutex);
    while (encoder->returned == before) pthread_cond_wait(&encoder->moved, &encoder->mutex);
    pthread_mutex_unlock(&encoder->mutex);
  }
}

int main(int argc, char** argv) {
  static unsigned char frame[kWidth * kHeight * 3 / 2];
  Encoder encoder = {.mutex = PTHREAD_MUTEX_INITIALIZER, .moved = PTHREAD_COND_INITIALIZER};
  if (argc != 2 || (encoder.file = fopen(argv[1], "wb")) == NULL) {
    fprintf(stderr, "usage: encoder OUTPUT.264\n");
    return 2;
  }
  OmxVideoCodec settings = {.codecType = kVideoCodecH264, .width = kWidth, .height = kHeight};
  settings.startBitrate = 1000; /* kilobits per second */
  settings.maxFramerate = kFramesPerSecond;
  settings.codecSpecific.H264.profile = 66; /* Baseline */
  settings.codecSpecific.H264.keyFrameInterval = 60;
  settings.codecSpecific.H264.referenceFrames = 1;

  int result = OMXI_OK;
  void* session = encoder_create(&result, &settings);
  if (session == NULL) {
    fprintf(stderr, "no encoder, code %d: %s\n", result, resultDescription(result));
    return 1;
  }
  omx_interface_register_input_callback(session, onInput, &encoder);
  omx_interface_register_output_callback(session, onOutput, &encoder);
  result = omx_interface_init(session);
  int sent = 0;
  for (int i = 0; i < kFrames && result == OMXI_OK; ++i) {
    draw(frame, i);
    if (sendFrame(session, &encoder, frame, i) != 0) break;
    ++sent;
  }
  if (result == OMXI_OK) {
    /* What is under way comes out first: after the end of input no output buffer goes back. */
    pthread_mutex_lock(&encoder.mutex);
    while (encoder.outputs < sent && omx_interface_error(session) == OMXI_OK) {
      pthread_cond_wait(&encoder.moved, &encoder.mutex);
    }
    pthread_mutex_unlock(&encoder.mutex);
    omx_interface_send_end_of_input_flag(session, 0);
    result = omx_interface_deinit(session);
  }
  omx_interface_destroy(session);
  fclose(encoder.file);
  printf("%d frames sent, %d coded pictures: %s\n", sent, encoder.outputs, resultDescription(result));
  return result == OMXI_OK && encoder.outputs == kFrames ? 0 : 1;
}
