#pragma once

#include <CLI/CLI.hpp>

namespace vesprun {

void addCatchUpCommand(CLI::App& command);

}  // namespace vesprun
