#include "NANDInfo/controller/Controller.h"

#include <cstdio>
#include <utility>

namespace vesprun {

bool Controller::open(const char* complainer) {
  if (!_service) {
    std::fprintf(stderr, "%sCould not get matching DevRegKit service for exporting classes\n",
                 complainer);
    return false;
  }
  if (platform().deviceRegistry().DevRegServiceOpen(_service.get(), _connection) !=
      kRegistrySuccess) {
    std::fputs("Could not get connection to service\n", stderr);
    return false;
  }
  return true;
}

bool Controller::close() {
  const RegistryHandle handle = std::exchange(_connection, 0);
  if (handle == 0 || platform().deviceRegistry().DevRegServiceClose(handle) == kRegistrySuccess) {
    return true;
  }
  std::fputs("Could not close connection to service\n", stderr);
  return false;
}

}  // namespace vesprun
