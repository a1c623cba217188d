// One session with one OpenMAX component in the media server: reaches IOMX, allocates the node,
// configures the ports, shares buffers, drives the states and moves data both ways.
//
// The owner's thread constructs, sets up, calls init(), feeds input, calls deInit() and destroys.
// The media server's messages arrive on a delivery (binder) thread; the session's output thread
// calls the output callback; a decoder's event thread handles what has to wait. Several threads may
// feed. Destruction is safe in any state and while other threads wait inside init(), deInit() or
// sendEndOfInputFlag(): it ends their waits, lets them leave, and only then frees anything. It must
// not happen inside a callback of the same session; neither must init(), deInit() or
// sendEndOfInputFlag().
//
// How the threads share the members: session_state.h.
#pragma once

#include <pthread.h>
#include <semaphore.h>
#include <stdint.h>

#include <OMX_Core.h>
#include <OMX_Video.h>
#include <binder/IMemory.h>
#include <binder/MemoryDealer.h>
#include <media/IOMX.h>
#include <utils/RefBase.h>
#include <utils/Vector.h>

#include "core/buffer_info.h"
#include "core/omx_codec_observer.h"
#include "core/shared_value.h"
#include "core/simple_queue.h"
#include "omxbridge/export.h"
#include "omxbridge/result.h"

class CBoardPlatformWrapper;
struct SessionState;

// Port indices; every per-port array is indexed by them.
constexpr int kOmxInputPort = 0;
constexpr int kOmxOutputPort = 1;

// How a port's buffers come to be (values of _portBufferMode; any other value makes no component
// call and keeps the record with buffer id 0).
enum OmxBufferAllocMode : int32_t {
  OMX_BUFFER_COMPONENT_ALLOCATES =
      0,                         // backed by a block of ours, or with setMPmemInfo()'s heap by theirs alone
  OMX_BUFFER_CLIENT_MEMORY = 1,  // a block of ours, used in place
};

struct OmxFrameSize {
  int32_t width = 0;   // pixels
  int32_t height = 0;  // pixels
};

class OMXBRIDGE_EXPORT OmxInterface : public OmxCodecObserverDelegate {
 public:
  // The application's callbacks. Input: an input buffer came back, or a failure was recorded; the
  // result is ignored. Output: one buffer of output; see callOutputCallbackFunction().
  using InputCallback = int (*)(void* session, void* context);
  using OutputCallback = int (*)(void* sessionOrInfo, void* data, unsigned int length, void* bufferId,
                                 void* context, unsigned int timestamp);

  OmxInterface();
  // Ends every wait and call in progress, reaps the threads, then frees everything and the node.
  ~OmxInterface() override;
  OmxInterface(const OmxInterface&) = delete;
  OmxInterface& operator=(const OmxInterface&) = delete;

  // --- Virtual operations. Kept: binaries call these by their order. ------------------------------

  // Replaces the observer. Called by the observer itself when it gets its delegate.
  void setObserver(android::sp<OmxCodecObserver> observer) override;
  // Sets the heap that the component allocates from. From then on buffers of mode 0 are allocated by
  // the component alone and output is reached by buffer id, not by address.
  void setMPmemInfo(android::sp<android::IMemoryHeap> heap) override;

  // Component messages; delivery thread. They record what happened and wake; they never wait.
  void onOmxObserverEvent(const android::omx_message& message) override;
  void onOmxObserverFillBufferDone(const android::omx_message& message) override;
  void onOmxObserverEmptyBufferDone(const android::omx_message& message) override;

  // What a session does about a component event on a thread that may wait. Nothing here.
  virtual void onEvent(OMX_EVENTTYPE event, unsigned long data1, unsigned long data2);

  // Brings the component to Executing: output thread, Idle, buffers, Executing, every output buffer
  // to the component. Owner's thread; blocks until the component has changed state, without a limit.
  // 0; 23 no output thread; 20 or 21 a state command was refused or the session ended meanwhile;
  // 13 or 15 from allocateBuffersOnPort(); 8 an output buffer was refused.
  // What a failed init() did stays until destruction; a second one reuses a running thread.
  virtual int init();

  // Brings the component back to Loaded and frees the buffers. First waits for the end of output
  // unless a failure is recorded. Owner's thread; blocks, without a limit.
  // The recorded failure (0 if none); 20 a state command was refused, or the session ended meanwhile
  // with no failure recorded. After a completed deInit(): the recorded failure, nothing is done.
  virtual int deInit();

  // Hands one buffer of output to the application. Output thread, no lock held.
  // The base form gives (session, data, length in bytes, buffer id, context, timestamp) to the output
  // callback; without one it returns 0. 0: the buffer goes back to the component. Anything else: the
  // application keeps it until returnIomxOutputBuffer().
  virtual int callOutputCallbackFunction(void* data, unsigned int size, void* bufferId,
                                         unsigned int timestamp);

  // --- Connection and lifecycle (owner's thread) --------------------------------------------------

  // Reaches IOMX through the media server. 0 (at once if it already has), 1 no server, 3 no IOMX.
  int acquireOmxFromMediaPlayer();
  // 0 if the server lists a component of exactly this name, 3 if it cannot be reached, 6 if not.
  int queryForOmxComponent(const char* name);
  // 1 if the component exists, else 0; `result` gets queryForOmxComponent()'s code. Any thread.
  static int OmxComponentCanBeAcquired(const char* name);
  static int OmxComponentCanBeAcquired(const char* name, int& result);
  // Connects, finds and allocates the node, creates the observer and the platform wrapper. Once a
  // session. 0; 3 no IOMX; 6 no such component; 4 the node was refused; 5 no observer; 36 no
  // wrapper for this platform. Failures leave what was made to the destructor.
  int setupIOMXConnections();

  // Records a failure: stores the code, ends deInit()'s wait for the end of output, calls the input
  // callback. Any thread.
  void setThreadError(int code);
  // The last failure recorded; 0 while none. Any thread.
  int threadError() const { return _threadError; }

  // Set (or clear, with null) a callback together with its context. Any thread.
  void registerInputCallback(InputCallback callback, void* context);
  void registerOutputCallback(OutputCallback callback, void* context);

  bool isEncoder() const { return _isEncoder; }
  // Fixes how each port's buffers are allocated (OmxBufferAllocMode). For the platform wrapper,
  // before any buffer is.
  void setPortBufferModes(int32_t inputMode, int32_t outputMode);

  // --- Ports and buffers (owner's thread; the event thread for a reconfiguration) -----------------

  // Sets a port's picture geometry in pixels, its frame rate in frames per second (0 or less: as it
  // is) and semi-planar YUV 4:2:0. 0; 13 the definition could not be read (silent); 14 not written.
  int setupPortParameters(int port, int width, int height, int frameRate);
  // Prints a port's definition to the log and to standard output. A diagnostic aid; the result means
  // nothing.
  int debugPortParameters(int port);
  // Allocates a port's buffers and appends their records. 0; 13 no definition, or more than 10000
  // buffers; 15 no memory, or the component refused. Records made before a failure stay.
  int allocateBuffersOnPort(int port);
  // Frees a port's buffers, last first, and drops undelivered output. Waits for uses in progress to
  // leave (calls to IOMX, copies, a running output callback). The last status that was not 0, else 0.
  int freeBuffersOnPort(unsigned long port);
  // True when no buffer of the port is with the component or reserved. Any thread.
  bool portBuffersHaveBeenReturned(int port);

  // --- Input (any number of feeding threads; never blocks but for sendEndOfInputFlag) ---------------
  // Time stamps reach the component unchanged, sign included; the caller's unit is the component's.

  // Hands out a free input buffer: its handle and its memory, writable until it is sent. 0; -1 none is
  // free; -2 the end of input has been sent. On failure both are null.
  int reserveInputBuffer(void** handle, void** data);
  // Sends `length` bytes of a reserved buffer as one whole frame or access unit. 0; -1 refused by the
  // component (the buffer stays handed out), or the handle is none of ours, or the length is negative
  // or more than the buffer holds (nothing is sent).
  int sendInputBuffer(void* handle, int length, int timestamp);
  // Sends a reserved buffer, empty, as the last one. Does not close the input. 0 or -1 as above.
  int sendFinalBuffer(void* handle, int timestamp);
  // Gives a reserved buffer back unsent: it is free again. Any other handle changes nothing.
  void releaseInputBuffer(void* handle);
  // Bytes that one input buffer holds; 0 before they are allocated. Any thread.
  uint32_t inputBufferCapacity();
  // Copies `length` bytes into a free buffer and sends it. 0, also when the end of input has been sent
  // and the data is dropped; -1 none is free, or null data with a length, or more than a buffer
  // holds; -2 refused by the component (the buffer stays handed out).
  int sendInputData(void* data, unsigned int length, int timestamp);
  // Sends an empty buffer that ends the stream, waiting for a free one without a limit, and closes the
  // input. From the call on, delivered output is not given back to the component: let the pictures in
  // flight come out first. 0; -2 refused, or the session ended meanwhile.
  int sendEndOfInputFlag(int timestamp);

  // --- Output -------------------------------------------------------------------------------------

  // Gives one output buffer to the component unless it has it already or the port is being
  // reconfigured. `record` is one of this session's. 0 or 8. Any thread.
  int fillOutputBuffer(BufferInfo* record);
  // The same for all of them, in order, up to the first that is refused. 0 or 8.
  int fillOutputBuffers();
  // Gives back a buffer that the output callback kept. An unknown id changes nothing. Any thread.
  void returnIomxOutputBuffer(void* bufferId);

  // The output thread's entry; `session` is an OmxInterface.
  static void* DataOutputThread(void* session);

 protected:
  // Ends the session: drops messages, ends all waits, lets calls and threads leave and reaps them.
  // The first statement of every destructor (a base class's comes too late for virtual calls); does
  // nothing when repeated.
  void endSession();

  // Calls of the platform wrapper are made through this: it keeps the wrapper from being deleted.
  class WrapperUse {
   public:
    explicit WrapperUse(OmxInterface& session);
    ~WrapperUse();
    WrapperUse(const WrapperUse&) = delete;
    WrapperUse& operator=(const WrapperUse&) = delete;
    CBoardPlatformWrapper* wrapper() const { return _wrapper; }  // null when there is none (any more)

   private:
    SessionState& _state;
    CBoardPlatformWrapper* _wrapper;
  };

  // Reads the definition of `port` into a fresh record.
  android::status_t readPortDefinition(int port, OMX_PARAM_PORTDEFINITIONTYPE* definition);

  // --- With the lock of _state held ---------------------------------------------------------------
  BufferInfo* findRecord(int port, android::IOMX::buffer_id id);
  bool allReturned(int port) const;
  bool outputDelivered() const;  // nothing queued, nothing being delivered
  void wakeIfOutputReturned();

 private:
  int commandState(int32_t state);
  bool awaitState();
  void releaseWrapper();

  android::status_t allocateBuffer(int port, android::sp<android::IMemory>& block, uint32_t size,
                                   android::IOMX::buffer_id* id, void** data);
  int allocateBuffers(int port);
  void flushOutputQueue();

  BufferInfo* claimInputBuffer();
  BufferInfo* inputRecord(void* handle);
  int emptyBuffer(android::IOMX::buffer_id id, uint32_t length, uint32_t flags, int timestamp,
                  const char* step, int refused);
  int sendReserved(void* handle, int length, uint32_t flags, int timestamp, const char* step);

  int submitOutputBuffer(android::IOMX::buffer_id id);
  bool queueForDelivery(android::IOMX::buffer_id id);
  bool awaitsDelivery(android::IOMX::buffer_id id) const;
  size_t queuedOutputCount();
  bool sessionEnding();
  bool deliverNext(SimpleQueue& refill);
  bool outputPass();

 public:
  // --- Data. Kept: binaries know these members by their order. Use the operations above. ----------

  android::Vector<BufferInfo> _portBuffers[2];
  const char* _componentName;  // as given at a decoder's creation; the node is chosen by the platform
  int32_t _portBufferMode[2];  // OmxBufferAllocMode
  SharedValue<OmxResult> _threadError;
  SharedValue<bool> _inputClosed;
  SharedValue<bool> _endOfOutputReached;
  SharedValue<bool> _deinitDone;
  SharedValue<bool> _portReconfiguring;
  SimpleQueue* _queueOutputData;  // ids of filled output buffers; owned; null if it could not be made
  android::sp<android::IOMX> _omx;
  android::IOMX::node_id _node;
  android::sp<OmxCodecObserver> _observer;
  android::sp<android::IMemoryHeap> _mpMemHeap;
  android::sp<android::MemoryDealer> _memoryDealer[2];
  InputCallback _inputCallback;
  void* _inputCallbackContext;
  OutputCallback _outputCallback;
  void* _outputCallbackContext;
  unsigned char* _outputConvertBuffer;  // the decoder's
  uint32_t _outputConvertBufferSize;
  SharedValue<int32_t> _omxState;  // OMX_STATETYPE as last reported by a completed state command
  pthread_t _outputThread;
  sem_t _semStateChanged;
  sem_t _semEventQueued;
  sem_t _semReserved3;  // Kept: never posted; holds the place of a member that binaries count on
  sem_t _semOutputDataReady;
  sem_t _semInputBuffersReturned;
  sem_t _semOutputBuffersReturned;
  sem_t _semEndOfOutput;
  sem_t _semInputBufferFree;
  sem_t _semReserved9;             // Kept: as _semReserved3
  OmxFrameSize _portFrameSize[2];  // pixels
  SharedValue<bool> _endOfInputPending;
  CBoardPlatformWrapper* _platformWrapper;  // owned
  bool _isEncoder;
  SessionState* _state;  // owned; everything that the members above do not hold
};
