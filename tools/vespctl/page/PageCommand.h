#pragma once

#include <CLI/CLI.hpp>

namespace vesprun {

void addPageCommand(CLI::App& command);

}  // namespace vesprun
