#pragma once

#include <CLI/CLI.hpp>

namespace vesprun {

void addPruneCommand(CLI::App& command);

}  // namespace vesprun
