#include "platform/host/device/ECCEventQueue.h"

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <utility>
#include <vector>

namespace vesprun {

ECCEventQueue::Outcome ECCEventQueue::take(const HostPath& path, std::span<std::uint8_t> buffer,
                                           std::string& error) {
  const auto failed = [&](Outcome outcome) {
    error = systemError(path);
    return outcome;
  };
  // A pipe must not block the reader.
  const FileDescriptor file = path.open(O_RDONLY | O_NONBLOCK);
  if (!file.isOpen()) {
    const bool lasts = errno == EACCES || errno == EPERM || errno == ELOOP || errno == ENXIO;
    return errno == ENOENT ? Outcome::Skipped : failed(lasts ? Outcome::Unusable : Outcome::Failed);
  }
  struct stat status {};
  if (fstat(file.get(), &status) != 0) {
    return failed(Outcome::Failed);
  }
  if (!S_ISREG(status.st_mode)) {
    error = path.string() + ": not a regular file";
    return Outcome::Unusable;
  }
  if (status.st_size != kEventLength) {
    error = path.string() + ": " + std::to_string(status.st_size) +
            " bytes are not an ECC event of " + std::to_string(kEventLength);
    return Outcome::Unusable;
  }
  for (std::size_t length = 0; length < kEventLength;) {
    const ssize_t count = pread(file.get(), buffer.data() + length, kEventLength - length,
                                static_cast<off_t>(length));
    if (count <= 0) {
      return failed(Outcome::Failed);
    }
    length += static_cast<std::size_t>(count);
  }
  _taken = path;
  return Outcome::Taken;
}

int ECCEventQueue::takeNext(std::span<std::uint8_t> buffer, std::size_t& length) {
  _taken.reset();
  if (_directory.isReadOnly()) {
    return EROFS;
  }
  const HostPath folder = _directory.hostPath("kernel/ecc");
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
    if (buffer.size() != kEventLength) {
      return EINVAL;
    }
    const HostPath path = folder.below(name);
    const Outcome outcome = take(path, buffer, error);
    if (outcome == Outcome::Taken) {
      length = kEventLength;
      return 0;
    }
    if (outcome == Outcome::Skipped) {
      continue;
    }
    _log.write(LogLevel::Error, error);
    if (outcome == Outcome::Failed || !isGone(path, renameFile(path, name + ".unusable"))) {
      return EIO;
    }
  }
  return ENOENT;
}

bool ECCEventQueue::removeTaken() {
  const std::optional<HostPath> taken = std::exchange(_taken, std::nullopt);
  return !taken || isGone(*taken, removeFile(*taken));
}

bool ECCEventQueue::isGone(const HostPath& path, bool isDone) {
  if (isDone || errno == ENOENT) {
    return true;
  }
  _log.write(LogLevel::Error, systemError(path));
  return false;
}

}  // namespace vesprun
