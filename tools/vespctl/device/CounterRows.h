#pragma once

#include <CLI/CLI.hpp>

namespace vesprun {

/// The command `counters get`.
void addGetCounters(CLI::App& command);

}  // namespace vesprun
