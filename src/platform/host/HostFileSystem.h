#pragma once

#include "platform/FileSystem.h"
#include "platform/host/DeviceDirectory.h"

namespace vesprun {

/// The files of the device directory.
class HostFileSystem : public FileSystem {
 public:
  explicit HostFileSystem(const DeviceDirectory& directory) : _directory(directory) {}

  std::optional<std::string> readFile(const std::string& path) override;
  std::optional<std::uint64_t> fileSize(const std::string& path) override;

 private:
  const DeviceDirectory& _directory;
};

}  // namespace vesprun
