#include "access/CommandDevice.h"

#include <fcntl.h>
#include <unistd.h>

#include <chrono>
#include <cstdlib>

#include "platform/host/documents/JsonForm.h"
#include "platform/host/files/Files.h"
#include "platform/host/files/JsonLines.h"

namespace vesprun {
namespace {

std::string givenDirectory;

std::string makeOne(const std::string& path) {
  return "; make one with \"vespctl init " + path + "\", or name another with -C DIR";
}

std::string belongsTo(const std::string& path, const struct stat& status) {
  return path + ": belongs to " + nameOfUser(status.st_uid) + ": use sudo";
}

}  // namespace

void addDeviceOption(CLI::App& vespctl) {
  vespctl
      .add_option("-C", givenDirectory,
                  std::string("The device directory, instead of that in VESPRUN_DEVICE or ") +
                      VESPRUN_DEVICE_DIRECTORY)
      ->type_name("DIR");
}

std::string deviceDirectory() {
  const char* const variable = std::getenv("VESPRUN_DEVICE");
  if (!givenDirectory.empty()) {
    return givenDirectory;
  }
  return variable != nullptr && *variable != '\0' ? variable : VESPRUN_DEVICE_DIRECTORY;
}

DeviceDirectory openDirectory(Access access, OwnersRights rights) {
  const std::string path = deviceDirectory();
  struct stat status {};
  if (stat(path.c_str(), &status) != 0) {
    throw CommandFailure(systemError(path) + (errno == ENOENT ? makeOne(path) : ""));
  }
  takeRightsOfOwner(status, rights);
  DeviceDirectory directory =
      *orFail([&](std::string& error) { return DeviceDirectory::open(path, error); });
  const std::string description = directory.hostPath("device.json").string();
  const bool isOwner = geteuid() == status.st_uid;
  if (faccessat(AT_FDCWD, description.c_str(), R_OK, AT_EACCESS) != 0) {
    if (errno == ENOENT) {
      throw CommandFailure(path + ": no device: it has no device.json" + makeOne(path));
    }
    throw CommandFailure(errno == EACCES && !isOwner ? belongsTo(path, status)
                                                     : systemError(description));
  }
  const int needed = access == Access::Changing ? R_OK | W_OK | X_OK : R_OK | X_OK;
  if (!isOwner && faccessat(AT_FDCWD, path.c_str(), needed, AT_EACCESS) != 0) {
    throw CommandFailure(errno == EACCES ? belongsTo(path, status) : systemError(path));
  }
  return directory;
}

std::unique_ptr<HostPlatform> openDevice() {
  const DeviceDirectory directory = openDirectory(Access::Changing);
  return orFail([&](std::string& error) { return HostPlatform::open(directory.path(), error); });
}

std::unique_ptr<HostPlatform> openDeviceReadOnly(SystemLog& log, OwnersRights rights) {
  const DeviceDirectory directory = openDirectory(Access::Reading, rights);
  return orFail(
      [&](std::string& error) { return HostPlatform::open(directory.path(), error, &log); });
}

FileDescriptor takeDailyWork(const DeviceDirectory& directory) {
  constexpr std::chrono::minutes kMaxWait(5);
  return *orFail(
      [&](std::string& error) { return lockFolder(directory.path(), error, LOCK_EX, kMaxWait); });
}

FileDescriptor openInput(const std::string& file) {
  FileDescriptor input(file == "-" ? dup(STDIN_FILENO) : open(file.c_str(), O_RDONLY | O_CLOEXEC));
  if (!input.isOpen()) {
    throw CommandFailure(systemError(inputName(file)));
  }
  return input;
}

std::string readInput(const std::string& file) {
  const FileDescriptor input = openInput(file);
  std::string content;
  char piece[65536];
  ssize_t count = 1;
  while (count > 0) {
    count = read(input.get(), piece, sizeof piece);
    if (count < 0 && errno == EINTR) {
      count = 1;
    } else if (count > 0) {
      content.append(piece, static_cast<std::size_t>(count));
    }
  }
  if (count < 0) {
    throw CommandFailure(systemError(inputName(file)));
  }
  return content;
}

void forEachLine(const HostPath& file, const std::function<void(PropertyDict* line)>& take,
                 std::uint64_t begin) {
  const auto takeText = [&take](std::string_view line) {
    std::string ignored;
    std::optional<PropertyValue> value = valueFromJsonText(line, ignored);
    take(value ? value->dict() : nullptr);
  };
  orFail([&](std::string& error) { return forEachLineOf(file, takeText, error, begin); });
}

std::string inputName(const std::string& file) { return file == "-" ? "standard input" : file; }

}  // namespace vesprun
