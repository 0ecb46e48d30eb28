#pragma once

#include <CLI/CLI.hpp>

namespace vesprun {

void addPtreeCommand(CLI::App& command);

}  // namespace vesprun
