// The temporary files of this process, so that a hard end (the second Ctrl-C) leaves none behind.
// Any thread may call these functions.
#pragma once

#include <string>

namespace tool {

void noteTemporaryFile(const std::string& path);
void forgetTemporaryFile(const std::string& path);
void removeTemporaryFiles();

}  // namespace tool
