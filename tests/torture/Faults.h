#pragma once

#include <cstdint>
#include <filesystem>
#include <functional>
#include <string>
#include <vector>

#include "Scenarios.h"
#include "TracedRun.h"

namespace vesprun::torture {

/// What broke, a sentence each.
using Faults = std::vector<std::string>;

Faults& operator+=(Faults& faults, const Faults& more);

/// What of `wanted` is not `there`, each as a fault that begins with `what`; a few at most.
Faults missingFrom(const std::vector<std::string>& wanted, const std::vector<std::string>& there,
                   const std::string& what);

/// Hangs, signals, exit statuses and error texts. `started`: not while the loader was at work.
/// `worst`: the highest exit status that is promised.
Faults judgeRun(const Outcome& outcome, bool killed, bool started, int worst = 0);

/// The place of the program's first own call. Before it the system's loader is at work, whose last
/// act is to let go of its list of libraries; what fails there keeps the program from starting.
std::size_t firstOwnCall(const std::vector<Call>& calls);

using RunWithFault =
    std::function<Faults(const std::filesystem::path& work, const Fault& fault, bool started)>;

/// Each call fails in one way (`full`: in every way), with `alsoShort` transfers half, and is the
/// last one.
std::vector<Case> faultsOfCalls(const std::string& name, const std::vector<Call>& calls,
                                std::uint32_t seed, bool full, bool alsoShort,
                                const RunWithFault& run);

}  // namespace vesprun::torture
