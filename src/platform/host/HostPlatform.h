#pragma once

#include <memory>
#include <string>

#include "platform/Platform.h"
#include "platform/host/device/DeviceDescription.h"
#include "platform/host/device/DeviceDirectory.h"

namespace vesprun {

class HostDeviceRegistry;
class HostTallybook;

/// The platform of one device directory on the running Linux system. What the services hold back is
/// written when it is destroyed.
class HostPlatform : public Platform {
 public:
  /// Reads the description of the device. Nothing, with a text in `error` that names the place,
  /// when the folder or its `device.json` cannot be used. A described time zone is that of the
  /// whole process, in its environment variable TZ, until the platform is destroyed.
  static std::unique_ptr<HostPlatform> open(const std::string& path, std::string& error);

  ~HostPlatform();

  const DeviceDirectory& directory() const;
  const DeviceDescription& description() const;
  /// The counter database with the operations that only tools need.
  HostTallybook& counters();
  /// The described registry, which knows which handles are out; `deviceRegistry` may be another one
  /// that watches the calls to it.
  HostDeviceRegistry& describedRegistry();

 private:
  struct Services;

  explicit HostPlatform(std::unique_ptr<Services> services);

  std::unique_ptr<Services> _services;
};

}  // namespace vesprun
