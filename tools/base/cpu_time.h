// Processor time of the whole process, in user and system mode, in seconds.
#pragma once

namespace tool {

double processCpuSeconds();

}  // namespace tool
