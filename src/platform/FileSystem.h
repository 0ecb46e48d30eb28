#pragma once

#include <cstdint>
#include <optional>
#include <string>

namespace vesprun {

/// The size of a file system in blocks, as `statfs` counts them.
struct FileSystemStatistics {
  std::uint32_t blockSize;        ///< bytes
  std::uint64_t blocks;           ///< all of them
  std::uint64_t availableBlocks;  ///< left for users without privileges
};

/// The device's files, by absolute path on the device.
class FileSystem {
 public:
  virtual ~FileSystem() = default;

  /// Nothing when the file is missing or cannot be read.
  virtual std::optional<std::string> readFile(const std::string& path) = 0;

  /// In bytes; nothing when the file cannot be examined.
  virtual std::optional<std::uint64_t> fileSize(const std::string& path) = 0;

  /// The file system of a path; nothing when it cannot be measured.
  virtual std::optional<FileSystemStatistics> statfs(const std::string& path) = 0;

  /// Lets one process at a time do the day's work. Waits `seconds` at most, and holds the lock
  /// until the services have written what they held back at the platform's end. False when another
  /// process keeps it that long. A lock that the system cannot give is an error line and counts as
  /// taken: the work must be done.
  virtual bool lockDailyWork(double seconds) = 0;
};

}  // namespace vesprun
