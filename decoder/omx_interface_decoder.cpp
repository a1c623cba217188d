// Creation, settings and the end of a decoding session.
#include "decoder/omx_interface_decoder.h"

#include <iterator>
#include <memory>
#include <new>

#include "core/log.h"
#include "core/omx_record.h"
#include "core/session_state.h"
#include "decoder/hardware_version_cache.h"
#include "platform/board_platform_wrapper.h"
#include "platform/hardware_version.h"

OmxInterfaceDecoder::OmxInterfaceDecoder()
    : _queueThreadMessages(new (std::nothrow) SimpleQueue),
      _eventThread(),
      _clipTable(nullptr),
      _eventThreadWaiting(false) {
  _isEncoder = false;
}

OmxInterfaceDecoder::~OmxInterfaceDecoder() {
  end();
  _outputCallback = nullptr;
  freeConvertBuffer();
}

// Ends the session with the event thread in it. The queue goes first, logically: a thread that wakes
// now finds it gone.
void OmxInterfaceDecoder::end() {
  SimpleQueue* queue = nullptr;
  {
    const SessionState::Lock held(_state->lock);
    queue = _queueThreadMessages;
    _queueThreadMessages = nullptr;
  }
  if (_eventThreadWaiting) {
    logError("OmxInterfaceDecoder::~OmxInterfaceDecoder semaphorePost line:%d  \n", 46);
    sem_post(&_semEventQueued);
  }
  endSession();
  _state->joinThread(_state->eventThread, _eventThread);
  if (queue == nullptr) return;
  while (void* unhandled = queue->dequeue()) delete static_cast<android::omx_message*>(unhandled);
  delete queue;
}

int OmxInterfaceDecoder::Create(OmxInterfaceDecoder** out, const char* componentName) {
  *out = nullptr;
  std::unique_ptr<OmxInterfaceDecoder> session;
  try {  // the session's parts and the platform's objects are not all made without exceptions
    session.reset(new (std::nothrow) OmxInterfaceDecoder);
    if (session == nullptr) return OMXI_ERR_CREATE_INTERFACE;
    if (componentName != nullptr) session->_componentName = componentName;
    const int connected = session->setupIOMXConnections();
    if (connected != OMXI_OK) return connected;
  } catch (const std::bad_alloc&) {
    return OMXI_ERR_CREATE_INTERFACE;
  }

  // A component that refuses one of these still decodes; what matters is reported when it is used.
  static_cast<void>(session->setPictureOrder(1));
  switch (cachedHardwareBaseVersion()) {
    case HW_VERSION_MSM8X60:
      static_cast<void>(session->setInputPackingFormat(1));
      break;
    case HW_VERSION_OMAP4:
      logError("g_hwVersion::OMAP4\n");
      static_cast<void>(session->setOutputColorFormat(0));
      break;
    default:
      break;
  }
  *out = session.release();
  return OMXI_OK;
}

int OmxInterfaceDecoder::init() {
  const SessionCall call(*_state);
  if (_state->startThread(_state->eventThread, _eventThread, EventMonitorThread, this) != 0) {
    return OMXI_ERR_CREATE_EVENT_THREAD;
  }
  return OmxInterface::init();
}

int OmxInterfaceDecoder::setInputCompressionFormat(int format) {
  const SessionCall call(*_state);
  // Kept: the size word stays 0; components go by the size argument.
  auto definition = makeUnsizedOmxRecord<OMX_PARAM_PORTDEFINITIONTYPE>();
  definition.nPortIndex = kOmxInputPort;
  android::status_t status =
      _omx->getParameter(_node, OMX_IndexParamPortDefinition, &definition, sizeof(definition));
  if (status != android::OK) {
    return failWith(-1, "OMXINTERFACE - Could not get parameters for Video Compression Format (%d)", status);
  }
  constexpr OMX_VIDEO_CODINGTYPE kCodings[] = {OMX_VIDEO_CodingAVC, OMX_VIDEO_CodingMPEG4,
                                               OMX_VIDEO_CodingH263, OMX_VIDEO_CodingWMV};
  if (format >= 0 && format < static_cast<int>(std::size(kCodings))) {
    definition.format.video.eCompressionFormat = kCodings[format];
  }
  status = _omx->setParameter(_node, OMX_IndexParamPortDefinition, &definition, sizeof(definition));
  if (status != android::OK) return failWith(-1, "OMXINTERFACE - Could not set Video Compression Format");
  return OMXI_OK;
}

int OmxInterfaceDecoder::setPictureOrder(int order) {
  const SessionCall call(*_state);
  const WrapperUse use(*this);
  return use.wrapper() != nullptr ? use.wrapper()->setPictureOrder(order) : OMXI_ERR_NO_PLATFORM_WRAPPER;
}

int OmxInterfaceDecoder::setInputPackingFormat(int format) {
  const SessionCall call(*_state);
  const WrapperUse use(*this);
  return use.wrapper() != nullptr ? use.wrapper()->setInputPackingFormat(format)
                                  : OMXI_ERR_NO_PLATFORM_WRAPPER;
}

int OmxInterfaceDecoder::setOutputColorFormat(int format) {
  const SessionCall call(*_state);
  const WrapperUse use(*this);
  return use.wrapper() != nullptr ? use.wrapper()->setOutputColorFormat(format)
                                  : OMXI_ERR_NO_PLATFORM_WRAPPER;
}

int OmxInterfaceDecoder::getBufferNum() {
  const SessionCall call(*_state);
  OMX_PARAM_PORTDEFINITIONTYPE definition;
  const android::status_t status = readPortDefinition(kOmxInputPort, &definition);
  if (status != android::OK) return failWith(-1, "get OMX_IndexParamPortDefinition InPort Error:%d", status);
  return static_cast<int>(definition.nBufferCountActual);
}
