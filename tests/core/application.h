// The application's side of a session: its two callbacks, which note what they are given and then do what
// the test says. They run on the session's and the delivery threads; a test may ask from its own.
#pragma once

#include <atomic>
#include <functional>
#include <mutex>
#include <string>
#include <vector>

#include "core/omx_interface.h"
#include "omxbridge/decoded_picture.h"
#include "tests/core/bounded.h"
#include "tests/support/journal.h"

namespace omxtest {

// One call of the output callback.
struct Output {
  void* first = nullptr;   // the session, or a decoder's description of the picture
  DECODEDDATAINFO info{};  // ... as it was during the call
  void* data = nullptr;
  std::string bytes;  // what lay there during the call; nothing for a null address
  unsigned int length = 0;
  void* bufferId = nullptr;
  unsigned int timestamp = 0;
};

class Application {
 public:
  using OutputHandler = std::function<int(const Output&)>;

  // Registers both callbacks with this object as their context.
  void attach(OmxInterface& session) {
    _session = &session;
    session.registerInputCallback(&Application::inputCallback, this);
    session.registerOutputCallback(&Application::outputCallback, this);
  }

  // What the callbacks do after noting the call; an output handler's value is the callback's result (0
  // without one). May block.
  void onOutput(OutputHandler handler) {
    const std::lock_guard<std::mutex> lock(_mutex);
    _outputHandler = std::move(handler);
  }
  void onInput(std::function<void()> handler) {
    const std::lock_guard<std::mutex> lock(_mutex);
    _inputHandler = std::move(handler);
  }
  // For tests whose forged messages make the session deliver what the component is still writing.
  void leaveDataAlone() { _readsData = false; }

  std::vector<Output> outputs() const { return _outputs.all(); }
  std::vector<std::string> outputTexts() const {
    std::vector<std::string> texts;
    for (const Output& output : outputs()) texts.push_back(output.bytes);
    return texts;
  }
  // The session that each call of the input callback named.
  std::vector<void*> inputCallbacks() const { return _inputs.all(); }
  // Until the callbacks have been called that often.
  [[nodiscard]] bool waitForCalls(size_t inputs, size_t outputs,
                                  std::chrono::milliseconds limit = kWaitLimit) const {
    return _inputs.waitFor([](void*) { return true; }, inputs, limit) &&
           _outputs.waitFor([](const Output&) { return true; }, outputs, limit);
  }
  void waitForOutputs(size_t count) const { require(waitForCalls(0, count), "an output"); }

 private:
  static int inputCallback(void* session, void* context) {
    auto& self = *static_cast<Application*>(context);
    std::unique_lock<std::mutex> lock(self._mutex);
    const auto handler = self._inputHandler;
    lock.unlock();
    self._inputs.add(session);
    if (handler) handler();
    return 1;  // the session ignores it
  }
  static int outputCallback(void* first, void* data, unsigned int length, void* bufferId, void* context,
                            unsigned int timestamp) {
    auto& self = *static_cast<Application*>(context);
    Output output{first, {}, data, {}, length, bufferId, timestamp};
    if (first != self._session) output.info = *static_cast<const DECODEDDATAINFO*>(first);
    if (data != nullptr && self._readsData) output.bytes.assign(static_cast<const char*>(data), length);
    std::unique_lock<std::mutex> lock(self._mutex);
    const OutputHandler handler = self._outputHandler;
    lock.unlock();
    self._outputs.add(output);
    return handler ? handler(output) : 0;
  }

  std::atomic<void*> _session{nullptr};
  std::atomic<bool> _readsData{true};
  std::mutex _mutex;  // guards the handlers; not held in them
  OutputHandler _outputHandler;
  std::function<void()> _inputHandler;
  Journal<Output> _outputs;
  Journal<void*> _inputs;
};

}  // namespace omxtest
