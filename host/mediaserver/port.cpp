#include "host/mediaserver/port.h"

#include <algorithm>

namespace mediaserver {

void Port::add(const std::shared_ptr<Buffer>& buffer) {
  buffers.emplace(buffer->id, buffer);
  definition.bPopulated = populated() ? OMX_TRUE : OMX_FALSE;
}

std::shared_ptr<Buffer> Port::remove(android::IOMX::buffer_id id) {
  const auto entry = buffers.find(id);
  if (entry == buffers.end()) return nullptr;
  std::shared_ptr<Buffer> buffer = entry->second;
  buffers.erase(entry);
  line.erase(std::remove(line.begin(), line.end(), buffer), line.end());
  buffer->freed = true;
  definition.bPopulated = OMX_FALSE;
  return buffer;
}

std::shared_ptr<Buffer> Port::find(android::IOMX::buffer_id id) const {
  const auto entry = buffers.find(id);
  return entry == buffers.end() ? nullptr : entry->second;
}

bool Port::unread() const {
  return std::any_of(buffers.begin(), buffers.end(), [](const auto& entry) { return entry.second->unread; });
}

void Port::append(const std::shared_ptr<Buffer>& buffer) {
  buffer->holder = Holder::Node;
  buffer->unread = false;
  line.push_back(buffer);
}

void Port::putBack(const std::shared_ptr<Buffer>& buffer) {
  if (buffer->freed) return;
  buffer->holder = Holder::Node;
  line.push_front(buffer);
}

std::shared_ptr<Buffer> Port::takeFirst() {
  std::shared_ptr<Buffer> buffer = line.front();
  line.pop_front();
  buffer->holder = Holder::Codec;
  return buffer;
}

void Port::grant(const PortDefinition& granted) {
  const PortDefinition present = definition;
  definition = granted;
  definition.nSize = present.nSize;
  definition.nVersion = present.nVersion;
  definition.nPortIndex = present.nPortIndex;
  definition.eDir = present.eDir;
  definition.eDomain = present.eDomain;
  definition.bEnabled = present.bEnabled;
  definition.bPopulated = !buffers.empty() && populated() ? OMX_TRUE : OMX_FALSE;
}

}  // namespace mediaserver
