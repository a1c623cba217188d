// What a component is behind its node: an encoder, a decoder, or a script of a test.
//
// The node does everything that all components have in common (states, ports, who holds which buffer,
// events); a codec turns input bytes into output bytes and knows its own settings. It has two faces:
//  - settings, called on the clients' threads, several at once and also while the codec works; the codec
//    guards them with a lock of its own, never blocks in them, and picks changes up at its next send;
//  - work, called on the node's worker thread only, one call at a time.
// The node holds no lock during any call, so a codec may call its CodecHost from everywhere.
#pragma once

#include <array>
#include <cstddef>
#include <cstdint>
#include <functional>
#include <memory>
#include <optional>
#include <string>
#include <vector>

#include <OMX_Component.h>
#include <OMX_Core.h>
#include <OMX_IVCommon.h>
#include <OMX_Index.h>
#include <OMX_Video.h>

namespace mediaserver {

inline constexpr OMX_U32 kInputPort = 0;
inline constexpr OMX_U32 kOutputPort = 1;
inline constexpr OMX_U32 kPortCount = 2;

using PortDefinition = OMX_PARAM_PORTDEFINITIONTYPE;
using PortPair = std::array<PortDefinition, kPortCount>;

// One entry of a port's format enumeration; one of the two is always "unused".
struct VideoFormat {
  OMX_VIDEO_CODINGTYPE compression;
  OMX_COLOR_FORMATTYPE colour;
};

// A parameter or configuration that clients find by name.
struct Extension {
  std::string name;
  OMX_INDEXTYPE index;
};

// The filled range of an input buffer. Borrowed for the call.
struct InputView {
  const uint8_t* data;
  size_t length;  // bytes; 0 with the end-of-stream flag alone
  OMX_TICKS timestamp;
  OMX_U32 flags;
};

// An empty output buffer, and what the codec made of it. The memory is borrowed for the call, and until
// `complete` has run.
struct OutputSpace {
  uint8_t* data;
  size_t capacity;  // bytes
  OMX_U32 offset = 0;
  OMX_U32 length = 0;
  OMX_U32 flags = 0;
  OMX_TICKS timestamp = 0;
  // What is left to be written, if anything. It runs on the worker thread, or, while there is more input, on
  // the channel's just before the client hears of the buffer, and perhaps never: the codec goes on meanwhile,
  // and may even be gone.
  std::function<void()> complete = nullptr;
};

enum class Sent {
  Taken,  // the bytes are no longer needed
  Busy,   // offer them again after the next receive or CodecHost::wake
};

enum class Received {
  Filled,       // the space holds output; the end-of-stream flag ends a drain
  Nothing,      // no output before more input, or before CodecHost::wake
  Drained,      // drain was called and everything has come out; the next send starts a new stream
  NewGeometry,  // the next output needs other port settings: see Codec::geometry. Said until that is called
};

// The node, as its codec sees it. Any thread; valid as long as the codec lives.
class CodecHost {
 public:
  virtual ~CodecHost() = default;
  // Makes the worker ask the codec again after Busy or Nothing.
  virtual void wake() = 0;
  // Sends an event to the client. While the client owes a port disable after new geometry the event
  // waits: clients hold their event queue then, and a second event would keep their buffers from them.
  virtual void raise(OMX_EVENTTYPE event, OMX_U32 data1, OMX_U32 data2) = 0;
};

class Codec {
 public:
  virtual ~Codec() = default;

  // --- Settings: any thread ---

  // Both definitions as they are in a fresh node. The node itself sets nSize, nVersion, nPortIndex, eDir,
  // eDomain, bEnabled and bPopulated. Called once, before everything else.
  virtual PortPair ports() const = 0;

  // The formats that `port` enumerates and accepts, the default first.
  virtual std::vector<VideoFormat> formats(OMX_U32 port) const = 0;

  virtual std::vector<Extension> extensions() const { return {}; }

  // A client asks for `wanted` on `port`. `ports` holds the present definitions; on success the codec
  // leaves in it what it grants, also for the other port (a new picture size changes both). Fields that
  // clients may not write, and formats that `formats` does not list, have been dealt with before. May be
  // called again with the same wish, if the ports changed meanwhile; nothing is granted before the node
  // says so in `configure`.
  virtual OMX_ERRORTYPE definePort(OMX_U32 port, const PortDefinition& wanted, PortPair& ports) = 0;

  // Parameters and configurations. `record` has `size` bytes, at least 8, and the size counts, not the
  // record's own size word. No answer (nullopt) leaves standard port records to the node, and makes every
  // other index unsupported. Legality of a write in the present state has been checked before.
  using Answer = std::optional<OMX_ERRORTYPE>;
  virtual Answer getParameter(OMX_INDEXTYPE index, void* record, size_t size) = 0;
  virtual Answer setParameter(OMX_INDEXTYPE index, const void* record, size_t size) = 0;
  virtual Answer getConfig(OMX_INDEXTYPE index, void* record, size_t size) = 0;
  virtual Answer setConfig(OMX_INDEXTYPE index, const void* record, size_t size) = 0;

  // --- Work: the worker thread ---

  // The ports as agreed: before each start, and whenever a port has been enabled again.
  virtual void configure(const PortPair& ports) = 0;
  // Resources are taken, processing may begin. A failure keeps the node in Idle and is reported.
  virtual OMX_ERRORTYPE start() = 0;
  // Everything in progress is discarded. Called once for each successful start, also before destruction.
  virtual void stop() = 0;
  // Input (or output) that the codec still holds for `port` is discarded.
  virtual void flush(OMX_U32 port) = 0;

  // Inputs may be empty: an end mark alone comes here too, and `drain` after it.
  virtual Sent send(const InputView& input) = 0;
  // No more input follows in this stream; `timestamp` is that of the end mark.
  virtual void drain(OMX_TICKS timestamp) = 0;
  virtual Received receive(OutputSpace& output) = 0;
  // After NewGeometry: writes the new values into the output port's definition and returns the event's
  // second word: 0 or OMX_IndexParamPortDefinition when the client must make new buffers (the codec keeps
  // its pictures; it is asked again once the port has come back), else the configuration that changed.
  virtual OMX_U32 geometry(PortDefinition& output) = 0;
};

// Makes the codec of one new node; null when it cannot.
using CodecFactory = std::function<std::unique_ptr<Codec>(CodecHost& host)>;

// An entry of the server's component list.
struct Component {
  std::string name;
  std::vector<std::string> roles;
  CodecFactory factory;
};

}  // namespace mediaserver
