#pragma once

#include <CLI/CLI.hpp>

namespace vesprun {

void addDaysCommand(CLI::App& command);

}  // namespace vesprun
