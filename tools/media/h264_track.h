// The access units of any file with H.264 video in it.
#pragma once

#include <memory>
#include <stop_token>
#include <string>

#include "tools/h264/access_units.h"

namespace tool {

// An H.264 byte stream (Annex B), or the H.264 track of a file that libavformat opens.
Result<std::unique_ptr<AccessUnitSource>> openAccessUnits(const std::string& path,
                                                          const std::stop_token& stop);

}  // namespace tool
