#pragma once

#include <cstdint>
#include <functional>
#include <memory>
#include <string>
#include <string_view>
#include <vector>

#include "access/CommandDevice.h"
#include "access/Complaints.h"

namespace vesprun {

/// The device of a command that changes nothing on it, installed as the platform. Lines for the
/// system log become the command's complaints.
struct ReadOnlyDevice {
  explicit ReadOnlyDevice(LogLevel least = LogLevel::Error,
                          OwnersRights rights = OwnersRights::ForGood)
      : complaints(nullptr, least),
        device(openDeviceReadOnly(complaints, rights)),
        installed(*device) {}

  Complaints complaints;
  std::unique_ptr<HostPlatform> device;
  InstalledPlatform installed;
};

inline constexpr const char* kUnreadableCounters = "counters cannot be read";

using RowHandler = std::function<void(bool isDistribution, std::string_view key)>;

/// Calls `take` with the key of each row of the days `first` to `last`, both included, that begins
/// with `keyPrefix`: scalars before distributions, each by day and then key. False when the
/// counters cannot be read to their end; the system log has the reason.
bool forEachRow(std::int32_t first, std::int32_t last, const RowHandler& take,
                std::string_view keyPrefix = {});
/// The same of all days.
bool forEachRow(const RowHandler& take, std::string_view keyPrefix = {});

/// The keys that were counted, as completion offers them.
std::vector<std::string> countedKeys();

}  // namespace vesprun
