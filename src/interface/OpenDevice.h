#pragma once

#include <cstdint>
#include <memory>
#include <string>
#include <string_view>

#include "interface/CallFailure.h"
#include "interface/CounterSocket.h"
#include "platform/host/HostPlatform.h"

namespace vesprun {

/// The device that this process has open, or the socket of `vespctl listen`, below the C and the
/// C++ interface. Operations throw when memory runs out; false, with the reason in `failure`, on
/// any other failure. A process that was forked after the device was opened is refused: both would
/// write what was collected before.
class OpenDevice {
 public:
  /// Null with the reason in `failure`.
  static std::unique_ptr<OpenDevice> open(const std::string& path, CallFailure& failure);
  /// Writes what is collected, except in a forked process.
  ~OpenDevice();

  OpenDevice(const OpenDevice&) = delete;
  OpenDevice& operator=(const OpenDevice&) = delete;

  bool setScalar(std::string_view key, std::int64_t value, CallFailure& failure);
  bool addToScalar(std::string_view key, std::int64_t value, CallFailure& failure);
  bool addToDistribution(std::string_view key, double value, CallFailure& failure);
  bool checkpoint(CallFailure& failure);

  /// False over a socket, and in a process that was forked after the device was opened.
  bool hasEntryPoints(CallFailure& failure) const;

 private:
  explicit OpenDevice(std::unique_ptr<HostPlatform> platform);
  explicit OpenDevice(std::unique_ptr<CounterSocket> socket);

  bool isOfThisProcess(CallFailure& failure) const;

  std::int32_t _process;
  std::unique_ptr<CounterSocket> _socket;  ///< then without what follows
  std::unique_ptr<HostPlatform> _platform;
  std::unique_ptr<InstalledPlatform> _installed;
};

}  // namespace vesprun
