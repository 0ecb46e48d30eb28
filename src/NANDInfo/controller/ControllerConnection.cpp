#include "NANDInfo/controller/ControllerConnection.h"

#include <cstdio>
#include <utility>

#include "platform/Platform.h"

namespace vesprun {

ControllerConnection::ControllerConnection(RegistryHandle service) {
  if (platform().deviceRegistry().DevRegServiceOpen(service, _handle) != kRegistrySuccess) {
    _handle = 0;
  }
}

bool ControllerConnection::close() {
  const RegistryHandle handle = std::exchange(_handle, 0);
  if (handle == 0 || platform().deviceRegistry().DevRegServiceClose(handle) == kRegistrySuccess) {
    return true;
  }
  std::fputs("Could not close connection to service\n", stderr);
  return false;
}

}  // namespace vesprun
