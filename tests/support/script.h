#pragma once
// What a test tells a scripted component, and what it can ask it. The component runs behind the media
// server's real node, so states, ports, buffers and events follow OpenMAX rules; the script decides the
// rest. Unscripted, it takes each input and produces one output with the same bytes, time stamp and flags.
//
// One Script belongs to one entry of the server's component list and outlives the server. What concerns
// definitions and start is read when a node is allocated; everything else works at once, on all nodes of
// that component (allocate one, or give each its own component). All functions may be called from any
// thread, also from hooks and callbacks, except from inside the functions that a test hands in here.

#include <array>
#include <chrono>
#include <condition_variable>
#include <cstddef>
#include <functional>
#include <map>
#include <mutex>
#include <optional>
#include <set>
#include <string>
#include <type_traits>
#include <utility>
#include <vector>

#include <OMX_Core.h>
#include <OMX_Index.h>

#include "host/mediaserver/codec.h"
#include "tests/support/eventually.h"
#include "tests/support/packet.h"

namespace omxtest {

enum class Access { GetParameter, SetParameter, GetConfig, SetConfig };

class ScriptedCodec;

class Script {
 public:
  using PortEdit = std::function<void(mediaserver::PortDefinition&)>;
  using Transform = std::function<std::vector<Packet>(const Packet&)>;

  enum class Kind { Decoder, Encoder };
  explicit Script(Kind kind);
  Script(const Script&) = delete;
  Script& operator=(const Script&) = delete;

  // An entry for OmxServer's list.
  mediaserver::Component component(const std::string& name);

  // --- Settings ---

  // Changes the definition that fresh nodes have, for instance nBufferCountActual. Edits add up.
  // Defaults: 176x144, 24 frames per second; buffers: 4 input, 8 (decoder) or 6 (encoder) output; 65536
  // bytes on the compressed port, a picture's size on the other.
  void editPort(OMX_U32 port, const PortEdit& edit);
  // Defaults: AVC, MPEG-4, H.263, WMV (an encoder: AVC); 21 and TI's 0x7F000100.
  void setFormats(OMX_U32 port, std::vector<mediaserver::VideoFormat> formats);
  // The output keeps its size when a client gives the input another one.
  void separatePorts();

  // Accesses to `index` fail, also to the records that the node answers by itself. Otherwise readable and
  // writable are those that our wrappers send.
  void refuse(Access access, OMX_INDEXTYPE index, OMX_ERRORTYPE error = OMX_ErrorUnsupportedIndex);

  // What reading `index` gives from now on: everything behind the record's first two words. Also for port
  // definitions (of the record's port), where the node itself goes on by its own.
  // Without an answer, reading gives what was last written, or zeros.
  template <typename Record>
  void answer(OMX_INDEXTYPE index, const Record& record) {
    static_assert(std::is_trivially_copyable_v<Record>);
    answerBytes(index, &record, sizeof(record));
  }

  // --- Work ---

  // Starting the codec (Idle to Executing) fails; OMX_ErrorNone takes it back.
  void failStart(OMX_ERRORTYPE error);

  // The component keeps all inputs (their EMPTY_BUFFER_DONE does not come) until `count` of them are let
  // go, or all. The same for outputs: what it produces stays inside.
  void holdInput() { setInputBudget(0); }
  void releaseInput(size_t count) { setInputBudget(count); }
  void passInput() { setInputBudget({}); }
  void holdOutput() { setOutputHeld(true); }
  void passOutput() { setOutputHeld(false); }

  // What comes out of an input. An empty result: nothing (a dropped frame). Called on the worker thread.
  // Null: the default.
  void onInput(Transform transform);
  // An output out of nothing, behind those that wait.
  void produce(const Packet& output);
  // Time that each input and each output takes; default none.
  void setDelay(std::chrono::milliseconds delay);

  // New output settings behind the outputs that wait: the node sends OMX_EventPortSettingsChanged and goes
  // through the protocol. `index` is the event's second word; for a configuration (output crop, say) no
  // buffers change. What comes out later waits for it.
  void announce(const PortEdit& edit, OMX_U32 index = 0);
  void announce(OMX_U32 width, OMX_U32 height);

  // Sends the client an error event now; but between an announcement and the client's disable, after these.
  void raiseError(OMX_ERRORTYPE error);

  // --- Asking ---

  // The inputs so far; end marks without bytes count too.
  std::vector<Packet> inputs() const;
  size_t inputCount() const { return inputs().size(); }
  [[nodiscard]] bool waitForInputs(size_t count) const;
  // Outputs and announcements that wait inside.
  size_t waiting() const;
  // The definitions that the work was last told to go by: at start, and after each enable of a port.
  std::optional<mediaserver::PortPair> configured() const;
  size_t liveCodecs() const;
  size_t starts() const;
  size_t stops() const;

 private:
  friend class ScriptedCodec;
  using Lock = std::unique_lock<std::mutex>;

  void answerBytes(OMX_INDEXTYPE index, const void* record, size_t size);
  void setInputBudget(std::optional<size_t> budget);
  void setOutputHeld(bool held);
  void wakeAll();

  const Kind _kind;
  // Guards everything below. Nodes call codecs without a lock, and codecs and scripts may call a CodecHost
  // with it held; functions of the test run without it.
  mutable std::mutex _mutex;
  mutable std::condition_variable _changed;
  mediaserver::PortPair _ports{};
  bool _portsAreSeparate = false;
  std::array<std::vector<mediaserver::VideoFormat>, mediaserver::kPortCount> _formats;
  std::map<std::pair<Access, OMX_INDEXTYPE>, OMX_ERRORTYPE> _refused;
  std::map<OMX_INDEXTYPE, std::vector<uint8_t>> _answers;
  std::map<OMX_INDEXTYPE, std::vector<uint8_t>> _records;  // as last written
  OMX_ERRORTYPE _startFailure = OMX_ErrorNone;
  std::optional<size_t> _inputBudget;  // how many may pass; no number: all
  bool _outputHeld = false;
  Transform _transform;
  std::chrono::milliseconds _delay{0};
  std::set<ScriptedCodec*> _codecs;
  std::vector<Packet> _inputs;
  std::optional<mediaserver::PortPair> _configured;
  size_t _starts = 0;
  size_t _stops = 0;
};

}  // namespace omxtest
