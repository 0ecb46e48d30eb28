#pragma once

#include <memory>
#include <string>

#include "Command.h"
#include "Complaints.h"

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

}  // namespace vesprun
