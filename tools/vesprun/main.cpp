#include <grp.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cstdio>
#include <exception>

#include "driver/DailyDriver.h"
#include "platform/host/HostPlatform.h"
#include "platform/host/documents/QuotedText.h"
#include "platform/host/files/StandardStreams.h"

namespace vesprun {
namespace {

/// Root goes on as the owner of the device, who could otherwise not change what root wrote. False
/// when that fails.
bool takeRightsOfOwner() {
  constexpr gid_t kNoGroup = 65534;
  struct stat directory {};
  if (geteuid() != 0 || stat(VESPRUN_DEVICE_DIRECTORY, &directory) != 0 || directory.st_uid == 0) {
    return true;
  }
  const uid_t user = directory.st_uid;
  const gid_t group = directory.st_gid != 0 ? directory.st_gid : kNoGroup;
  return setgroups(0, nullptr) == 0 && setresgid(group, group, group) == 0 &&
         setresuid(user, user, user) == 0;
}

void runOnDevice(std::span<const char* const> commandLine) {
  if (!takeRightsOfOwner()) {
    std::fprintf(stderr, "%svesprun: the rights of the device's owner cannot be taken\n",
                 journalLevel(LogLevel::Error));
    return;
  }
  std::string error;
  const std::unique_ptr<HostPlatform> device = HostPlatform::open(VESPRUN_DEVICE_DIRECTORY, error);
  if (!device) {
    std::fprintf(stderr, "%svesprun: %s\n", journalLevel(LogLevel::Error),
                 printableText(error).c_str());
    return;
  }
  const InstalledPlatform installed(*device);
  runDailyDriver(commandLine);
}

}  // namespace
}  // namespace vesprun

// The exit status is always 0: the system that starts the job does not look at it.
int main(int argc, char** argv) {
  vesprun::holdStandardStreams();
  vesprun::exitWithoutMemory("vesprun", 0);
  try {
    vesprun::runOnDevice({argv, argc > 0 ? static_cast<std::size_t>(argc) : 0});
  } catch (const std::exception& failure) {
    std::fprintf(stderr, "%svesprun: %s\n", vesprun::journalLevel(vesprun::LogLevel::Error),
                 failure.what());
  }
  return 0;
}
