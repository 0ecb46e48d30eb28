#include "Device.h"

#include <exception>

#include "platform/host/HostPlatform.h"

namespace vesprun {

struct Device::Installation {
  explicit Installation(std::unique_ptr<HostPlatform> opened) : platform(std::move(opened)) {}

  std::unique_ptr<HostPlatform> platform;
  InstalledPlatform installed{*platform};
};

Device::Device(std::unique_ptr<Installation> installation)
    : _installation(std::move(installation)) {}

Device::~Device() = default;

std::unique_ptr<Device> Device::open(const std::string& path, std::string& error) noexcept {
  try {
    try {
      if (platformIsInstalled()) {
        error = path + ": another device is open";
      } else if (std::unique_ptr<HostPlatform> platform = HostPlatform::open(path, error)) {
        return std::unique_ptr<Device>(
            new Device(std::make_unique<Installation>(std::move(platform))));
      }
    } catch (const std::exception& failure) {
      error = path + ": " + failure.what();
    }
  } catch (const std::exception&) {
    error = "out of memory";  // short enough to need none
  }
  return nullptr;
}

}  // namespace vesprun
