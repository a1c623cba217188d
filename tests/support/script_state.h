#pragma once
// What a script and its codecs share, and the codec itself. Internal to the test support.
// Threads: everything in State is guarded by its mutex. Nodes call codecs without a lock, and codecs and
// scripts may call a CodecHost with the mutex held; functions of the test run without it.

#include <array>
#include <condition_variable>
#include <deque>
#include <map>
#include <mutex>
#include <set>
#include <variant>

#include "tests/support/script.h"

namespace omxtest {

class ScriptedCodec;

using PortEdit = std::function<void(mediaserver::PortDefinition&)>;

struct Announcement {
  PortEdit edit;
  OMX_U32 index;
};

// How many may pass; no number: all.
using Budget = std::optional<size_t>;

struct Script::State {
  struct Refusal {
    OMX_ERRORTYPE error;
    std::optional<OMX_U32> port;
  };
  using Key = std::pair<Access, OMX_INDEXTYPE>;

  explicit State(Kind kindOfCodec) : kind(kindOfCodec) {}

  mutable std::mutex mutex;
  mutable std::condition_variable changed;

  const Kind kind;
  mediaserver::PortPair ports{};
  std::array<std::vector<mediaserver::VideoFormat>, mediaserver::kPortCount> formats;
  std::vector<mediaserver::Extension> extensions;
  std::map<Key, Refusal> refused;
  std::set<Key> accepted;
  std::map<OMX_INDEXTYPE, std::vector<uint8_t>> answers;
  std::map<OMX_INDEXTYPE, std::vector<uint8_t>> records;  // as last written

  OMX_ERRORTYPE startFailure = OMX_ErrorNone;
  Budget inputBudget;
  Budget outputBudget;
  std::function<std::vector<Packet>(const Packet&)> transform;
  size_t depth = 16;
  std::chrono::milliseconds delay{0};

  std::set<ScriptedCodec*> codecs;
  std::deque<Packet> inputs;  // the last ones
  size_t inputCount = 0;
  std::optional<mediaserver::PortPair> configured;
  size_t starts = 0;
  size_t stops = 0;
  size_t flushes = 0;
};

class ScriptedCodec final : public mediaserver::Codec {
 public:
  using State = Script::State;
  using Item = std::variant<Packet, Announcement>;

  ScriptedCodec(std::shared_ptr<State> state, mediaserver::CodecHost& host);
  ~ScriptedCodec() override;

  mediaserver::PortPair ports() const override;
  std::vector<mediaserver::VideoFormat> formats(OMX_U32 port) const override;
  std::vector<mediaserver::Extension> extensions() const override;
  OMX_ERRORTYPE definePort(OMX_U32 port, const mediaserver::PortDefinition& wanted,
                           mediaserver::PortPair& ports) override;
  Answer getParameter(OMX_INDEXTYPE index, void* record, size_t size) override;
  Answer setParameter(OMX_INDEXTYPE index, const void* record, size_t size) override;
  Answer getConfig(OMX_INDEXTYPE index, void* record, size_t size) override;
  Answer setConfig(OMX_INDEXTYPE index, const void* record, size_t size) override;

  void configure(const mediaserver::PortPair& ports) override;
  OMX_ERRORTYPE start() override;
  void stop() override;
  void flush(OMX_U32 port) override;
  mediaserver::Sent send(const mediaserver::InputView& input) override;
  void drain(OMX_TICKS timestamp) override;
  mediaserver::Received receive(mediaserver::OutputSpace& output) override;
  OMX_U32 geometry(mediaserver::PortDefinition& output) override;

 private:
  friend class Script;
  using Lock = std::unique_lock<std::mutex>;

  Answer refusal(Access access, OMX_INDEXTYPE index, const void* record, size_t size) const;
  Answer get(Access access, OMX_INDEXTYPE index, void* record, size_t size) const;
  Answer set(Access access, OMX_INDEXTYPE index, const void* record, size_t size);
  void takeTime(Lock& lock);

  const std::shared_ptr<State> _state;
  mediaserver::CodecHost& _host;
  // Guarded by the state's mutex.
  std::deque<Item> _line;  // outputs and announcements, in order
  bool _draining = false;
};

}  // namespace omxtest
