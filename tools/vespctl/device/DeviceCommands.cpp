#include <filesystem>
#include <vector>

#include "Command.h"
#include "collect/StarterWhitelist.h"
#include "driver/DailyDriver.h"
#include "platform/host/files/AtomicFile.h"
#include "sample/SampleDevice.h"

namespace vesprun {
namespace {

void initDevice(const std::string& path, bool sample) {
  std::error_code failure;
  std::filesystem::create_directories(path, failure);
  if (failure) {
    throw CommandFailure(path + ": " + failure.message());
  }
  if (!std::filesystem::is_empty(path, failure) || failure) {
    throw CommandFailure(path + (failure ? ": " + failure.message() : ": is not empty"));
  }
  std::filesystem::permissions(path, std::filesystem::perms::owner_all, failure);
  if (failure) {
    throw CommandFailure(path + ": " + failure.message());
  }
  const DeviceDirectory directory = openDirectory(path);
  for (const char* folder :
       {"Library/Application Support/Tallybook", "Library/Logsmith", "var/mobile/Library/Tallybook",
        "var/mobile/Library/Preferences", "run", "kernel/ecc", "outbox/logs"}) {
    orFail([&](std::string& error) { return directory.makeFolder(folder, error); });
  }
  orFail([&](std::string& error) {
    return replaceFile(directory.hostPath("device.json"), "{\n}\n", error);
  });
  if (sample) {
    fillSampleDevice(path);
  } else {
    writeWhitelist(directory, starterWhitelist());
  }
}

void runJob(const std::string& path, const std::vector<std::string>& arguments) {
  const std::unique_ptr<HostPlatform> device = openDevice(path);
  const InstalledPlatform installed(*device);
  std::vector<const char*> commandLine{"vesprun"};
  for (const std::string& argument : arguments) {
    commandLine.push_back(argument.c_str());
  }
  runDailyDriver(commandLine);
}

}  // namespace

void addDeviceCommands(CLI::App& vespctl) {
  struct Arguments {
    std::string directory;
    bool sample = false;
    std::vector<std::string> job;
  };
  const auto arguments = std::make_shared<Arguments>();

  CLI::App* init = vespctl.add_subcommand("init", "Makes a device directory");
  init->add_option("DIR", arguments->directory, "A folder that is missing or empty")->required();
  init->add_flag("--sample", arguments->sample,
                 "Fills it with counters of this machine, a storage controller and a whitelist "
                 "for them, instead of one for what collect writes");
  init->callback([arguments] { initDevice(arguments->directory, arguments->sample); });

  CLI::App* run = addDeviceCommand(vespctl, "run", "Does what vesprun does, on that device",
                                   arguments->directory);
  run->add_option("ARG", arguments->job, "What vesprun is given, behind --");
  run->callback([arguments] { runJob(arguments->directory, arguments->job); });
}

}  // namespace vesprun
