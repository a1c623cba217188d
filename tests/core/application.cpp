#include "tests/core/application.h"

#include <utility>

#include "tests/core/bounded.h"

namespace omxtest {

void Application::attach(OmxInterface& session) {
  session.registerInputCallback(&Application::inputCallback, this);
  session.registerOutputCallback(&Application::outputCallback, this);
}

void Application::onOutput(OutputHandler handler) {
  const std::lock_guard<std::mutex> lock(_mutex);
  _outputHandler = std::move(handler);
}

void Application::onInput(std::function<void()> handler) {
  const std::lock_guard<std::mutex> lock(_mutex);
  _inputHandler = std::move(handler);
}

std::vector<Output> Application::outputs() const {
  const std::lock_guard<std::mutex> lock(_mutex);
  return _outputs;
}

std::vector<std::string> Application::outputTexts() const {
  std::vector<std::string> texts;
  for (const Output& output : outputs()) texts.push_back(output.bytes);
  return texts;
}

size_t Application::inputCallbacks() const {
  const std::lock_guard<std::mutex> lock(_mutex);
  return _inputCallbacks;
}

void* Application::inputSession() const {
  const std::lock_guard<std::mutex> lock(_mutex);
  return _inputSession;
}

void Application::waitForOutputs(size_t count) const {
  std::unique_lock<std::mutex> lock(_mutex);
  require(_changed.wait_for(lock, kWaitLimit, [&] { return _outputs.size() >= count; }), "an output");
}

void Application::waitForInputCallbacks(size_t count) const {
  std::unique_lock<std::mutex> lock(_mutex);
  require(_changed.wait_for(lock, kWaitLimit, [&] { return _inputCallbacks >= count; }), "an input callback");
}

int Application::inputCallback(void* session, void* context) {
  auto& self = *static_cast<Application*>(context);
  std::function<void()> handler;
  {
    const std::lock_guard<std::mutex> lock(self._mutex);
    ++self._inputCallbacks;
    self._inputSession = session;
    self._changed.notify_all();
    handler = self._inputHandler;
  }
  if (handler) handler();
  return 1;  // the session ignores it
}

int Application::outputCallback(void* first, void* data, unsigned int length, void* bufferId, void* context,
                                unsigned int timestamp) {
  auto& self = *static_cast<Application*>(context);
  Output output{first, data, {}, length, bufferId, timestamp};
  if (data != nullptr && self._readsData) output.bytes.assign(static_cast<const char*>(data), length);
  OutputHandler handler;
  {
    const std::lock_guard<std::mutex> lock(self._mutex);
    self._outputs.push_back(output);
    self._changed.notify_all();
    handler = self._outputHandler;
  }
  return handler ? handler(output) : 0;
}

}  // namespace omxtest
