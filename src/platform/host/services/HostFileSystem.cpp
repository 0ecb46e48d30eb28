#include "platform/host/services/HostFileSystem.h"

#include <sys/stat.h>

#include "platform/host/device/LiveSystem.h"
#include "platform/host/files/WholeFile.h"

namespace vesprun {

std::optional<std::string> HostFileSystem::readFile(const std::string& path) {
  std::string error;
  bool missing = false;
  std::optional<std::string> content = readWholeFile(_directory.hostPath(path), error, &missing);
  if (!content && !missing) {
    _log.write(LogLevel::Error, error);
  }
  return content;
}

std::optional<std::uint64_t> HostFileSystem::fileSize(const std::string& path) {
  struct stat status {};
  if (stat(_directory.hostPath(path).c_str(), &status) != 0) {
    return std::nullopt;
  }
  return static_cast<std::uint64_t>(status.st_size);
}

std::optional<FileSystemStatistics> HostFileSystem::statfs(const std::string& path) {
  if (path != "/private/var") {
    return live::volume(_directory.hostPath(path));
  }
  return _userVolume.isLive() ? live::volume(_directory.path()) : _userVolume.value;
}

}  // namespace vesprun
