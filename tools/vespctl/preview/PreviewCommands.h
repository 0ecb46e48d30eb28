#pragma once

#include <CLI/CLI.hpp>

namespace vesprun {

void addPreviewCommand(CLI::App& command);
void addExplainCommand(CLI::App& command);

}  // namespace vesprun
