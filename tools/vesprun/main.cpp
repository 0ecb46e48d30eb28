#include <cstdio>
#include <exception>

#include "driver/DailyDriver.h"
#include "platform/host/HostPlatform.h"
#include "platform/host/documents/QuotedText.h"
#include "platform/host/files/StandardStreams.h"

namespace vesprun {
namespace {

void runOnDevice(std::span<const char* const> commandLine) {
  std::string error;
  const std::unique_ptr<HostPlatform> device = HostPlatform::open(VESPRUN_DEVICE_DIRECTORY, error);
  if (!device) {
    std::fprintf(stderr, "vesprun: %s\n", printableText(error).c_str());
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
    std::fprintf(stderr, "vesprun: %s\n", failure.what());
  }
  return 0;
}
