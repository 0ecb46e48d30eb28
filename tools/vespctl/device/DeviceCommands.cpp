#include "device/DeviceCommands.h"

#include <fcntl.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cerrno>
#include <filesystem>
#include <string_view>
#include <vector>

#include "access/CommandDevice.h"
#include "collect/StarterWhitelist.h"
#include "config/TBConfig.h"
#include "driver/DailyDriver.h"
#include "platform/host/counters/CounterFile.h"
#include "platform/host/files/AtomicFile.h"
#include "platform/host/files/Files.h"
#include "platform/host/outbox/OutboxFiles.h"
#include "sample/SampleDevice.h"

namespace vesprun {
namespace {

/// Lies in the folder while `init` is at work, so that one that was cut short can be repeated.
constexpr const char* kInitMark = ".init-unfinished";

constexpr std::string_view kFolders[] = {
    TBConfig::kFolder, "Library/Logsmith", kCounterFolder, "var/mobile/Library/Preferences", "run",
    "kernel/ecc",      kLogFolder};

constexpr std::string_view kEmptyDescription = "{\n}\n";

/// Whether an `init` without a mark, as earlier versions had it, was cut short before it wrote the
/// whitelist: all folders are there, and no file but the empty description.
bool isCutShortWithoutMark(const DeviceDirectory& directory) {
  std::error_code failure;
  for (const std::string_view folder : kFolders) {
    if (!std::filesystem::is_directory(directory.hostPath(folder).string(), failure)) {
      return false;
    }
  }
  std::filesystem::recursive_directory_iterator entry(directory.path(), failure);
  for (; !failure && entry != std::filesystem::recursive_directory_iterator();
       entry.increment(failure)) {
    const bool isFolder = std::filesystem::is_directory(entry->symlink_status(failure));
    if (!failure && !isFolder && entry->path() != directory.hostPath("device.json").string() &&
        !entry->path().filename().string().starts_with(".unfinished-")) {
      return false;
    }
  }
  std::string error;
  return !failure && readWholeFile(directory.hostPath("device.json"), error) == kEmptyDescription;
}

void removeFile(const std::string& path) {
  if (unlink(path.c_str()) != 0 && errno != ENOENT) {
    throw CommandFailure(systemError(path));
  }
}

/// Marks the folder as one in which `init` is at work. False if a device is there already, whose
/// `init` was cut short after its last file.
bool beginInit(const DeviceDirectory& directory) {
  const std::string mark = directory.hostPath(kInitMark);
  const std::string description = directory.hostPath("device.json");
  std::error_code failure;
  const bool isMarked = std::filesystem::exists(std::filesystem::symlink_status(mark, failure));
  if (isMarked) {
    if (std::filesystem::exists(std::filesystem::symlink_status(description, failure))) {
      return false;
    }
  } else if (!std::filesystem::is_empty(directory.path(), failure) || failure) {
    if (failure || !isCutShortWithoutMark(directory)) {
      throw CommandFailure(
          directory.path() +
          (failure ? ": " + failure.message() : ": is not empty; name a new or an empty folder"));
    }
  }
  std::filesystem::permissions(directory.path(), std::filesystem::perms::owner_all, failure);
  if (failure) {
    throw CommandFailure(directory.path() + ": " + failure.message());
  }
  if (!FileDescriptor(
           ::open(mark.c_str(), O_WRONLY | O_CREAT | O_NOFOLLOW | O_NONBLOCK | O_CLOEXEC, 0600))
           .isOpen()) {
    throw CommandFailure(systemError(mark));
  }
  // Before anything else is there: without the mark the folder would be someone else's.
  orFail([&](std::string& error) { return flushFolder(directory.path(), error); });
  removeFile(description);
  // The sample's counters are added to those that are there.
  const std::string database = directory.hostPath(kCounterFolder).below(kCounterDatabase).string();
  removeFile(database);
  removeFile(database + "-journal");
  return true;
}

/// Makes the folder and those above it that are missing, each flushed into the one above.
void makeFolders(const std::filesystem::path& path) {
  std::error_code failure;
  if (!std::filesystem::exists(path, failure) && !failure) {
    const std::filesystem::path above = path.has_parent_path() ? path.parent_path() : ".";
    makeFolders(above);
    std::filesystem::create_directory(path, failure);
    if (!failure) {
      orFail([&](std::string& error) { return flushFolder(above.string(), error); });
    }
  }
  if (failure) {
    throw CommandFailure(path.string() + ": " + failure.message());
  }
}

/// `device.json` is written last: only a folder with it counts as a device.
void initDevice(const std::string& path, bool sample) {
  makeFolders(path);
  std::error_code failure;
  if (!std::filesystem::is_directory(path, failure)) {
    throw CommandFailure(path + ": is not empty; name a new or an empty folder");
  }
  struct stat status {};
  if (stat(path.c_str(), &status) != 0) {
    throw CommandFailure(systemError(path));
  }
  takeRightsOfOwner(status, OwnersRights::ForGood);
  const DeviceDirectory directory =
      *orFail([&](std::string& error) { return DeviceDirectory::open(path, error); });
  if (beginInit(directory)) {
    for (const std::string_view folder : kFolders) {
      orFail([&](std::string& error) { return directory.makeFolder(folder, error); });
    }
    if (sample) {
      fillSampleDevice(path);
    } else {
      writeWhitelist(directory, starterWhitelist());
      orFail([&](std::string& error) {
        return replaceFile(directory.hostPath("device.json"), kEmptyDescription, error);
      });
    }
  }
  removeFile(directory.hostPath(kInitMark));
}

void runJob(const std::vector<std::string>& arguments) {
  const std::unique_ptr<HostPlatform> device = openDevice();
  const InstalledPlatform installed(*device);
  std::vector<const char*> commandLine{"vesprun"};
  for (const std::string& argument : arguments) {
    commandLine.push_back(argument.c_str());
  }
  runDailyDriver(commandLine);
}

}  // namespace

void addInitCommand(CLI::App& command) {
  struct Arguments {
    std::string directory;
    bool sample = false;
  };
  const auto arguments = std::make_shared<Arguments>();
  command.add_option("DIR", arguments->directory, "A folder that is missing or empty")->required();
  command.add_flag("--sample", arguments->sample,
                   "Fills it with counters of this machine, a storage controller and a whitelist "
                   "for them, instead of one for what collect writes");
  command.callback([arguments] { initDevice(arguments->directory, arguments->sample); });
}

void addRunCommand(CLI::App& command) {
  const auto job = std::make_shared<std::vector<std::string>>();
  command.add_option("ARG", *job, "What vesprun is given, behind --");
  command.callback([job] { runJob(*job); });
}

}  // namespace vesprun
