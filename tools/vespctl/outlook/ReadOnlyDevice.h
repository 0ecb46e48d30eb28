#pragma once

#include <memory>
#include <string>

#include "Command.h"
#include "Complaints.h"

namespace vesprun {

/// The device of a command that changes nothing on it, installed as the platform. Lines for the
/// system log become the command's complaints.
struct ReadOnlyDevice {
  explicit ReadOnlyDevice(const std::string& directory, LogLevel least = LogLevel::Error)
      : complaints(nullptr, least),
        device(openDeviceReadOnly(directory, complaints)),
        installed(*device) {}

  Complaints complaints;
  std::unique_ptr<HostPlatform> device;
  InstalledPlatform installed;
};

inline constexpr const char* kUnreadableCounters = "counters cannot be read";

}  // namespace vesprun
