#include "platform/host/HostPlatform.h"

#include <cstdint>
#include <optional>
#include <utility>

#include "platform/host/counters/HostTallybook.h"
#include "platform/host/documents/QuotedText.h"
#include "platform/host/files/Files.h"
#include "platform/host/messages/HostMainLoop.h"
#include "platform/host/messages/HostMessageService.h"
#include "platform/host/outbox/HostOutbox.h"
#include "platform/host/preferences/HostPreferences.h"
#include "platform/host/preferences/PreferenceServices.h"
#include "platform/host/registry/HostDeviceRegistry.h"
#include "platform/host/services/FileServices.h"
#include "platform/host/services/HostClock.h"
#include "platform/host/services/HostDeviceInformation.h"
#include "platform/host/services/HostKernel.h"
#include "platform/host/services/HostMurmur.h"
#include "platform/host/services/HostSystemLog.h"
#include "platform/host/services/HostTapline.h"

namespace vesprun {
namespace {

// Its values take many times as much memory.
constexpr std::uint64_t kMaxDescription = 4 * 1024 * 1024;

}  // namespace

// Destroyed from the last to the first: a service that writes at its end follows those that it
// needs.
struct HostPlatform::Services {
  Services(DeviceDirectory deviceDirectory, DeviceDescription deviceDescription, SystemLog* log)
      : directory(std::move(deviceDirectory)),
        description(std::move(deviceDescription)),
        systemLog(log != nullptr ? *log : logFile) {}

  DeviceDirectory directory;
  DeviceDescription description;
  HostClock clock{description.clock, description.timeZone};
  HostSystemLog logFile{directory, clock, description.logLevel};
  SystemLog& systemLog;
  HostFileSystem fileSystem{directory, description,
                            systemLog};  // unlocked when what follows has been written
  HostOutbox outbox{directory, description, clock, systemLog};
  HostPreferences preferences{directory, clock, systemLog};
  HostTallybook tallybook{directory, clock, preferences, systemLog};
  HostDeviceInformation deviceInformation{description, directory};
  HostDeviceRegistry deviceRegistry{description.registry, directory, systemLog};
  HostKernel kernel{description, directory, systemLog};
  HostPtreeSerialization ptreeSerialization;
  HostServicesClient servicesClient{directory, clock, systemLog};
  HostSystemConfiguration systemConfiguration{description, directory, clock, systemLog};
  HostMainLoop mainLoop;
  HostMessageService messageService{directory, systemLog, mainLoop};
  HostTapline tapline{description};
  HostMurmur murmur{description, systemLog};  // last: a reply may use all of the above
};

HostPlatform::HostPlatform(std::unique_ptr<Services> services)
    : Platform{services->clock,          services->deviceInformation,
               services->deviceRegistry, services->outbox,
               services->fileSystem,     services->kernel,
               services->outbox,         services->mainLoop,
               services->messageService, services->murmur,
               services->preferences,    services->ptreeSerialization,
               services->servicesClient, services->systemConfiguration,
               services->systemLog,      services->tallybook,
               services->tapline},
      _services(std::move(services)) {}

HostPlatform::~HostPlatform() = default;

std::unique_ptr<HostPlatform> HostPlatform::open(const std::string& path, std::string& error,
                                                 SystemLog* readOnlyLog) {
  std::optional<DeviceDirectory> directory = DeviceDirectory::open(path, error);
  if (!directory) {
    return nullptr;
  }
  DeviceDescription description;
  const HostPath file = directory->hostPath("device.json");
  bool missing = false;
  if (const std::optional<std::string> text =
          readWholeFile(file, error, &missing, kMaxDescription)) {
    std::optional<DeviceDescription> read = readDeviceDescription(*text, error);
    if (!read) {
      error = file.string() + ": " + error;
      return nullptr;
    }
    description = *std::move(read);
  } else if (!missing) {
    return nullptr;
  }
  auto services = std::make_unique<Services>(
      readOnlyLog != nullptr ? directory->readOnly() : *std::move(directory),
      std::move(description), readOnlyLog);
  const std::optional<std::string>& zone = services->description.timeZone;
  if (zone && !isTimeZone(*zone)) {
    error = file.string() + ": timeZone: unknown time zone " + quotedText(*zone);
    return nullptr;
  }
  return std::unique_ptr<HostPlatform>(new HostPlatform(std::move(services)));
}

const DeviceDirectory& HostPlatform::directory() const { return _services->directory; }
const DeviceDescription& HostPlatform::description() const { return _services->description; }
HostTallybook& HostPlatform::counters() { return _services->tallybook; }
HostDeviceRegistry& HostPlatform::describedRegistry() { return _services->deviceRegistry; }

}  // namespace vesprun
