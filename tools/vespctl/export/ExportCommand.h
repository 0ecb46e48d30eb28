#pragma once

#include <CLI/CLI.hpp>

namespace vesprun {

void addExportCommand(CLI::App& command);

}  // namespace vesprun
