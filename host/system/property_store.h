// The properties' store, for the parts of the host that provide first values. Any thread.
#pragma once

namespace omxhost {

// Sets a property without looking at the device, which may be settling right now.
void storeProperty(const char* key, const char* value);

}  // namespace omxhost
