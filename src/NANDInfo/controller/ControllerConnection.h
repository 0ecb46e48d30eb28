#pragma once

#include "platform/DeviceRegistry.h"

namespace vesprun {

/// A user client of the controller, open for as long as the object lives. That it cannot be closed
/// is told on standard error.
class ControllerConnection {
 public:
  /// Opens the service. False in a condition when it refuses.
  explicit ControllerConnection(RegistryHandle service);
  ~ControllerConnection() { close(); }
  ControllerConnection(const ControllerConnection&) = delete;
  ControllerConnection& operator=(const ControllerConnection&) = delete;

  explicit operator bool() const { return _handle != 0; }
  RegistryHandle get() const { return _handle; }
  /// Closes it, unless it is closed; false when that fails.
  bool close();

 private:
  RegistryHandle _handle = 0;
};

}  // namespace vesprun
