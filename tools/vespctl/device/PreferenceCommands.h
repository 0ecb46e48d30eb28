#pragma once

#include <CLI/CLI.hpp>

namespace vesprun {

void addPreferenceCommands(CLI::App& command);

}  // namespace vesprun
