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

/// Those of the rows of days `first` to `last`, both included: scalars before distributions, each
/// by day and then key, a repeated key at its first place. Without a usable whitelist they are all
/// keys. Nothing when the counters cannot be read to their end. The system log has the reason of
/// both.
std::optional<std::vector<KeptBack>> keysKeptBack(std::int32_t first, std::int32_t last);

}  // namespace vesprun
