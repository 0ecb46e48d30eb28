#pragma once

#include <optional>
#include <string>
#include <string_view>

namespace vesprun {

/// The folder that stands for one device. Everything in it is for its owner alone.
class DeviceDirectory {
 public:
  /// Nothing, with a text in `error`, when `path` is not a folder.
  static std::optional<DeviceDirectory> open(const std::string& path, std::string& error);

  /// The same folder for one who only looks at it: no service changes anything in it.
  DeviceDirectory readOnly() const;
  bool isReadOnly() const { return _isReadOnly; }

  /// The folder's own path, without a final slash.
  const std::string& path() const { return _path; }

  /// Where a path of the device ("/var/mobile/...", or one relative to its root) lies on the host.
  std::string hostPath(std::string_view devicePath) const;

  /// The host path of a folder of the device, made (with those above it) when it is missing.
  /// Nothing, with a text in `error`, when it cannot be made. What is written into a folder begins
  /// with this, which therefore refuses every folder of a read-only device.
  std::optional<std::string> makeFolder(std::string_view devicePath, std::string& error) const;

 private:
  explicit DeviceDirectory(std::string path) : _path(std::move(path)) {}

  std::string _path;
  bool _isReadOnly = false;
};

}  // namespace vesprun
