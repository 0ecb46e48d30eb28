#pragma once

#include <CLI/CLI.hpp>
#include <string_view>

namespace vesprun {

/// Locked by an upload as long as it works. It is there once one was tried.
inline constexpr std::string_view kUploadLock = "run/upload.lock";

void addUploadCommand(CLI::App& command);

}  // namespace vesprun
