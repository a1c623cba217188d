// The usual matches, and messages to forge.

#include "tests/support/message_tap.h"

namespace omxtest {

using android::omx_message;

Match anyMessage() {
  return [](const omx_message&) { return true; };
}

Match anyEvent() {
  return [](const omx_message& message) { return message.type == omx_message::EVENT; };
}

Match eventIs(OMX_EVENTTYPE event) {
  return [=](const omx_message& message) {
    return message.type == omx_message::EVENT && message.u.event_data.event == event;
  };
}

Match commandComplete(OMX_COMMANDTYPE command) {
  return [=](const omx_message& message) {
    return message.type == omx_message::EVENT && message.u.event_data.event == OMX_EventCmdComplete &&
           message.u.event_data.data1 == static_cast<OMX_U32>(command);
  };
}

Match commandComplete(OMX_COMMANDTYPE command, OMX_U32 data) {
  return [matches = commandComplete(command), data](const omx_message& message) {
    return matches(message) && message.u.event_data.data2 == data;
  };
}

Match emptyBufferDone() {
  return [](const omx_message& message) { return message.type == omx_message::EMPTY_BUFFER_DONE; };
}

Match fillBufferDone() {
  return [](const omx_message& message) { return message.type == omx_message::FILL_BUFFER_DONE; };
}

omx_message makeEvent(OMX_EVENTTYPE event, OMX_U32 data1, OMX_U32 data2) {
  omx_message message{};
  message.type = omx_message::EVENT;
  message.u.event_data.event = event;
  message.u.event_data.data1 = data1;
  message.u.event_data.data2 = data2;
  return message;
}

omx_message makeEmptyBufferDone(android::IOMX::buffer_id buffer) {
  omx_message message{};
  message.type = omx_message::EMPTY_BUFFER_DONE;
  message.u.buffer_data.buffer = buffer;
  return message;
}

omx_message makeFillBufferDone(android::IOMX::buffer_id buffer, OMX_U32 length, OMX_U32 flags,
                               OMX_TICKS timestamp) {
  omx_message message{};
  message.type = omx_message::FILL_BUFFER_DONE;
  message.u.extended_buffer_data.buffer = buffer;
  message.u.extended_buffer_data.range_length = length;
  message.u.extended_buffer_data.flags = flags;
  message.u.extended_buffer_data.timestamp = timestamp;
  return message;
}

}  // namespace omxtest
