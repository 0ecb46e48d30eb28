#pragma once

#include "platform/FileSystem.h"
#include "platform/SystemLog.h"
#include "platform/host/device/DeviceDescription.h"
#include "platform/host/device/DeviceDirectory.h"

namespace vesprun {

/// The files of the device directory. The user volume, at /private/var, is as large as described,
/// or else as the file system that the directory lies on. A file that is there but cannot be read
/// leaves an error in the system log.
class HostFileSystem : public FileSystem {
 public:
  HostFileSystem(const DeviceDirectory& directory,
                 const AnswerDescription<FileSystemStatistics>& userVolume, SystemLog& log)
      : _directory(directory), _userVolume(userVolume), _log(log) {}

  std::optional<std::string> readFile(const std::string& path) override;
  std::optional<std::uint64_t> fileSize(const std::string& path) override;
  std::optional<FileSystemStatistics> statfs(const std::string& path) override;

 private:
  const DeviceDirectory& _directory;
  const AnswerDescription<FileSystemStatistics>& _userVolume;
  SystemLog& _log;
};

}  // namespace vesprun
