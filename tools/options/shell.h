// What shells and man know of the command line, made from the command line itself.
#pragma once

#include <CLI/CLI.hpp>
#include <string>

namespace tool {

// `shell` is bash or zsh.
std::string completionScript(const CLI::App& app, const std::string& shell);
// A manual page in roff.
std::string manualPage(const CLI::App& app);

}  // namespace tool
