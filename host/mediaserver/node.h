// One instance of a component: OpenMAX IL 1.1 behaviour (states, ports, buffer ownership, events) around a
// Codec. Every public operation may come from any thread, several at once; none calls the client, and
// results are IL codes. Completions reach the client on the node's own threads, one at a time and in order:
// from the worker itself where it has nothing else to do, since to hand them to another thread costs more
// than to deliver them, else from the delivery thread, beside the codec's work. Owned by shared pointers: the
// server's table has one, each call in progress, and the worker.
//
// Commands run on the worker thread in the order in which they came, except that one which waits for the
// client (population, buffers to be freed) lets the others pass.
//
// Member            Written by                      Read by         What makes it safe
// _state            worker; calls that give or      all             _mutex
//                   free the last buffer
// _target           sendCommand, worker             all             _mutex
// _awaited          as _state                       as _state       _mutex
// _commands         sendCommand, worker             worker          _mutex
// _ports            all                             all             _mutex; a buffer's memory: its holder
// _revision         as the definitions              setParameter    _mutex
// _settings         worker, settle                  worker, raise   _mutex
// _deferred         raise, worker                   worker          _mutex
// _configureDue     worker, settle                  worker          _mutex
// _signalled        all                             worker          _mutex
// _asleep           all                             all             _mutex; who ends it posts _wakeUp
// _stopping         shutdown                        all             _mutex
// _lastExchange     worker, fillBuffer              worker          _mutex
// _started, _draining, _drainTime,  worker          worker          one thread
// _awaitsReader
// _worker           create, shutdown                shutdown        both called once, in this order
// _codec            create                          all             fixed, guards itself
// _channel          create                          all             fixed, guards itself, takes no other lock
// _id, _component,  constructor                     all             constant
// _readingTime
#pragma once

#include <array>
#include <chrono>
#include <cstddef>
#include <deque>
#include <memory>
#include <mutex>
#include <thread>
#include <vector>

#include <OMX_Core.h>
#include <media/IOMX.h>
#include <utils/RefBase.h>

#include "host/mediaserver/buffer.h"
#include "host/mediaserver/codec.h"
#include "host/mediaserver/message_channel.h"
#include "host/mediaserver/port.h"
#include "host/mediaserver/wake_up.h"

namespace mediaserver {

class Node final : private CodecHost {
 public:
  using BufferId = android::IOMX::buffer_id;

  // A node in Loaded. Null when the codec or the threads cannot be had. While the client still reads output
  // that it has been given, no new settings are told; one that for `readingTime` has neither got nor sent
  // back any is taken to keep what it has.
  static std::shared_ptr<Node> create(android::IOMX::node_id id, const Component& component,
                                      const android::sp<android::IOMXObserver>& observer,
                                      std::chrono::milliseconds readingTime);
  ~Node() override;
  Node(const Node&) = delete;
  Node& operator=(const Node&) = delete;

  // Ends the node from any state: messages that wait are dropped and none is delivered any more, the work
  // stops, buffers are released. Waits for a delivery and for a codec call in progress (not for a delivery
  // that it is called from). Every later operation fails. To be called once, before the last owner lets go.
  void shutdown();

  // Accepts a command; its completion or failure is an event. `param` is a state or a port.
  OMX_ERRORTYPE sendCommand(OMX_COMMANDTYPE command, OMX_U32 param);
  OMX_STATETYPE state();

  // `size` is the record's size and is what counts; on failure `record` stays as it was.
  OMX_ERRORTYPE getParameter(OMX_INDEXTYPE index, void* record, size_t size);
  OMX_ERRORTYPE setParameter(OMX_INDEXTYPE index, const void* record, size_t size);
  OMX_ERRORTYPE getConfig(OMX_INDEXTYPE index, void* record, size_t size);
  OMX_ERRORTYPE setConfig(OMX_INDEXTYPE index, const void* record, size_t size);
  OMX_ERRORTYPE extensionIndex(const char* name, OMX_INDEXTYPE* index);

  // Gives the port a buffer (null: it could not be made) and an id that no other buffer ever had.
  OMX_ERRORTYPE addBuffer(OMX_U32 port, const std::shared_ptr<Buffer>& buffer, BufferId* id);
  OMX_ERRORTYPE freeBuffer(OMX_U32 port, BufferId id);
  OMX_ERRORTYPE fillBuffer(BufferId id);
  OMX_ERRORTYPE emptyBuffer(BufferId id, OMX_U32 offset, OMX_U32 length, OMX_U32 flags, OMX_TICKS timestamp);

 private:
  using Lock = std::unique_lock<std::mutex>;
  using Record = std::vector<uint8_t>;
  struct Command {
    OMX_COMMANDTYPE kind;
    OMX_U32 param;
  };
  // New output settings: found while no buffer can be held back, told to the client, and being carried out.
  enum class Settings { Agreed, Due, Announced, Reallocating };

  Node(android::IOMX::node_id id, const Component& component,
       const android::sp<android::IOMXObserver>& observer, std::chrono::milliseconds readingTime);
  bool start(const std::shared_ptr<Node>& self);

  // CodecHost.
  void wake() override;
  void raise(OMX_EVENTTYPE event, OMX_U32 data1, OMX_U32 data2) override;

  // All of the following are called with _mutex held, through `lock` where they release it for a while.

  // node.cpp: messages.
  bool usable() const { return !_stopping && _state != OMX_StateInvalid; }
  void signal();
  [[nodiscard]] bool markSignalled();  // whether the worker sleeps, and _wakeUp has to be posted
  void event(OMX_EVENTTYPE event, OMX_U32 data1, OMX_U32 data2);
  void error(OMX_ERRORTYPE code) { event(OMX_EventError, static_cast<OMX_U32>(code), 0); }
  void completed(OMX_COMMANDTYPE command, OMX_U32 data) { event(OMX_EventCmdComplete, command, data); }
  // The client hears of it with the next message, or by _channel.wake() or deliver().
  void giveBack(OMX_U32 port, const std::shared_ptr<Buffer>& buffer,
                std::function<void()> complete = nullptr);
  void giveBackAll(OMX_U32 port);
  PortPair definitions() const;

  // node_commands.cpp: commands, states and the changes of ports.
  void accept(const Command& command);
  bool runnable(const Command& command) const;
  bool runCommand(Lock& lock);
  void setState(OMX_STATETYPE target, Lock& lock);
  void enterState(OMX_STATETYPE state);
  void forgetTarget();
  OMX_ERRORTYPE startCodec(Lock& lock);
  void stopCodec(Lock& lock);
  void flush(OMX_U32 port, Lock& lock);
  void changePort(OMX_U32 port, bool enable);
  void settle();
  void settleState();
  void settlePort(OMX_U32 port);

  // node_parameters.cpp.
  bool writable(const uint8_t* record, size_t size) const;
  OMX_ERRORTYPE getStandard(OMX_INDEXTYPE index, Record& record);
  OMX_ERRORTYPE setStandard(OMX_INDEXTYPE index, const Record& record);
  OMX_ERRORTYPE define(OMX_U32 port, PortDefinition wanted);
  bool offers(OMX_U32 port, VideoFormat format) const;

  // node_buffers.cpp.
  bool takesBuffers(const Port& port) const;
  bool expectsFree(const Port& port) const;
  OMX_ERRORTYPE claim(OMX_U32 port, BufferId id, std::shared_ptr<Buffer>* buffer);

  // node_worker.cpp: the worker thread.
  void work();
  bool process(Lock& lock);
  bool announce();
  bool receiveOutput(Lock& lock);
  bool sendInput(Lock& lock);
  void finishOutput(const std::shared_ptr<Buffer>& buffer, OutputSpace space, Lock& lock);
  void endAnnouncement(Settings next);
  void deliver(Lock& lock);
  void pause(Lock& lock);
  bool readersAreDone();
  bool changeGeometry(Lock& lock);

  const android::IOMX::node_id _id;
  const Component _component;
  const std::chrono::milliseconds _readingTime;
  MessageChannel _channel;
  std::unique_ptr<Codec> _codec;
  std::thread _worker;

  WakeUp _wakeUp;
  std::mutex _mutex;
  OMX_STATETYPE _state = OMX_StateLoaded;
  OMX_STATETYPE _target = OMX_StateLoaded;    // where the accepted commands lead
  OMX_STATETYPE _awaited = OMX_StateInvalid;  // Idle or Loaded while that waits for buffers, else Invalid
  std::deque<Command> _commands;
  std::array<Port, kPortCount> _ports;
  unsigned _revision = 0;  // counts changes of the definitions
  Settings _settings = Settings::Agreed;
  OMX_U32 _settingsIndex = 0;  // second word of the announcement
  std::vector<android::omx_message> _deferred;
  bool _configureDue = false;
  bool _signalled = false;
  bool _asleep = false;
  bool _stopping = false;
  // When an output buffer last went to the client or came from it.
  std::chrono::steady_clock::time_point _lastExchange;

  bool _started = false;
  bool _draining = false;
  OMX_TICKS _drainTime = 0;
  bool _awaitsReader = false;  // in this round new settings wait for a client that reads older output
};

}  // namespace mediaserver
