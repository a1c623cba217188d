// The media server's components as one device has them. Any thread.
#pragma once

#include <vector>

#include <omxhost/device.h>

#include "host/mediaserver/codec.h"

namespace mediaserver {

// Empty for a device without components.
std::vector<Component> componentsOf(const omxhost::Device& device);

}  // namespace mediaserver
