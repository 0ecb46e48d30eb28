#pragma once

#include <cstdint>
#include <map>
#include <optional>
#include <string>
#include <vector>

namespace vesprun {

/// What a network interface has carried since it came up.
struct InterfaceReading {
  std::string name;
  std::int64_t bytesReceived = 0;
  std::int64_t bytesSent = 0;
};

std::vector<InterfaceReading> readInterfaces();

/// When the machine started, in seconds since 1970.
std::optional<std::int64_t> startOfSystem();

/// What `vespctl collect` counts, as it stands now: from the start of the machine on.
std::map<std::string, std::int64_t> readKernelCounters();

/// A burst of readings: how late the kernel wakes a sleeping process, and what `vespctl collect`
/// reads of the memory. Takes some 30 milliseconds.
std::map<std::string, std::vector<double>> takeReadingBurst();

}  // namespace vesprun
