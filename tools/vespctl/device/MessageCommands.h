#pragma once

#include <CLI/CLI.hpp>

namespace vesprun {

void addMessageCommands(CLI::App& command);

}  // namespace vesprun
