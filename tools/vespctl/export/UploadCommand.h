#pragma once

#include <CLI/CLI.hpp>

namespace vesprun {

void addUploadCommand(CLI::App& command);

}  // namespace vesprun
