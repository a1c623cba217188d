#pragma once
// What a test tells a scripted component, and what it can ask it. The component runs behind the media
// server's real node, so OpenMAX rules hold; the script decides the rest. Unscripted, it takes each input and
// produces one output with the same bytes, time stamp and flags, and its ports keep their sizes apart. One
// Script belongs to one entry of the server's component list and outlives the server. What concerns
// definitions and start is read when a node is allocated; all else works at once, on all nodes of that
// component. Any thread may call it, also hooks and callbacks, but not the functions that a test hands in
// here.

#include <array>
#include <cstddef>
#include <functional>
#include <map>
#include <mutex>
#include <optional>
#include <set>
#include <string>
#include <vector>

#include <OMX_Core.h>
#include <OMX_Index.h>

#include "host/mediaserver/codec.h"
#include "tests/support/call.h"
#include "tests/support/journal.h"

namespace omxtest {

class ScriptedCodec;

class Script {
 public:
  using PortEdit = std::function<void(mediaserver::PortDefinition&)>;
  using Transform = std::function<std::vector<Packet>(const Packet&)>;

  enum class Kind { Decoder, Encoder };
  explicit Script(Kind kind);

  // An entry for OmxServer's list.
  mediaserver::Component component(const std::string& name);

  // --- Settings ---

  // Changes the definition that fresh nodes have, for instance nBufferCountActual. Edits add up.
  // Defaults: 176x144, 24 frames per second; buffers: 4 input, 8 (decoder) or 6 (encoder) output; 65536
  // bytes on the compressed port, a picture's size on the other.
  void editPort(OMX_U32 port, const PortEdit& edit) {
    change([&] { edit(_ports.at(port)); });
  }
  // Defaults: AVC, MPEG-4, H.263, WMV; 21 and TI's 0x7F000100.
  void setFormats(OMX_U32 port, const std::vector<mediaserver::VideoFormat>& formats) {
    change([&] { _formats.at(port) = formats; });
  }

  // What reading `index` gives from now on: everything behind the record's first two words. Also for port
  // definitions (of the record's port), where the node itself goes on by its own.
  // Without an answer, reading gives zeros.
  template <typename Record>
  void answer(OMX_INDEXTYPE index, const Record& record) {
    const auto* const bytes = reinterpret_cast<const uint8_t*>(&record);
    change([&] { _answers[index].assign(bytes, bytes + sizeof(record)); });
  }

  // --- Work ---

  // Starting the codec (Idle to Executing) fails; OMX_ErrorNone takes it back.
  void failStart(OMX_ERRORTYPE error) {
    change([&] { _startFailure = error; });
  }

  // The component keeps all inputs (their EMPTY_BUFFER_DONE does not come) until `count` of them are let
  // go, or all.
  void holdInput() { releaseInput(0); }
  void releaseInput(std::optional<size_t> count) {
    change([&] { _inputBudget = count; });
  }
  void passInput() { releaseInput({}); }

  // What comes out of an input. An empty result: nothing (a dropped frame). Called on the worker thread.
  // Null: the default.
  void onInput(const Transform& transform) {
    change([&] { _transform = transform; });
  }
  // An output out of nothing, behind those that wait.
  void produce(const Packet& output);

  // New output settings behind the outputs that wait: the node sends OMX_EventPortSettingsChanged and goes
  // through the protocol. `index` is the event's second word; for a configuration (output crop, say) no
  // buffers change. What comes out later waits for it.
  void announce(const PortEdit& edit, OMX_U32 index = 0);
  void announce(OMX_U32 width, OMX_U32 height);

  // Sends the client an error event now; but between an announcement and the client's disable, after these.
  void raiseError(OMX_ERRORTYPE error);

  // --- Asking ---

  // The inputs so far; end marks without bytes count too.
  std::vector<Packet> inputs() const { return _inputs.all(); }
  [[nodiscard]] bool waitForInputs(size_t count) const {
    return _inputs.waitFor([](const Packet&) { return true; }, count);
  }
  size_t liveCodecs() const { return read(_codecs).size(); }
  size_t starts() const { return read(_starts); }
  size_t stops() const { return read(_stops); }

 private:
  friend class ScriptedCodec;
  using Lock = std::unique_lock<std::mutex>;

  // With the lock held; afterwards the codecs look again at what there is to do.
  template <typename Action>
  void change(Action action) {
    const Lock lock(_mutex);
    action();
    wakeAll();
  }
  template <typename Value>
  Value read(const Value& value) const {
    const Lock lock(_mutex);
    return value;
  }
  void wakeAll();

  const Kind _kind;
  Journal<Packet> _inputs;
  // Guards everything below. Nodes call codecs without a lock, and codecs and scripts may call a CodecHost
  // with it held; functions of the test run without it.
  mutable std::mutex _mutex;
  mediaserver::PortPair _ports{};
  std::array<std::vector<mediaserver::VideoFormat>, mediaserver::kPortCount> _formats;
  std::map<OMX_INDEXTYPE, std::vector<uint8_t>> _answers;
  OMX_ERRORTYPE _startFailure = OMX_ErrorNone;
  std::optional<size_t> _inputBudget;  // how many may pass; no number: all
  Transform _transform;
  std::set<ScriptedCodec*> _codecs;
  size_t _starts = 0;
  size_t _stops = 0;
};

}  // namespace omxtest
