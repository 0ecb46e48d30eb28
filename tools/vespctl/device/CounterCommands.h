#pragma once

#include <CLI/CLI.hpp>

namespace vesprun {

void addCounterCommands(CLI::App& command);

}  // namespace vesprun
