#pragma once

#include <CLI/CLI.hpp>

namespace vesprun {

void addNandCommands(CLI::App& command);

}  // namespace vesprun
