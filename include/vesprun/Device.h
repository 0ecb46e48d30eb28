#pragma once

#include <cstdint>
#include <memory>
#include <string>
#include <string_view>

#include "Export.h"

namespace vesprun {

/// The device that the program works on: a device directory and the running Linux system. A process
/// has one at a time. Or the socket of `vespctl listen`, which takes counters from any user, as
/// `vesprun.h` says; entry points find no device there.
class Device {
 public:
  /// `path` is a device directory, or a socket. Null, with the place in `error`, when the folder or
  /// its `device.json` cannot be used, another device is open, or nobody listens. After a fork the
  /// new process must open its own: all operations of one that was opened before fail.
  VESPRUN_EXPORT static std::unique_ptr<Device> open(const std::string& path,
                                                     std::string& error) noexcept;

  /// Writes what the services still hold in memory; counters as `checkpoint` does.
  VESPRUN_EXPORT ~Device();

  Device(const Device&) = delete;
  Device& operator=(const Device&) = delete;

  // Counters of today, by the device's clock; days begin at 00:00 UTC. A key is UTF-8 text that an
  // XML 1.0 document can carry, 1 MiB at most. Any thread may change counters; the changes stay in
  // memory until the next checkpoint. False, with a text in `error` and nothing changed, on
  // failure.

  VESPRUN_EXPORT bool setScalar(std::string_view key, std::int64_t value,
                                std::string& error) noexcept;
  /// Adds with 64-bit wrap-around; a missing scalar counts as 0.
  VESPRUN_EXPORT bool addToScalar(std::string_view key, std::int64_t value,
                                  std::string& error) noexcept;
  /// Adds one more value to a distribution.
  VESPRUN_EXPORT bool addToDistribution(std::string_view key, double value,
                                        std::string& error) noexcept;
  /// Writes all changes in one transaction, which survives a loss of power; on failure they wait
  /// for the next checkpoint. Waits for the locks of other processes, 20 seconds at most.
  VESPRUN_EXPORT bool checkpoint(std::string& error) noexcept;

 private:
  struct Installation;

  explicit Device(std::unique_ptr<Installation> installation);

  std::unique_ptr<Installation> _installation;
};

}  // namespace vesprun
