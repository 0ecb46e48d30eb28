#pragma once

#include <CLI/CLI.hpp>

namespace vesprun {

void addDecodeCommand(CLI::App& command);

}  // namespace vesprun
