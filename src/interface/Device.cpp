#include "vesprun/Device.h"

#include <exception>

#include "interface/OpenDevice.h"

namespace vesprun {
namespace {

/// What the body returns; false, with a text in `error`, when that is false or it throws.
template <typename Body>
bool runForProgram(std::string& error, const Body& body) noexcept {
  try {
    try {
      CallFailure failure;
      const bool done = body(failure);
      if (!done) {
        error.swap(failure.text);
      }
      return done;
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
  std::unique_ptr<OpenDevice> device;
};

Device::Device(std::unique_ptr<Installation> installation)
    : _installation(std::move(installation)) {}

Device::~Device() = default;

std::unique_ptr<Device> Device::open(const std::string& path, std::string& error) noexcept {
  std::unique_ptr<Device> device;
  runForProgram(error, [&](CallFailure& failure) {
    auto installation = std::make_unique<Installation>();
    installation->device = OpenDevice::open(path, failure);
    if (!installation->device) {
      return false;
    }
    // NOLINTNEXTLINE(bugprone-unhandled-exception-at-new): runForProgram catches it
    device.reset(new Device(std::move(installation)));
    return true;
  });
  return device;
}

bool Device::setScalar(std::string_view key, std::int64_t value, std::string& error) noexcept {
  return runForProgram(error, [&](CallFailure& failure) {
    return _installation->device->setScalar(key, value, failure);
  });
}

bool Device::addToScalar(std::string_view key, std::int64_t value, std::string& error) noexcept {
  return runForProgram(error, [&](CallFailure& failure) {
    return _installation->device->addToScalar(key, value, failure);
  });
}

bool Device::addToDistribution(std::string_view key, double value, std::string& error) noexcept {
  return runForProgram(error, [&](CallFailure& failure) {
    return _installation->device->addToDistribution(key, value, failure);
  });
}

bool Device::checkpoint(std::string& error) noexcept {
  return runForProgram(
      error, [&](CallFailure& failure) { return _installation->device->checkpoint(failure); });
}

}  // namespace vesprun
