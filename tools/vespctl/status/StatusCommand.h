#pragma once

#include <CLI/CLI.hpp>

namespace vesprun {

void addStatusCommand(CLI::App& command);

}  // namespace vesprun
