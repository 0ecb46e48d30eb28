#pragma once

#include <CLI/CLI.hpp>

namespace vesprun {

void addWhitelistCommands(CLI::App& command);

}  // namespace vesprun
