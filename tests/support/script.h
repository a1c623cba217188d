#pragma once
// What a test tells a scripted component, and what it can ask it. The component runs behind the media
// server's real node, so states, ports, buffers and events follow OpenMAX rules; the script decides the
// rest. Unscripted, it takes each input and produces one output with the same bytes, time stamp and flags.
//
// One Script belongs to one entry of the server's component list. What concerns definitions and start is
// read when a node is allocated; everything else works at once, on all nodes of that component (allocate
// one, or give each its own component). All functions may be called from any thread, also from hooks and
// callbacks, except from inside the functions that a test hands in here.

#include <chrono>
#include <cstddef>
#include <functional>
#include <memory>
#include <optional>
#include <type_traits>
#include <vector>

#include <OMX_Core.h>
#include <OMX_Index.h>

#include "host/mediaserver/codec.h"
#include "tests/support/packet.h"

namespace omxtest {

enum class Access { GetParameter, SetParameter, GetConfig, SetConfig };

inline constexpr std::chrono::milliseconds kWaitLimit{20000};

class Script {
 public:
  enum class Kind { Decoder, Encoder };
  explicit Script(Kind kind);
  ~Script();
  Script(const Script&) = delete;
  Script& operator=(const Script&) = delete;

  // An entry for OmxServer's list. The script must live until the server has gone.
  mediaserver::Component component(const std::string& name);

  // --- Settings ---

  // Changes the definition that fresh nodes have, for instance nBufferCountActual. Edits add up.
  // Defaults: 176x144, 24 frames per second; buffers: 4 input, 8 (decoder) or 6 (encoder) output; 65536
  // bytes on the compressed port, a picture's size on the other.
  void editPort(OMX_U32 port, const std::function<void(mediaserver::PortDefinition&)>& edit);
  // Defaults: AVC, MPEG-4, H.263, WMV (an encoder: AVC); 21 and TI's 0x7F000100.
  void setFormats(OMX_U32 port, std::vector<mediaserver::VideoFormat> formats);
  // Default: the extension that storeMetaDataInBuffers needs, which takes false and refuses true.
  void setExtensions(std::vector<mediaserver::Extension> extensions);

  // Accesses to `index` fail; with a port, only those whose record names it. Also for the records that the
  // node answers by itself, such as port definitions. `accept` takes it back, and makes an index that is
  // unknown otherwise readable and writable with any record. Known are those that our wrappers send.
  void refuse(Access access, OMX_INDEXTYPE index, OMX_ERRORTYPE error = OMX_ErrorUnsupportedIndex,
              std::optional<OMX_U32> port = {});
  void accept(Access access, OMX_INDEXTYPE index);

  // What reading `index` gives from now on: everything behind the record's first two words. Also for port
  // definitions (of the record's port), where the node itself goes on by its own.
  // Without an answer, reading gives what was last written, or zeros.
  template <typename Record>
  void answer(OMX_INDEXTYPE index, const Record& record) {
    static_assert(std::is_trivially_copyable_v<Record>);
    answerBytes(index, &record, sizeof(record));
  }
  // What was last written to `index`, whole; nothing if nothing was, or something shorter.
  template <typename Record>
  std::optional<Record> written(OMX_INDEXTYPE index) const {
    static_assert(std::is_trivially_copyable_v<Record>);
    Record record{};
    return copyWritten(index, &record, sizeof(record)) ? std::optional<Record>(record) : std::nullopt;
  }

  // --- Work ---

  // Starting the codec (Idle to Executing) fails; OMX_ErrorNone takes it back.
  void failStart(OMX_ERRORTYPE error);

  // The component keeps all inputs (their EMPTY_BUFFER_DONE does not come) until `count` of them are let
  // go, or all. The same for outputs: what it produces stays inside.
  void holdInput();
  void releaseInput(size_t count);
  void passInput();
  void holdOutput();
  void releaseOutput(size_t count);
  void passOutput();

  // What comes out of an input. An empty result: nothing (a dropped frame). Called on the worker thread.
  // Null: the default.
  void onInput(std::function<std::vector<Packet>(const Packet&)> transform);
  // An output out of nothing, behind those that wait.
  void produce(const Packet& output);
  // How many outputs the component keeps before it takes no more inputs; default 16.
  void setDepth(size_t outputs);
  // Time that each input and each output takes; default none.
  void setDelay(std::chrono::milliseconds delay);

  // New output settings behind the outputs that wait: the node sends OMX_EventPortSettingsChanged and goes
  // through the protocol. `index` is the event's second word; for a configuration (output crop, say) no
  // buffers change. What comes out later waits for it.
  void announce(const std::function<void(mediaserver::PortDefinition&)>& edit, OMX_U32 index = 0);
  void announce(OMX_U32 width, OMX_U32 height);

  // Sends the client an event now; but between an announcement and the client's disable, after these.
  void raise(OMX_EVENTTYPE event, OMX_U32 data1, OMX_U32 data2);
  void raiseError(OMX_ERRORTYPE error) { raise(OMX_EventError, static_cast<OMX_U32>(error), 0); }

  // --- Asking ---

  // The inputs so far, at most the last 1024; end marks without bytes count too.
  std::vector<Packet> inputs() const;
  size_t inputCount() const;
  [[nodiscard]] bool waitForInputs(size_t count, std::chrono::milliseconds limit = kWaitLimit) const;
  // Outputs and announcements that wait inside.
  size_t waiting() const;
  // The definitions that the work was last told to go by: at start, and after each enable of a port.
  std::optional<mediaserver::PortPair> configured() const;
  size_t liveCodecs() const;
  size_t starts() const;
  size_t stops() const;
  size_t flushes() const;

 private:
  friend class ScriptedCodec;
  struct State;
  void answerBytes(OMX_INDEXTYPE index, const void* record, size_t size);
  bool copyWritten(OMX_INDEXTYPE index, void* record, size_t size) const;
  void wakeAll();

  const std::shared_ptr<State> _state;
};

}  // namespace omxtest
