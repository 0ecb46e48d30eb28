#pragma once

#include <memory>
#include <string>

#include "platform/Platform.h"
#include "platform/host/device/DeviceDescription.h"
#include "platform/host/device/DeviceDirectory.h"

namespace vesprun {

class HostDeviceRegistry;
class HostTallybook;

/// The platform of a device directory on Linux. When it is destroyed, its services write what they
/// held back.
class HostPlatform : public Platform {
 public:
  /// Reads the device's description. Null, with the place in `error`, when the folder or its
  /// `device.json` cannot be used.
  ///
  /// With `readOnlyLog`, the system log, which outlives the platform, nothing on the device is
  /// changed, and it need not be writable: changes of preferences hold for this platform alone.
  static std::unique_ptr<HostPlatform> open(const std::string& path, std::string& error,
                                            SystemLog* readOnlyLog = nullptr);

  ~HostPlatform();

  const DeviceDirectory& directory() const;
  const DeviceDescription& description() const;
  /// With the operations that only tools need.
  HostTallybook& counters();
  /// Counts the handles that are out; a test may put a registry of its own before it as
  /// `deviceRegistry`.
  HostDeviceRegistry& describedRegistry();

 private:
  struct Services;

  explicit HostPlatform(std::unique_ptr<Services> services);

  std::unique_ptr<Services> _services;
};

}  // namespace vesprun
