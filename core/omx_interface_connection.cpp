// Construction, the way to the component, destruction.
#include <new>
#include <utility>

#include <binder/IServiceManager.h>
#include <binder/ProcessState.h>
#include <media/IMediaPlayerService.h>
#include <utils/List.h>
#include <utils/String16.h>

#include "core/log.h"
#include "core/omx_interface.h"
#include "core/session_state.h"
#include "platform/board_platform_wrapper.h"

using android::IMediaPlayerService;
using android::IOMX;
using android::sp;

OmxInterface::OmxInterface()
    : _componentName(nullptr),
      _portBufferMode{0, 0},
      _threadError(OMXI_OK),
      _inputClosed(false),
      _endOfOutputReached(false),
      _deinitDone(false),
      _portReconfiguring(false),
      _queueOutputData(nullptr),
      _node(nullptr),
      _inputCallback(nullptr),
      _inputCallbackContext(nullptr),
      _outputCallback(nullptr),
      _outputCallbackContext(nullptr),
      _outputConvertBuffer(nullptr),
      _outputConvertBufferSize(0),
      _omxState(0),
      _outputThread(),
      _endOfInputPending(false),
      _platformWrapper(nullptr),
      _isEncoder(false),
      _state(new SessionState) {
  for (sem_t* semaphore :
       {&_semStateChanged, &_semEventQueued, &_semReserved3, &_semOutputDataReady, &_semInputBuffersReturned,
        &_semOutputBuffersReturned, &_semEndOfOutput, &_semInputBufferFree, &_semReserved9}) {
    sem_init(semaphore, 0, 0);
  }
  _queueOutputData = new (std::nothrow) SimpleQueue;
  if (_queueOutputData == nullptr) {
    logError("new memory _queueOutputData fail in OmxInterface::OmxInterface() ! ");
  }
}

OmxInterface::~OmxInterface() {
  endSession();
  _observer.clear();
  for (auto& dealer : _memoryDealer) dealer.clear();
  for (sem_t* semaphore :
       {&_semStateChanged, &_semEventQueued, &_semReserved3, &_semOutputDataReady, &_semInputBuffersReturned,
        &_semOutputBuffersReturned, &_semEndOfOutput, &_semInputBufferFree, &_semReserved9}) {
    sem_destroy(semaphore);
  }
  delete _queueOutputData;
  if (_node != nullptr && _omx != nullptr) static_cast<void>(_omx->freeNode(_node));  // nobody to tell
  releaseWrapper();
  _inputClosed = true;
  delete _state;
}

void OmxInterface::endSession() {
  {
    const SessionState::Lock held(_state->lock);
    _state->ending = true;
    _state->left.notify_all();
  }
  // No message comes in from here on, not even one that the server sends after freeNode().
  for (const sp<OmxCodecObserver>& observer : {_state->nodeObserver, _observer}) {
    if (observer != nullptr) observer->detach();
  }
  for (sem_t* semaphore : {&_semStateChanged, &_semEventQueued, &_semOutputDataReady,
                           &_semOutputBuffersReturned, &_semEndOfOutput, &_semInputBufferFree}) {
    sem_post(semaphore);
  }
  {
    SessionState::Lock held(_state->lock);
    _state->left.wait(held, [this] {
      return _state->calls == 0 && !_state->outputThread.running && !_state->eventThread.running;
    });
  }
  _state->joinThread(_state->outputThread, _outputThread);
}

int OmxInterface::acquireOmxFromMediaPlayer() {
  const SessionCall call(*_state);
  if (_omx != nullptr) return OMXI_OK;
  const sp<IMediaPlayerService> service = android::interface_cast<IMediaPlayerService>(
      android::defaultServiceManager()->getService(android::String16("media.player")));
  if (service == nullptr) {
    return failWith(OMXI_ERR_MEDIA_PLAYER_SERVICE, "OMXINTERFACE: CANNOT ACQUIRE MEDIA PLAYER SERVICE");
  }
  _omx = service->getOMX();
  if (_omx == nullptr) {
    return failWith(OMXI_ERR_IOMX, "OMXINTERFACE: MEDIA PLAYER SERVICE CANNOT GET IOMX INTERFACE");
  }
  return OMXI_OK;
}

int OmxInterface::queryForOmxComponent(const char* name) {
  const SessionCall call(*_state);
  // Kept: applications see one code for every way of not reaching IOMX.
  if (acquireOmxFromMediaPlayer() != OMXI_OK) return OMXI_ERR_IOMX;
  android::List<IOMX::ComponentInfo> components;
  static_cast<void>(_omx->listNodes(&components));  // an empty list says it all
  if (name != nullptr) {
    for (const IOMX::ComponentInfo& component : components) {
      if (component.mName == name) return OMXI_OK;
    }
  }
  return failWith(OMXI_ERR_NODE_NOT_FOUND, "OMXINTERFACE: CODEC NOT FOUND: %s",
                  name != nullptr ? name : "(null)");
}

int OmxInterface::OmxComponentCanBeAcquired(const char* name) {
  int result = OMXI_OK;
  return OmxComponentCanBeAcquired(name, result);
}

int OmxInterface::OmxComponentCanBeAcquired(const char* name, int& result) {
  try {
    OmxInterface session;
    result = session.queryForOmxComponent(name);
  } catch (const std::bad_alloc&) {
    result = OMXI_ERR_IOMX;
  }
  return result == OMXI_OK ? 1 : 0;
}

int OmxInterface::setupIOMXConnections() {
  const SessionCall call(*_state);
  android::ProcessState::self()->startThreadPool();

  const char* name = _isEncoder ? CBoardPlatformWrapper::getHardwareEncodeCodecIdentifierString()
                                : CBoardPlatformWrapper::getHardwareDecodeCodecIdentifierString();
  if (name == nullptr) {
    // A platform that names no component has no wrapper either: there is nothing to look for.
    return acquireOmxFromMediaPlayer() == OMXI_OK ? OMXI_ERR_NO_PLATFORM_WRAPPER : OMXI_ERR_IOMX;
  }
  const int found = queryForOmxComponent(name);
  if (found != OMXI_OK) return found;

  sp<OmxCodecObserver> observer;
  try {
    observer = new OmxCodecObserver;
  } catch (const std::bad_alloc&) {
    return OMXI_ERR_CREATE_OBSERVER;
  }
  _state->nodeObserver = observer;
  observer->setDelegate(this);  // before the node exists: messages may come from then on
  const android::status_t status = _omx->allocateNode(name, observer, &_node);
  if (status != android::OK) {
    return failWith(OMXI_ERR_ALLOCATE_COMPONENT, "OMXINTERFACE - Could not allocate node: %s -- error %d",
                    name, status);
  }
  _platformWrapper = CBoardPlatformWrapper::CreateBoardPlatformWrapper(this, _omx, _node);
  return _platformWrapper != nullptr ? OMXI_OK : OMXI_ERR_NO_PLATFORM_WRAPPER;
}

void OmxInterface::setObserver(sp<OmxCodecObserver> observer) {
  _observer = observer;
}

void OmxInterface::setMPmemInfo(sp<android::IMemoryHeap> heap) {
  const SessionCall call(*_state);
  {
    const SessionState::Lock held(_state->lock);
    std::swap(_mpMemHeap, heap);
  }
  // The former heap goes here, perhaps with its mapping, outside of the lock.
}
