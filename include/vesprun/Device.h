#pragma once

#include <memory>
#include <string>

#include "Export.h"

namespace vesprun {

/// The device that the program works on: a device directory and the running Linux system. A process
/// has one at a time.
class Device {
 public:
  /// Null, with the place in `error`, when the folder or its `device.json` cannot be used or
  /// another device is open. The device's time zone becomes the process's, in TZ.
  VESPRUN_EXPORT static std::unique_ptr<Device> open(const std::string& path,
                                                     std::string& error) noexcept;

  /// Writes what the services held back.
  VESPRUN_EXPORT ~Device();

  Device(const Device&) = delete;
  Device& operator=(const Device&) = delete;

 private:
  struct Installation;

  explicit Device(std::unique_ptr<Installation> installation);

  std::unique_ptr<Installation> _installation;
};

}  // namespace vesprun
