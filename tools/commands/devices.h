// What there is: the devices that this host can pose as, and the components of the media server.
#pragma once

#include <string>

#include "tools/base/failure.h"

namespace tool {

// The device in force, for a header: "msm8960 (ro.board.platform msm8960), hardware version 1 (other
// Qualcomm)".
std::string deviceLine();
// Its components, as the library will ask for them.
std::string componentsLine();

// A table or one JSON object, with its end. Poses as one device after the other: to be called before the
// first session, and followed by none.
std::string listDevices(bool json);
// What the media server has and what the device's sessions use.
Result<std::string> listComponents(bool json);

}  // namespace tool
