#pragma once

#include <CLI/CLI.hpp>

namespace vesprun {

void addShowCommand(CLI::App& command);

}  // namespace vesprun
