#pragma once

#include <cstdint>
#include <string>
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

/// Counters of the running kernel, as they stand now: memory, disks, network interfaces and the
/// scheduler. What the kernel does not offer is left out.
std::vector<ScalarReading> readKernelCounters();

/// A burst of readings: how late the kernel wakes a sleeping process, how much memory is free, and
/// how many context switches happen between two readings. Takes about a quarter of a second.
std::vector<DistributionReadings> takeReadingBurst();

}  // namespace vesprun
