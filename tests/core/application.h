// The application's side of a session: its two callbacks, which note what they are given and then do what
// the test says. The callbacks run on the session's and the delivery threads; a test may ask from its own.
#pragma once

#include <atomic>
#include <condition_variable>
#include <functional>
#include <mutex>
#include <string>
#include <vector>

#include "core/omx_interface.h"
#include "omxbridge/decoded_picture.h"

namespace omxtest {

// One call of the output callback.
struct Output {
  void* first = nullptr;  // the session, or a decoder's description of the picture
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
  void attach(OmxInterface& session);

  // What the callbacks do after noting the call; an output handler's value is the callback's result (0
  // without one). May block.
  void onOutput(OutputHandler handler);
  void onInput(std::function<void()> handler);
  // For tests whose forged messages make the session deliver what the component is still writing.
  void leaveDataAlone() { _readsData = false; }

  std::vector<Output> outputs() const;
  std::vector<std::string> outputTexts() const;
  // How often the input callback was called, and the session that the last call named.
  size_t inputCallbacks() const;
  void* inputSession() const;

  // End the program where the limit passes.
  void waitForOutputs(size_t count) const;
  void waitForInputCallbacks(size_t count) const;

  static int inputCallback(void* session, void* context);
  static int outputCallback(void* first, void* data, unsigned int length, void* bufferId, void* context,
                            unsigned int timestamp);

 private:
  std::atomic<bool> _readsData{true};
  mutable std::mutex _mutex;  // guards everything below; not held in handlers
  mutable std::condition_variable _changed;
  OutputHandler _outputHandler;
  std::function<void()> _inputHandler;
  std::vector<Output> _outputs;
  size_t _inputCallbacks = 0;
  void* _inputSession = nullptr;
};

}  // namespace omxtest
