#pragma once

#include <CLI/CLI.hpp>

namespace vesprun {

void addFieldsCommand(CLI::App& command);

}  // namespace vesprun
