#include "interface/OpenDevice.h"

#include <unistd.h>

#include <mutex>
#include <utility>

#include "platform/host/counters/HostTallybook.h"

namespace vesprun {
namespace {

/// Held while a device is opened or closed: of two threads that open one, the second is refused.
std::mutex gInstallationMutex;

vesprun_error codeOf(CounterTrouble trouble) {
  switch (trouble) {
    case CounterTrouble::Busy:
      return VESPRUN_ERROR_BUSY;
    case CounterTrouble::Full:
      return VESPRUN_ERROR_FULL;
    case CounterTrouble::NewerFile:
      return VESPRUN_ERROR_TOO_OLD;
    case CounterTrouble::Other:
      break;
  }
  return VESPRUN_ERROR_OTHER;
}

}  // namespace

OpenDevice::OpenDevice(std::unique_ptr<HostPlatform> platform)
    : _process(getpid()),
      _platform(std::move(platform)),
      _installed(std::make_unique<InstalledPlatform>(*_platform)) {}

OpenDevice::OpenDevice(std::unique_ptr<CounterSocket> socket)
    : _process(getpid()), _socket(std::move(socket)) {}

OpenDevice::~OpenDevice() {
  if (_socket && _process == getpid()) {
    try {
      CallFailure lost;
      _socket->flush(lost);
    } catch (const std::exception&) {  // no memory for the reason
    }
  }
  if (_process != getpid()) {
    _installed.reset();
    static_cast<void>(_platform.release());  // its services would write at their end
    return;
  }
  const std::scoped_lock guard(gInstallationMutex);
  _installed.reset();
  _platform.reset();
}

std::unique_ptr<OpenDevice> OpenDevice::open(const std::string& path, CallFailure& failure) {
  if (CounterSocket::isSocket(path)) {
    std::unique_ptr<CounterSocket> socket = CounterSocket::open(path, failure);
    return std::unique_ptr<OpenDevice>(socket ? new OpenDevice(std::move(socket)) : nullptr);
  }
  const std::scoped_lock guard(gInstallationMutex);
  if (platformIsInstalled()) {
    failure.set(VESPRUN_ERROR_BUSY, path + ": another device is open");
    return nullptr;
  }
  failure.code = VESPRUN_ERROR_NOT_A_DEVICE;
  std::unique_ptr<HostPlatform> platform = HostPlatform::open(path, failure.text);
  return std::unique_ptr<OpenDevice>(platform ? new OpenDevice(std::move(platform)) : nullptr);
}

bool OpenDevice::isOfThisProcess(CallFailure& failure) const {
  return _process == getpid() ||
         failure.set(VESPRUN_ERROR_FORKED,
                     "the device was opened before this process was forked: close it here, and "
                     "open it again");
}

bool OpenDevice::hasEntryPoints(CallFailure& failure) const {
  return isOfThisProcess(failure) &&
         (!_socket || failure.set(VESPRUN_ERROR_SOCKET, "not over a socket, which takes counters"));
}

// Of a device directory only the key can be refused.

bool OpenDevice::setScalar(std::string_view key, std::int64_t value, CallFailure& failure) {
  failure.code = VESPRUN_ERROR_KEY;
  return isOfThisProcess(failure) &&
         (_socket ? _socket->setScalar(key, value, failure)
                  : _platform->counters().setScalar(key, value, failure.text));
}

bool OpenDevice::addToScalar(std::string_view key, std::int64_t value, CallFailure& failure) {
  failure.code = VESPRUN_ERROR_KEY;
  return isOfThisProcess(failure) &&
         (_socket ? _socket->addToScalar(key, value, failure)
                  : _platform->counters().addToScalar(key, value, failure.text));
}

bool OpenDevice::addToDistribution(std::string_view key, double value, CallFailure& failure) {
  failure.code = VESPRUN_ERROR_KEY;
  return isOfThisProcess(failure) &&
         (_socket ? _socket->addToDistribution(key, value, failure)
                  : _platform->counters().addSample(key, value, failure.text));
}

bool OpenDevice::checkpoint(CallFailure& failure) {
  if (!isOfThisProcess(failure)) {
    return false;
  }
  if (_socket) {
    return _socket->flush(failure);
  }
  CounterTrouble trouble = CounterTrouble::Other;
  const bool done = _platform->counters().checkpoint(failure.text, &trouble);
  failure.code = codeOf(trouble);
  return done;
}

}  // namespace vesprun
