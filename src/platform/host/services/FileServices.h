#pragma once

#include <md5.h>
#include <sys/stat.h>

#include <chrono>

#include "platform/FileSystem.h"
#include "platform/PtreeSerialization.h"
#include "platform/SystemLog.h"
#include "platform/host/device/DeviceDescription.h"
#include "platform/host/device/DeviceDirectory.h"
#include "platform/host/device/LiveSystem.h"
#include "platform/host/documents/PtreeReader.h"
#include "platform/host/documents/PtreeWriter.h"
#include "platform/host/files/Files.h"

namespace vesprun {

/// The files of the device directory. One that is there but cannot be read leaves an error in the
/// system log. The lock is that of the directory itself: no file is left behind, and the kernel
/// frees it when its process ends.
class HostFileSystem final : public FileSystem {
 public:
  HostFileSystem(const DeviceDirectory& directory, const DeviceDescription& description,
                 SystemLog& log)
      : _directory(directory), _description(description), _log(log) {}

  std::optional<std::string> readFile(const std::string& path) override {
    std::string error;
    bool missing = false;
    std::optional<std::string> content = readWholeFile(_directory.hostPath(path), error, &missing);
    if (!content && !missing) {
      _log.write(LogLevel::Error, error);
    }
    return content;
  }
  std::optional<std::uint64_t> fileSize(const std::string& path) override {
    const std::optional<struct stat> status = _directory.hostPath(path).status();
    return status ? std::optional(static_cast<std::uint64_t>(status->st_size)) : std::nullopt;
  }
  std::optional<FileSystemStatistics> statfs(const std::string& path) override {
    return path == "/private/var" ? describedOr(_description.userVolume,
                                                [&] { return live::volume(_directory.path()); })
                                  : live::volume(_directory.hostPath(path));
  }

  bool lockDailyWork(double seconds) override {
    if (_dailyWork) {
      return true;
    }
    const std::chrono::milliseconds longestWait(static_cast<std::int64_t>(seconds * 1000));
    std::string error;
    bool busy = false;
    _dailyWork = lockFolder(_directory.path(), error, LOCK_EX, longestWait, &busy);
    if (!_dailyWork) {
      _log.write(LogLevel::Error, error);
    }
    return !busy;
  }

 private:
  const DeviceDirectory& _directory;
  const DeviceDescription& _description;
  SystemLog& _log;
  std::optional<FileDescriptor> _dailyWork;
};

class HostPtreeSerialization final : public PtreeSerialization {
 public:
  std::optional<PropertyValue> parse(std::string_view bytes, std::string& error) override {
    return readPtree(bytes, error);
  }
  bool canSerialize(const PtreeDocument& document, std::string& error) override {
    return isPtree(document, error);
  }
  void serialize(const PtreeDocument& document, const Sink& sink) override {
    writePtree(document, sink);
  }
  std::array<std::uint8_t, 16> md5(std::string_view bytes) override {
    MD5_CTX context;
    MD5Init(&context);
    MD5Update(&context, reinterpret_cast<const std::uint8_t*>(bytes.data()), bytes.size());
    std::array<std::uint8_t, 16> digest{};
    MD5Final(digest.data(), &context);
    return digest;
  }
};

}  // namespace vesprun
