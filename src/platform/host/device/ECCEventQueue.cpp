#include "platform/host/device/ECCEventQueue.h"

#include <unistd.h>

#include <algorithm>
#include <cerrno>
#include <cstdio>
#include <cstring>
#include <filesystem>
#include <optional>
#include <system_error>
#include <vector>

#include "platform/host/files/SystemError.h"
#include "platform/host/files/WholeFile.h"

namespace vesprun {
namespace {

std::vector<std::string> eventFiles(const std::string& folder, std::error_code& error) {
  std::vector<std::string> files;
  for (std::filesystem::directory_iterator entry(folder, error), end; !error && entry != end;
       entry.increment(error)) {
    if (entry->path().extension() == ".bin") {
      files.push_back(entry->path());
    }
  }
  std::sort(files.begin(), files.end());
  return files;
}

}  // namespace

int ECCEventQueue::takeNext(std::span<std::uint8_t> buffer, std::size_t& length) {
  const std::string folder = _directory.hostPath("kernel/ecc");
  std::error_code failure;
  const std::vector<std::string> files = eventFiles(folder, failure);
  if (failure && failure != std::errc::no_such_file_or_directory) {
    _log.write(LogLevel::Error, folder + ": " + failure.message());
    return EIO;
  }
  for (const std::string& path : files) {
    std::string error;
    bool missing = false;
    const std::optional<std::string> event = readWholeFile(path, error, &missing);
    if (missing) {
      continue;  // another process took it
    }
    if (event && event->size() != kEventLength) {
      error = path + ": " + std::to_string(event->size()) + " bytes are not an ECC event of " +
              std::to_string(kEventLength);
    }
    if (!event || event->size() != kEventLength) {
      if (!setAside(path, error)) {
        return EIO;
      }
      continue;
    }
    if (buffer.size() != kEventLength) {
      return EINVAL;
    }
    // Whoever deletes the file has the event: one that stays would be delivered for ever.
    if (unlink(path.c_str()) != 0) {
      if (errno == ENOENT) {
        continue;
      }
      _log.write(LogLevel::Error, systemError(path));
      return EIO;
    }
    std::memcpy(buffer.data(), event->data(), kEventLength);
    length = kEventLength;
    return 0;
  }
  return ENOENT;
}

bool ECCEventQueue::setAside(const std::string& path, const std::string& why) {
  _log.write(LogLevel::Error, why);
  if (std::rename(path.c_str(), (path + ".unusable").c_str()) == 0 || errno == ENOENT) {
    return true;
  }
  _log.write(LogLevel::Error, systemError(path));
  return false;
}

}  // namespace vesprun
