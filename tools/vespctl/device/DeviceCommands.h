#pragma once

#include <CLI/CLI.hpp>

namespace vesprun {

void addInitCommand(CLI::App& command);
void addRunCommand(CLI::App& command);

}  // namespace vesprun
