// A call as one HTML page that needs nothing else: no network, no scripts.
#pragma once

#include <string>

#include "tools/commands/call.h"
#include "tools/report/snapshots.h"

namespace tool {

std::string htmlReport(const CallReport& report, const SnapshotTaker::Kept& snapshots);

}  // namespace tool
