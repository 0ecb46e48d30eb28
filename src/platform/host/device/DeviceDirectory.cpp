#include "platform/host/device/DeviceDirectory.h"

#include <sys/stat.h>

#include <cerrno>

#include "platform/host/files/Files.h"

namespace vesprun {
namespace {

bool isFolder(const std::string& path) {
  struct stat status {};
  return stat(path.c_str(), &status) == 0 && S_ISDIR(status.st_mode);
}

}  // namespace

std::optional<DeviceDirectory> DeviceDirectory::open(const std::string& path, std::string& error) {
  struct stat status {};
  if (stat(path.c_str(), &status) != 0) {
    error = systemError(path);
    return std::nullopt;
  }
  if (!S_ISDIR(status.st_mode)) {
    error = path + ": not a device directory";
    return std::nullopt;
  }
  const auto lastCharacter = path.find_last_not_of('/');
  return DeviceDirectory(path.substr(0, lastCharacter + 1));
}

DeviceDirectory DeviceDirectory::readOnly() const {
  DeviceDirectory directory = *this;
  directory._isReadOnly = true;
  return directory;
}

std::string DeviceDirectory::hostPath(std::string_view devicePath) const {
  while (!devicePath.empty() && devicePath.front() == '/') {
    devicePath.remove_prefix(1);
  }
  return _path + '/' + std::string(devicePath);
}

std::optional<std::string> DeviceDirectory::makeFolder(std::string_view devicePath,
                                                       std::string& error) const {
  const std::string folder = hostPath(devicePath);
  if (_isReadOnly) {
    error = folder + ": the device is only looked at";
    return std::nullopt;
  }
  if (isFolder(folder)) {
    return folder;
  }
  for (std::size_t end = _path.size(); end != std::string::npos;) {
    end = folder.find('/', end + 1);
    const std::string part = folder.substr(0, end);
    if (mkdir(part.c_str(), 0700) != 0 && (errno != EEXIST || !isFolder(part))) {
      error = systemError(part);
      return std::nullopt;
    }
  }
  return folder;
}

}  // namespace vesprun
