#pragma once

#include <optional>
#include <string>
#include <string_view>

#include "platform/host/files/HostPath.h"

namespace vesprun {

/// The folder of one device. Everything in it is its owner's alone.
class DeviceDirectory {
 public:
  /// Nothing, with a text in `error`, unless `path` is a folder.
  static std::optional<DeviceDirectory> open(const std::string& path, std::string& error);

  /// The same folder, in which no service changes anything.
  DeviceDirectory readOnly() const;
  bool isReadOnly() const { return _isReadOnly; }

  /// Without a final slash.
  const std::string& path() const { return _path; }

  /// The host path of a device path ("/var/mobile/...", or relative to its root). No link in it is
  /// followed.
  HostPath hostPath(std::string_view devicePath) const;

  /// The host path of a device folder, which is created, durably, with those above it if missing.
  /// Nothing, with a text in `error`, on failure. All writing into a folder begins here, so that a
  /// read-only device need only refuse it here.
  std::optional<HostPath> makeFolder(std::string_view devicePath, std::string& error) const;

 private:
  explicit DeviceDirectory(std::string path) : _path(std::move(path)) {}

  std::string _path;
  bool _isReadOnly = false;
};

}  // namespace vesprun
