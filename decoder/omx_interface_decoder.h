// A decoding session: compressed pictures in on port 0, raw pictures out on port 1.
//
// Adds to the session an event thread, which handles what has to wait: above all the reconfiguration
// of the output port when the component, having parsed the stream, reports new output settings. The
// delivery thread only hands events over. Pictures leave on the output thread, described and where
// need be converted for the hardware generation.
#pragma once

#include <pthread.h>
#include <stdint.h>

#include <OMX_Core.h>
#include <media/IOMX.h>

#include "core/omx_interface.h"
#include "core/shared_value.h"
#include "omxbridge/decoded_picture.h"
#include "omxbridge/export.h"

class OMXBRIDGE_EXPORT OmxInterfaceDecoder : public OmxInterface {
 public:
  OmxInterfaceDecoder();
  ~OmxInterfaceDecoder() override;

  // Builds a session, connects it and makes the platform's decoder settings, whose results do not
  // matter. `componentName` is kept, not copied; the component is the platform's. Owner's thread.
  // 0; 2 no memory; else setupIOMXConnections()'s code. On failure *out is null.
  static int Create(OmxInterfaceDecoder** out, const char* componentName);

  // Starts the event thread, then as OmxInterface::init(). 22 if there is no event thread.
  int init() override;

  // The input's compression: 0 H.264, 1 MPEG-4, 2 H.263, 3 WMV; any other value leaves the
  // component's own. Before init(). 0, or -1 if the component refuses.
  int setInputCompressionFormat(int format);

  // Forwarded to the platform wrapper, whose result they return; 36 without a wrapper. Before init().
  int setPictureOrder(int order);
  int setInputPackingFormat(int format);
  int setOutputColorFormat(int format);

  // How many input buffers the component wants, or -1.
  int getBufferNum();

  // The clamp table for colour arithmetic: entry v, for v from -278 to 535, is v clamped to 0..255.
  // The pointer is to entry 0; the table is constant, one for the process, and is never freed.
  unsigned char* initClip();

  // Hands a component event to the event thread. Delivery thread.
  void onOmxObserverEvent(const android::omx_message& message) override;
  // Handles one. Event thread; may wait for the output buffers, without a limit.
  void onEvent(OMX_EVENTTYPE event, unsigned long data1, unsigned long data2) override;
  // Handles a completed command. Event thread. 0; 11 not Executing; 20 or allocateBuffersOnPort()'s
  // code when the output port could not be enabled again.
  int onCommandComplete(OMX_COMMANDTYPE command, unsigned long data);

  // Delivers one picture. Output thread. Always 0: the decoder lets nobody keep a buffer.
  int callOutputCallbackFunction(void* data, unsigned int length, void* bufferId,
                                 unsigned int timestamp) override;
  // Calls the output callback, if there is one, with the picture's description first. Always 0.
  int privateCallOutputCallbackFunction(DECODEDDATAINFO& info, void* data, unsigned int length,
                                        void* bufferId, unsigned int timestamp);

  // The event thread's entry; `session` is an OmxInterfaceDecoder.
  static void* EventMonitorThread(void* session);

 private:
  class Step;

  void end();
  bool eventQueueGone();
  void monitorEvents();
  bool handleNextEvent();
  void onPortSettingsChanged(unsigned long port);
  void onPortEnabled();

  bool reserveConvertBuffer(uint32_t size);
  void freeConvertBuffer();
  int deliverConverted(DECODEDDATAINFO& info, void* data, void* bufferId, unsigned int timestamp);
  int deliverWithCrop(DECODEDDATAINFO& info, void* data, unsigned int length, void* bufferId,
                      unsigned int timestamp);

 public:
  // --- Data. Kept: binaries know these members by their order. ------------------------------------

  SimpleQueue* _queueThreadMessages;  // events for the event thread; owned; null if it could not be made
  pthread_t _eventThread;
  unsigned char* _clipTable;  // the process's table, once asked for
  SharedValue<bool> _eventThreadWaiting;
};
