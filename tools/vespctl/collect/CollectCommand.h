#pragma once

#include <CLI/CLI.hpp>

namespace vesprun {

void addCollectCommand(CLI::App& command);

}  // namespace vesprun
