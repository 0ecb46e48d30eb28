#include "platform/host/HostFileSystem.h"

#include <sys/stat.h>

#include "platform/host/WholeFile.h"

namespace vesprun {

std::optional<std::string> HostFileSystem::readFile(const std::string& path) {
  std::string error;
  return readWholeFile(_directory.hostPath(path), error);
}

std::optional<std::uint64_t> HostFileSystem::fileSize(const std::string& path) {
  struct stat status {};
  if (stat(_directory.hostPath(path).c_str(), &status) != 0) {
    return std::nullopt;
  }
  return static_cast<std::uint64_t>(status.st_size);
}

}  // namespace vesprun
