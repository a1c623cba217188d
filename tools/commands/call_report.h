// A call's figures for people and for scripts.
#pragma once

#include <string>
#include <utility>
#include <vector>

#include "tools/commands/call.h"

namespace tool {

// Files that were written: what is in them, and the path.
using WrittenFiles = std::vector<std::pair<std::string, std::string>>;

// A table, each line with its end.
std::string callSummary(const CallReport& report, const WrittenFiles& files);
// One JSON object on one line, with its end.
std::string callJson(const CallReport& report, bool interrupted);

}  // namespace tool
