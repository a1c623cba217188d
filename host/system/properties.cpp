#include <string.h>

#include <algorithm>
#include <functional>
#include <map>
#include <mutex>
#include <string>

#include <cutils/properties.h>
#include <omxhost/device.h>

#include "host/system/property_store.h"

namespace {

// Never destroyed: threads may still ask while the process exits.
struct Store {
  std::mutex mutex;
  std::map<std::string, std::string, std::less<>> values;

  static Store& instance() {
    static Store& store = *new Store();
    return store;
  }
};

int copyOut(const std::string& text, char* value) {
  const size_t length = std::min<size_t>(text.size(), PROPERTY_VALUE_MAX - 1);
  memcpy(value, text.data(), length);
  value[length] = '\0';
  return static_cast<int>(length);
}

}  // namespace

void omxhost::storeProperty(const char* key, const char* value) {
  Store& store = Store::instance();
  const std::lock_guard lock(store.mutex);
  store.values.insert_or_assign(key, value);
}

int property_get(const char* key, char* value, const char* default_value) {
  (void)omxhost::posedDevice();  // Its values are in the store once it is settled.
  Store& store = Store::instance();
  const std::lock_guard lock(store.mutex);
  const auto entry = key != nullptr ? store.values.find(key) : store.values.end();
  if (entry != store.values.end() && !entry->second.empty()) return copyOut(entry->second, value);
  return copyOut(default_value != nullptr ? default_value : "", value);
}

int property_set(const char* key, const char* value) {
  const char* const text = value != nullptr ? value : "";
  if (key == nullptr || *key == '\0') return -1;
  if (strnlen(key, PROPERTY_KEY_MAX) == PROPERTY_KEY_MAX) return -1;
  if (strnlen(text, PROPERTY_VALUE_MAX) == PROPERTY_VALUE_MAX) return -1;
  (void)omxhost::posedDevice();  // Before, so that its values do not replace this one.
  omxhost::storeProperty(key, text);
  return 0;
}
