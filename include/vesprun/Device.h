#pragma once

#include <memory>
#include <string>

#include "Export.h"

namespace vesprun {

/// The device that the program works on, for as long as it lives: one device directory and the
/// running Linux system. A process has one at a time.
class Device {
 public:
  /// Reads the description of the device. Null, with a text in `error` that names the place, when
  /// the folder or its `device.json` cannot be used, or when another device is open. The device's
  /// time zone becomes that of the process, in the environment variable TZ.
  VESPRUN_EXPORT static std::unique_ptr<Device> open(const std::string& path,
                                                     std::string& error) noexcept;

  /// Writes what the device's services held back.
  VESPRUN_EXPORT ~Device();

  Device(const Device&) = delete;
  Device& operator=(const Device&) = delete;

 private:
  struct Installation;

  explicit Device(std::unique_ptr<Installation> installation);

  std::unique_ptr<Installation> _installation;
};

}  // namespace vesprun
