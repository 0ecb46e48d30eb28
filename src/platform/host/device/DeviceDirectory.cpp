#include "platform/host/device/DeviceDirectory.h"

#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>

#include "platform/host/files/Files.h"

namespace vesprun {
namespace {

/// Otherwise `errno` says why not.
bool isFolder(const HostPath& path) {
  const std::optional<struct stat> status = path.status();
  if (status && !S_ISDIR(status->st_mode)) {
    errno = EEXIST;
  }
  return status && S_ISDIR(status->st_mode);
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

HostPath DeviceDirectory::hostPath(std::string_view devicePath) const {
  while (!devicePath.empty() && devicePath.front() == '/') {
    devicePath.remove_prefix(1);
  }
  return HostPath(_path).below(devicePath);
}

std::optional<HostPath> DeviceDirectory::makeFolder(std::string_view devicePath,
                                                    std::string& error) const {
  const HostPath folder = hostPath(devicePath);
  if (_isReadOnly) {
    error = folder.string() + ": the device is only looked at";
    return std::nullopt;
  }
  if (isFolder(folder)) {
    return folder;
  }
  for (std::size_t end = _path.size(); end != std::string::npos;) {
    end = folder.string().find('/', end + 1);
    const HostPath part = hostPath(folder.string().substr(0, end).substr(_path.size()));
    const FileDescriptor above = openFolder(part.folder());
    const bool isMade = above.isOpen() && mkdirat(above.get(), part.name().c_str(), 0700) == 0;
    if ((isMade && fsync(above.get()) != 0) || (!isMade && (errno != EEXIST || !isFolder(part)))) {
      error = systemError(part);
      return std::nullopt;
    }
  }
  return folder;
}

}  // namespace vesprun
