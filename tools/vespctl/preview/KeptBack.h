#pragma once

#include <cstdint>
#include <optional>
#include <string>
#include <vector>

namespace vesprun {

/// A key with a row in the counter database that the whitelist keeps on the device.
struct KeptBack {
  bool isDistribution;
  std::string key;
};

/// The keys of the rows of the days `first` to `last`, both included, that are kept back, each at
/// its first place; without a usable whitelist all of them. Nothing when the counters cannot be
/// read to their end. The system log has the reason of both.
std::optional<std::vector<KeptBack>> keysKeptBack(std::int32_t first, std::int32_t last);

}  // namespace vesprun
