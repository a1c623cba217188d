#include "host/mediaserver/node.h"

#include <system_error>
#include <utility>

namespace mediaserver {

namespace {

android::omx_message eventMessage(android::IOMX::node_id node, OMX_EVENTTYPE event, OMX_U32 data1,
                                  OMX_U32 data2) {
  android::omx_message message{};
  message.type = android::omx_message::EVENT;
  message.node = node;
  message.u.event_data.event = event;
  message.u.event_data.data1 = data1;
  message.u.event_data.data2 = data2;
  return message;
}

android::omx_message bufferMessage(android::IOMX::node_id node, OMX_U32 port, const Buffer& buffer) {
  android::omx_message message{};
  message.node = node;
  if (port == kInputPort) {
    message.type = android::omx_message::EMPTY_BUFFER_DONE;
    message.u.buffer_data.buffer = buffer.id;
    return message;
  }
  message.type = android::omx_message::FILL_BUFFER_DONE;
  auto& data = message.u.extended_buffer_data;
  data.buffer = buffer.id;
  data.range_offset = buffer.header.nOffset;
  data.range_length = buffer.header.nFilledLen;
  data.flags = buffer.header.nFlags;
  data.timestamp = buffer.header.nTimeStamp;
  data.platform_private = buffer.header.pPlatformPrivate;
  data.data_ptr = buffer.header.pBuffer;
  return message;
}

void completeDefinition(OMX_U32 port, PortDefinition* definition) {
  definition->nSize = sizeof(PortDefinition);
  definition->nVersion.nVersion = 0;
  definition->nVersion.s.nVersionMajor = 1;
  definition->nVersion.s.nVersionMinor = 1;
  definition->nPortIndex = port;
  definition->eDir = port == kInputPort ? OMX_DirInput : OMX_DirOutput;
  definition->eDomain = OMX_PortDomainVideo;
  definition->bEnabled = OMX_TRUE;
  definition->bPopulated = OMX_FALSE;
}

}  // namespace

std::shared_ptr<Node> Node::create(android::IOMX::node_id id, const Component& component,
                                   const android::sp<android::IOMXObserver>& observer,
                                   std::chrono::milliseconds readingTime) {
  std::shared_ptr<Node> node(new Node(id, component, observer, readingTime));
  return node->start(node) ? node : nullptr;
}

Node::Node(android::IOMX::node_id id, const Component& component,
           const android::sp<android::IOMXObserver>& observer, std::chrono::milliseconds readingTime)
    : _id(id), _component(component), _readingTime(readingTime), _channel(observer) {}

bool Node::start(const std::shared_ptr<Node>& self) {
  _codec = _component.factory(*this);
  if (_codec == nullptr) return false;
  const PortPair definitions = _codec->ports();
  {
    std::lock_guard<std::mutex> lock(_mutex);
    for (OMX_U32 port = 0; port < kPortCount; ++port) {
      _ports[port].definition = definitions[port];
      completeDefinition(port, &_ports[port].definition);
    }
  }
  if (!_channel.open()) return false;
  try {
    _worker = std::thread(&Node::work, self);
  } catch (const std::system_error&) {
    return false;
  }
  return true;
}

Node::~Node() {
  // The codec may call its host until it is gone.
  _codec.reset();
}

void Node::shutdown() {
  // First the messages: what the end of the work sets free is not told to anyone.
  _channel.close();
  {
    std::lock_guard<std::mutex> lock(_mutex);
    _stopping = true;
  }
  _wakeUp.post();
  if (_worker.get_id() == std::this_thread::get_id()) {
    _worker.detach();  // a delivery of its own: it ends after that, and owns the node until then
  } else {
    _worker.join();
  }

  std::array<Port, kPortCount> released;
  std::lock_guard<std::mutex> lock(_mutex);
  for (OMX_U32 port = 0; port < kPortCount; ++port) {
    for (const auto& [id, buffer] : _ports[port].buffers) buffer->freed = true;
    released[port].buffers.swap(_ports[port].buffers);
    released[port].line.swap(_ports[port].line);
  }
}

OMX_STATETYPE Node::state() {
  std::lock_guard<std::mutex> lock(_mutex);
  return _stopping ? OMX_StateInvalid : _state;
}

void Node::wake() {
  std::lock_guard<std::mutex> lock(_mutex);
  signal();
}

void Node::raise(OMX_EVENTTYPE kind, OMX_U32 data1, OMX_U32 data2) {
  std::lock_guard<std::mutex> lock(_mutex);
  if (_settings == Settings::Announced) {
    _deferred.push_back(eventMessage(_id, kind, data1, data2));
  } else {
    event(kind, data1, data2);
  }
}

void Node::signal() {
  if (markSignalled()) _wakeUp.post();
}

bool Node::markSignalled() {
  _signalled = true;
  return std::exchange(_asleep, false);
}

void Node::event(OMX_EVENTTYPE kind, OMX_U32 data1, OMX_U32 data2) {
  _channel.post(eventMessage(_id, kind, data1, data2));
}

void Node::giveBack(OMX_U32 port, const std::shared_ptr<Buffer>& buffer, std::function<void()> complete) {
  buffer->holder = Holder::Client;
  if (buffer->freed) return;
  std::function<void()> before;
  if (complete) {
    buffer->incomplete = true;
    before = [buffer, complete = std::move(complete)] {
      complete();
      buffer->incomplete = false;
    };
  }
  _channel.queue(bufferMessage(_id, port, *buffer), std::move(before));
}

void Node::giveBackAll(OMX_U32 port) {
  std::deque<std::shared_ptr<Buffer>> line;
  line.swap(_ports[port].line);
  for (const std::shared_ptr<Buffer>& buffer : line) giveBack(port, buffer);
  _channel.wake();
}

PortPair Node::definitions() const {
  return {_ports[kInputPort].definition, _ports[kOutputPort].definition};
}

}  // namespace mediaserver
