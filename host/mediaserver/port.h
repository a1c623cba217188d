// One port of a node: its definition, its buffers, those of them that wait with the node, and the enable
// or disable in progress. Plain data with the rules that concern a single port; guarded by the node's mutex.
#pragma once

#include <deque>
#include <memory>
#include <unordered_map>

#include <OMX_Core.h>
#include <media/IOMX.h>

#include "host/mediaserver/buffer.h"
#include "host/mediaserver/codec.h"

namespace mediaserver {

struct Port {
  enum class Change { None, Disabling, Enabling };

  bool enabled() const { return definition.bEnabled == OMX_TRUE; }
  // Holds as many buffers as its definition asks for.
  bool populated() const { return buffers.size() >= definition.nBufferCountActual; }
  // A port is compressed when its present format is; its colour format then means nothing.
  bool compressed() const { return definition.format.video.eCompressionFormat != OMX_VIDEO_CodingUnused; }

  // Whether the client may still be reading output that it was given.
  bool unread() const;

  void add(const std::shared_ptr<Buffer>& buffer);
  // Takes the buffer out of the table and, if it waits there, out of the line. Null for an unknown id.
  std::shared_ptr<Buffer> remove(android::IOMX::buffer_id id);
  // Null for an unknown id.
  std::shared_ptr<Buffer> find(android::IOMX::buffer_id id) const;

  // The line of buffers that wait with the node, oldest first.
  void append(const std::shared_ptr<Buffer>& buffer);
  void putBack(const std::shared_ptr<Buffer>& buffer);  // in front; unless it was freed meanwhile
  std::shared_ptr<Buffer> takeFirst();                  // for the codec; the line is not empty

  // Grants `granted` to a client: everything except what only the node decides.
  void grant(const PortDefinition& granted);

  PortDefinition definition{};
  OMX_BUFFERSUPPLIERTYPE supplier = OMX_BufferSupplyUnspecified;
  std::unordered_map<android::IOMX::buffer_id, std::shared_ptr<Buffer>> buffers;
  std::deque<std::shared_ptr<Buffer>> line;
  Change change = Change::None;  // waits for the client to free, or to give, the port's buffers
  unsigned commands = 0;         // enables and disables accepted and not completed
  bool enabledInTheEnd = true;   // when they are
};

}  // namespace mediaserver
