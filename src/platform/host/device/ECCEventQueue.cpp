#include "platform/host/device/ECCEventQueue.h"

#include <unistd.h>

#include <cerrno>
#include <cstdio>
#include <cstring>
#include <optional>
#include <string>
#include <vector>

#include "platform/host/files/FolderNames.h"
#include "platform/host/files/SystemError.h"
#include "platform/host/files/WholeFile.h"

namespace vesprun {

int ECCEventQueue::takeNext(std::span<std::uint8_t> buffer, std::size_t& length) {
  const std::string folder = _directory.hostPath("kernel/ecc");
  std::string error;
  const std::optional<std::vector<std::string>> names = namesInFolder(folder, error);
  if (!names) {
    _log.write(LogLevel::Error, error);
    return EIO;
  }
  for (const std::string& name : *names) {
    if (!name.ends_with(".bin") || name == ".bin") {
      continue;
    }
    const std::string path = folder + '/' + name;
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
