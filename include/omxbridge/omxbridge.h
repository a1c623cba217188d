/// @file
/// The C interface of the codec bridge: hardware H.264 encoding and decoding sessions. For C and C++.
///
/// A session is an opaque handle. Its life:
///   create -> register callbacks -> omx_interface_init -> feed input, take output, change settings
///   -> omx_interface_send_end_of_input_flag -> omx_interface_deinit -> omx_interface_destroy
/// Creation, init, deinit and destruction belong to one thread, the session's owner. The feeding
/// functions may be called on any number of threads, the settings on any thread, all of them while the
/// session runs. A session may be destroyed in any state, also while other threads are inside init,
/// deinit or the end of input, whose waits it ends; no call may begin after destruction has.
///
/// Results are codes of result.h, 0 for success; the feeding functions have 0, -1 and -2 of their own.
/// A null handle gives OMXI_ERR_CREATE_INTERFACE (2), where nothing else is said. A handle of the wrong
/// kind (a decoder's given to an encoder's function or the other way round) is the caller's error and
/// not noticed.
///
/// Callbacks run on threads of the session's and of the platform's. They must not call, for the same
/// session: omx_interface_destroy, omx_interface_init, omx_interface_deinit,
/// omx_interface_send_end_of_input_flag, or after the end of input omx_send_data_frame_to_encoder. All
/// of these wait for what only the callback's return brings. For the same reason whoever calls one of them
/// must not hold a lock that a callback takes. Everything else is allowed.
#pragma once

#include <stdint.h>

#include "omxbridge/codec_settings.h"
#include "omxbridge/decoded_picture.h"
#include "omxbridge/export.h"
#include "omxbridge/hardware_version.h"
#include "omxbridge/result.h"

#ifdef __cplusplus
/// The settings of an encoder, by a name that C and C++ share.
typedef webrtc::VideoCodec OmxVideoCodec;
extern "C" {
#else
typedef struct VideoCodec OmxVideoCodec;
#endif

/// @name Callbacks
/// @{

/// An input buffer came back from the component and is free again (once for each), or a failure was
/// recorded: see omx_interface_error(). `session` is the handle, `context` as registered. The result is
/// ignored. Runs on a thread of the platform that delivers the component's messages, one call after the
/// other; for a recorded failure also on a thread of the session. Be quick: while it runs, no other
/// message of the component gets through.
typedef int (*OmxInputCallback)(void* session, void* context);

/// One buffer of output. Runs on the session's output thread, in the order in which the component filled
/// the buffers; the next one waits until it returns. Feeding input from here is fine, waiting without a
/// limit for a free input buffer is not: the component may need the output buffers that stand in line
/// behind this one before it takes any input.
/// - sessionOrInfo: of an encoder the handle; of a decoder a DECODEDDATAINFO that describes the picture,
///   valid during the call.
/// - data, length: the output, `length` bytes, valid during the call. Of an encoder H.264 byte stream
///   (Annex B), as the component cuts it: usually one coded picture, on some components parameter sets in a
///   buffer of their own; the last buffer of a stream may be empty. Of a decoder one picture, laid out as
///   DECODEDDATAINFO.dataType says, never empty.
/// - bufferId: names the buffer.
/// - context: as registered.
/// - timestamp: the low 32 bits of the time stamp of the input that the output was made from.
///
/// An encoder's callback returns 0 when it is done with the data. Any other value keeps the buffer, and
/// its data stays valid until it is given back with OmxInterface::returnIomxOutputBuffer(bufferId); the
/// component works with one buffer less meanwhile. Only C++ code built against the session classes can
/// give a buffer back: in C, copy the data and return 0.
/// A decoder ignores the result: copy what is needed during the call.
typedef int (*OmxOutputCallback)(void* sessionOrInfo, void* data, unsigned int length, void* bufferId,
                                 void* context, unsigned int timestamp);

/// @}

/// @name Creation and life
/// @{

/// Creates a decoder on the platform's H.264 component, with the input port set up for pictures up to
/// 1920x1088 (640x480 on MSM7x30 and MSM8x55). `componentName` (may be null) is kept, not copied, and
/// has no influence on the choice. `*result` (`result` may be null) gets 0, or the code of what failed:
/// 2, 3, 4, 5, 6, 13, 14 or 36. Null on failure, with one error line in the log.
OMXBRIDGE_EXPORT void* decoder_create(int* result, const char* componentName);

/// Creates an encoder on the platform's H.264 component and configures it from `codec`, which is read
/// during the call only; on TI devices a maxFramerate below 2 in it becomes 2. `*result` (`result` may
/// be null) gets 0, or the code of what failed: 28 if `codec` is null; 2, 3, 4, 5, 6, 13, 14, 17, 18,
/// 34, 35 or 36; -1 for any setting that a TI component refuses. Null on failure, with one error line in
/// the log.
OMXBRIDGE_EXPORT void* encoder_create(int* result, OmxVideoCodec* codec);

/// Starts the session: brings the component to its executing state and gives it the output buffers.
/// Owner's thread. Blocks until the component has got there, without a limit. Not twice after success;
/// after a failure it may be tried again.
/// 0; 22, 23 a thread could not be started; 20, 21 the component refuses the state, or the session was
/// destroyed meanwhile; 13, 15 no buffers; 8 an output buffer was refused.
OMXBRIDGE_EXPORT int omx_interface_init(void* handle);

/// Stops the session: waits until the last output has been delivered (which takes an end of input before
/// it, or a recorded failure), brings the component back and frees the buffers. Owner's thread. Blocks
/// without a limit. The settings are out of reach afterwards (36); the handle stays valid.
/// The recorded failure, 0 if there is none; 20 the component refuses the state, or the session was
/// destroyed meanwhile.
OMXBRIDGE_EXPORT int omx_interface_deinit(void* handle);

/// Ends the session in whatever state it is and frees everything that belongs to it. Does not stop it
/// first: undelivered output is lost. Blocks until running callbacks and calls have returned. Always 0,
/// also for a null handle.
OMXBRIDGE_EXPORT int omx_interface_destroy(void* handle);

/// The failure that was recorded last outside of a call (24 the component returned a buffer that it does
/// not have, 26 buffers could not be freed, 27 the component reported an error, and the decoder's 11,
/// 13, 15 and 20 while its output changes size); 0 while there is none. Any thread.
OMXBRIDGE_EXPORT int omx_interface_error(void* handle);

/// 1 if the media server has a component of exactly this name, else 0. Any thread; no session needed.
OMXBRIDGE_EXPORT int omx_component_is_available(const char* name);

/// @}

/// @name Callbacks, registering
/// @{

/// Sets the session's input callback and its context together; a null callback takes it away. Any thread; a
/// call in progress still goes to the former one. 0.
OMXBRIDGE_EXPORT int omx_interface_register_input_callback(void* handle, OmxInputCallback callback,
                                                           void* context);

/// Sets the output callback, as omx_interface_register_input_callback() the input callback.
OMXBRIDGE_EXPORT int omx_interface_register_output_callback(void* handle, OmxOutputCallback callback,
                                                            void* context);

/// @}

/// @name Input
///
/// A decoder takes one access unit of H.264 byte stream (Annex B) a buffer, unless its packing format
/// says otherwise. An encoder takes one frame of semi-planar YUV 4:2:0 a buffer: `width` x `height` bytes
/// of luma, then half as many of interleaved chroma, Cb first (NV12), without padding between rows. On
/// MSM8x60 (HW_VERSION_MSM8X60) the chroma begins at the next multiple of 2048 bytes behind the luma:
/// omx_send_data_frame_to_encoder() sees to that, whoever fills buffers himself has to.
///
/// Time stamps reach the component unchanged, sign included, and come out with the output that was made
/// from the input. Their unit is the component's; OpenMAX means microseconds.
///
/// All but the end of input return at once. Any thread, several at a time.
/// @{

/// Hands out a free input buffer: `*buffer` is its handle, `*data` its memory, to be written until it is
/// sent. Every buffer handed out has to be sent. 0; -1 none is free; -2 the end of input has been sent.
/// On failure both are null.
OMXBRIDGE_EXPORT int omx_interface_reserve_input_buffer(void* handle, void** buffer, void** data);

/// Sends the first `length` bytes of a reserved buffer. 0; -1 the component refused it (the buffer is not
/// free again), or the buffer is none of this session's, or does not hold `length` bytes.
OMXBRIDGE_EXPORT int omx_interface_send_input_buffer(void* handle, void* buffer, int length, int timestamp);

/// Sends a reserved buffer, empty, as the last of the stream; what was written to it is not sent. The
/// input stays open for whatever the component makes of it. 0 or -1 as above.
OMXBRIDGE_EXPORT int omx_interface_send_final_buffer(void* handle, void* buffer, int timestamp);

/// Copies `length` bytes into a free buffer and sends them. 0, also when the end of input has been sent
/// and the data is dropped; -1 none is free, or the data is larger than a buffer; -2 refused by the
/// component.
OMXBRIDGE_EXPORT int omx_interface_send_input_data(void* handle, void* data, unsigned int length,
                                                   int timestamp);

/// Ends the input: sends the mark after which the component puts out what it still has and the last
/// output. Blocks while no input buffer is free, without a limit. From the call on, output buffers are
/// no longer given back to the component: let the output of what was fed come out first, or the last
/// output may never come. 0; -2 refused by the component, or the session was destroyed meanwhile.
OMXBRIDGE_EXPORT int omx_interface_send_end_of_input_flag(void* handle, int timestamp);

/// Copies one raw frame (semi-planar YUV 4:2:0 without padding, see above) into a free buffer of an
/// encoder, laid out as the hardware generation takes it, and sends it.
/// The recorded failure, which is 0 while there is none, also when no buffer was free and the frame was
/// dropped: whoever has to know reserves, fills and sends himself. -1 the frame is null, empty or larger
/// than an input buffer (with an error line), or the component refused it. 2 for a null handle.
/// After the end of input this does not return before a failure is recorded or the session is destroyed
/// (-1): it tries again and again, yielding the processor in between. Do not send frames after the end.
OMXBRIDGE_EXPORT int omx_send_data_frame_to_encoder(void* handle, const unsigned char* frame, int width,
                                                    int height, int timestamp);

/// @}

/// @name Settings
/// @{

/// Changes one item of a running encoder, at once. The unit of `value` goes with the item: CONFIGTYPE.
/// 0; 33 the component refuses it, or there is no such item; 36 after deinit.
OMXBRIDGE_EXPORT int omx_interface_set_config(void* handle, CONFIGTYPE type, unsigned long value);

/// How many input buffers a decoder's component works with; -1 if it does not say.
OMXBRIDGE_EXPORT int omx_interface_get_buffer_number(void* handle);

/// @}

/// @name Input semaphore
///
/// One counter for the whole process of input buffers that came back, for sessions without an input
/// callback of their own. Safe in any order and on any thread: set up twice it counts from 0 again, and
/// posts before set-up or after teardown go nowhere.
/// @{

/// Sets the semaphore up, at 0, and has the session (unless the handle is null) post it for every input
/// buffer that comes back: this takes the place of its input callback. 0.
OMXBRIDGE_EXPORT int omx_setup_input_semaphore(void* handle);
/// Posts the semaphore once more and takes it down. Sessions that post it may go on. 0.
OMXBRIDGE_EXPORT int omx_teardown_input_semaphore(void);

/// When the library was built: the compiler's date and time, as in "Sep 12 2013, 14:59:54".
OMXBRIDGE_EXPORT extern const char* const g_strPrgCreatTime;
/// @}

#ifdef __cplusplus
}  // extern "C"

// For C++ only. Kept: these three have C++ names, by which binaries know them.

/// An OmxInputCallback that posts the input semaphore; both arguments are ignored. 0.
OMXBRIDGE_EXPORT int semaphoreEmptyBufferPost(void* session, void* context);

/// What a decoder is fed, before init: 0 H.264, 1 MPEG-4, 2 H.263, 3 WMV; any other value leaves the
/// component's own. 0; -1 if the component refuses.
OMXBRIDGE_EXPORT int omx_decoder_set_input_compression_format(void* handle, int format);

/// How it is cut into buffers, before init: 1 one whole picture a buffer, 2 anywhere, else unspecified.
/// Of no effect on TI devices. 0; 31 if the component refuses; 36 after deinit.
OMXBRIDGE_EXPORT int omx_decoder_set_input_packing_format(void* handle, int format);
#endif
