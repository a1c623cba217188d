#pragma once
// The codec of a script. Internal to the test support.

#include <deque>
#include <variant>

#include "tests/support/script.h"

namespace omxtest {

inline constexpr auto kMetaData = static_cast<OMX_INDEXTYPE>(0x7F000F01);

struct Announcement {
  Script::PortEdit edit;
  OMX_U32 index;
};

class ScriptedCodec final : public mediaserver::Codec {
 public:
  using Item = std::variant<Packet, Announcement>;

  ScriptedCodec(Script& script, mediaserver::CodecHost& host);
  ~ScriptedCodec() override;

  mediaserver::PortPair ports() const override;
  std::vector<mediaserver::VideoFormat> formats(OMX_U32 port) const override;
  // What storeMetaDataInBuffers needs; it takes false and refuses true.
  std::vector<mediaserver::Extension> extensions() const override {
    return {{"OMX.google.android.index.storeMetaDataInBuffers", kMetaData}};
  }
  OMX_ERRORTYPE definePort(OMX_U32 port, const mediaserver::PortDefinition& wanted,
                           mediaserver::PortPair& ports) override;
  Answer getParameter(OMX_INDEXTYPE index, void* record, size_t size) override {
    return get(Access::GetParameter, index, record, size);
  }
  Answer setParameter(OMX_INDEXTYPE index, const void* record, size_t size) override {
    return set(Access::SetParameter, index, record, size);
  }
  Answer getConfig(OMX_INDEXTYPE index, void* record, size_t size) override {
    return get(Access::GetConfig, index, record, size);
  }
  Answer setConfig(OMX_INDEXTYPE index, const void* record, size_t size) override {
    return set(Access::SetConfig, index, record, size);
  }

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
  using Lock = Script::Lock;

  Answer get(Access access, OMX_INDEXTYPE index, void* record, size_t size) const;
  Answer set(Access access, OMX_INDEXTYPE index, const void* record, size_t size);
  void takeTime(Lock& lock);

  Script& _script;
  mediaserver::CodecHost& _host;
  // Guarded by the script's mutex.
  std::deque<Item> _line;  // outputs and announcements, in order
  bool _draining = false;
};

}  // namespace omxtest
