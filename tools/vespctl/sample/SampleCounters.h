#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

namespace vesprun {

/// One reading of a scalar counter.
struct ScalarReading {
  std::string key;
  std::int64_t value;
};

/// Repeated readings of one quantity.
struct DistributionReadings {
  std::string key;
  std::vector<double> values;
};

/// What a network interface has carried since it came up.
struct InterfaceReading {
  std::string name;
  std::int64_t bytesReceived = 0;
  std::int64_t bytesSent = 0;
};

std::vector<InterfaceReading> readInterfaces();

/// A figure of the kernel's scheduler: "ctxt" (context switches), "processes" (forks), "btime"
/// (when the machine started, in seconds since 1970).
std::optional<std::int64_t> readSchedulerFigure(std::string_view name);

/// Counters of the running kernel, as they stand now: memory, disks, network interfaces and the
/// scheduler. What the kernel does not offer is left out.
std::vector<ScalarReading> readKernelCounters();

/// A burst of readings: how late the kernel wakes a sleeping process, how much memory is free, and
/// how many context switches happen between two readings. Takes about a quarter of a second.
std::vector<DistributionReadings> takeReadingBurst();

}  // namespace vesprun
