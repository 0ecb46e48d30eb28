#pragma once

#include <CLI/CLI.hpp>

namespace vesprun {

void addListenCommand(CLI::App& command);

}  // namespace vesprun
