#pragma once

#include <CLI/CLI.hpp>
#include <string>
#include <vector>

namespace vesprun {

/// The command `counters get`.
void addGetCounters(CLI::App& command);

/// The keys that the counter database has rows of, for completion.
std::vector<std::string> counterKeys();

}  // namespace vesprun
