#include "Device.h"

#include <exception>
#include <mutex>

#include "platform/host/HostPlatform.h"
#include "platform/host/counters/HostTallybook.h"

namespace vesprun {
namespace {

/// Held while a device is opened or closed: of two threads that open one, the second is refused.
std::mutex gInstallationMutex;

/// What the body returns; false, with a text in `error`, when it throws.
template <typename Body>
bool runForProgram(std::string& error, const Body& body) noexcept {
  try {
    try {
      return body();
    } catch (const std::exception& failure) {
      error = failure.what();
    }
  } catch (const std::exception&) {
    error = "out of memory";  // short enough to need none
  }
  return false;
}

}  // namespace

struct Device::Installation {
  explicit Installation(std::unique_ptr<HostPlatform> opened) : platform(std::move(opened)) {}

  std::unique_ptr<HostPlatform> platform;
  InstalledPlatform installed{*platform};
};

Device::Device(std::unique_ptr<Installation> installation)
    : _installation(std::move(installation)) {}

Device::~Device() {
  const std::scoped_lock guard(gInstallationMutex);
  _installation.reset();
}

std::unique_ptr<Device> Device::open(const std::string& path, std::string& error) noexcept {
  std::unique_ptr<Device> device;
  runForProgram(error, [&] {
    const std::scoped_lock guard(gInstallationMutex);
    if (platformIsInstalled()) {
      error = path + ": another device is open";
    } else if (std::unique_ptr<HostPlatform> platform = HostPlatform::open(path, error)) {
      // NOLINTNEXTLINE(bugprone-unhandled-exception-at-new): runForProgram catches it
      device.reset(new Device(std::make_unique<Installation>(std::move(platform))));
    }
    return true;
  });
  return device;
}

bool Device::setScalar(std::string_view key, std::int64_t value, std::string& error) noexcept {
  return runForProgram(
      error, [&] { return _installation->platform->counters().setScalar(key, value, error); });
}

bool Device::addToScalar(std::string_view key, std::int64_t value, std::string& error) noexcept {
  return runForProgram(
      error, [&] { return _installation->platform->counters().addToScalar(key, value, error); });
}

bool Device::addToDistribution(std::string_view key, double value, std::string& error) noexcept {
  return runForProgram(
      error, [&] { return _installation->platform->counters().addSample(key, value, error); });
}

bool Device::checkpoint(std::string& error) noexcept {
  return runForProgram(error,
                       [&] { return _installation->platform->counters().checkpoint(error); });
}

}  // namespace vesprun
