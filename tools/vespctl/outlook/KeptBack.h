#pragma once

#include <cstdint>
#include <functional>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

namespace vesprun {

/// A key with a row in the counter database that the whitelist keeps on the device.
struct KeptBack {
  bool isDistribution;
  std::string key;
};

/// Calls `take` with the key of each row of the days `first` to `last`, both included: scalars
/// before distributions, each by day and then key. False when the counters cannot be read to their
/// end; the system log has the reason.
bool forEachRow(std::int32_t first, std::int32_t last,
                const std::function<void(bool isDistribution, std::string_view key)>& take);

/// The keys of these rows that are kept back, each at its first place; without a usable whitelist
/// all of them. Nothing when the counters cannot be read to their end. The system log has the
/// reason of both.
std::optional<std::vector<KeptBack>> keysKeptBack(std::int32_t first, std::int32_t last);

}  // namespace vesprun
