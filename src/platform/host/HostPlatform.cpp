#include "platform/host/HostPlatform.h"

#include <optional>
#include <utility>

#include "platform/host/counters/HostTallybook.h"
#include "platform/host/documents/QuotedText.h"
#include "platform/host/files/WholeFile.h"
#include "platform/host/messages/HostMainLoop.h"
#include "platform/host/messages/HostMessageService.h"
#include "platform/host/preferences/HostPreferences.h"
#include "platform/host/preferences/PreferenceServices.h"
#include "platform/host/registry/HostDeviceRegistry.h"
#include "platform/host/services/ForwardingServices.h"
#include "platform/host/services/HostClock.h"
#include "platform/host/services/HostKernel.h"
#include "platform/host/services/HostLanguages.h"
#include "platform/host/services/HostMurmur.h"
#include "platform/host/services/HostSystemLog.h"
#include "platform/host/services/HostTapline.h"

namespace vesprun {

// Destroyed from the last to the first: a service that writes at its end follows those that it
// needs.
struct HostPlatform::Services {
  Services(DeviceDirectory deviceDirectory, DeviceDescription deviceDescription,
           ProcessTimeZone processTimeZone, SystemLog* log)
      : directory(std::move(deviceDirectory)),
        description(std::move(deviceDescription)),
        timeZone(std::move(processTimeZone)),
        systemLog(log != nullptr ? *log : logFile) {}

  DeviceDirectory directory;
  DeviceDescription description;
  ProcessTimeZone timeZone;
  HostClock clock{description.clock};
  HostSystemLog logFile{directory, clock, description.logLevel};
  SystemLog& systemLog;
  Outbox outbox{directory, clock, systemLog};
  HostDailyWorkLock dailyWorkLock{directory,
                                  systemLog};  // freed when what follows has been written
  HostPreferences preferences{directory, clock, systemLog};
  HostTallybook tallybook{directory, clock, preferences, systemLog};
  HostDeviceRegistry deviceRegistry{description.registry, directory, systemLog};
  HostDiagnosticHeader diagnosticHeader{description.system};
  HostEventHub eventHub{description.events, outbox};
  HostFileSystem fileSystem{directory, description.userVolume, systemLog};
  HostInstalledApplications installedApplications{description};
  HostKernel kernel{description.kernel, directory, systemLog};
  HostLanguages languages{description.languages};
  HostLogsmith logsmith{description, outbox};
  HostMessageDigest messageDigest;
  HostNotificationCenter notificationCenter{outbox};
  HostOrrery orrery{description.properties, directory};
  HostProcessInformation processInformation;
  HostPtreeSerialization ptreeSerialization;
  HostReclaimer reclaimer{description};
  HostServicesClient servicesClient{directory, clock, systemLog};
  HostSupportLibrary supportLibrary{description.supportLibrary};
  HostSystemConfiguration systemConfiguration{description, directory, clock, systemLog};
  HostUserDefaults userDefaults{preferences};
  HostMainLoop mainLoop;
  HostMessageService messageService{directory, ptreeSerialization, systemLog, mainLoop};
  HostTapline tapline{description};
  HostMurmur murmur{description.usage, systemLog};  // last: a reply may use all of the above
};

HostPlatform::HostPlatform(std::unique_ptr<Services> services)
    : Platform{services->clock,
               services->dailyWorkLock,
               services->deviceRegistry,
               services->diagnosticHeader,
               services->eventHub,
               services->fileSystem,
               services->installedApplications,
               services->kernel,
               services->languages,
               services->logsmith,
               services->mainLoop,
               services->messageDigest,
               services->messageService,
               services->murmur,
               services->notificationCenter,
               services->orrery,
               services->preferences,
               services->processInformation,
               services->ptreeSerialization,
               services->reclaimer,
               services->servicesClient,
               services->supportLibrary,
               services->systemConfiguration,
               services->systemLog,
               services->tallybook,
               services->userDefaults,
               services->tapline},
      _services(std::move(services)) {}

HostPlatform::~HostPlatform() = default;

std::unique_ptr<HostPlatform> HostPlatform::open(const std::string& path, std::string& error) {
  return open(path, nullptr, error);
}

std::unique_ptr<HostPlatform> HostPlatform::openReadOnly(const std::string& path, SystemLog& log,
                                                         std::string& error) {
  return open(path, &log, error);
}

std::unique_ptr<HostPlatform> HostPlatform::open(const std::string& path, SystemLog* log,
                                                 std::string& error) {
  std::optional<DeviceDirectory> directory = DeviceDirectory::open(path, error);
  if (!directory) {
    return nullptr;
  }
  DeviceDescription description;
  const std::string file = directory->hostPath("device.json");
  bool missing = false;
  if (const std::optional<std::string> text = readWholeFile(file, error, &missing)) {
    std::optional<DeviceDescription> read = readDeviceDescription(*text, error);
    if (!read) {
      error = file + ": " + error;
      return nullptr;
    }
    description = *std::move(read);
  } else if (!missing) {
    return nullptr;
  }
  ProcessTimeZone timeZone;
  if (description.timeZone && !timeZone.set(*description.timeZone)) {
    error = file + ": timeZone: unknown time zone " + quotedText(*description.timeZone);
    return nullptr;
  }
  auto services =
      std::make_unique<Services>(log != nullptr ? directory->readOnly() : *std::move(directory),
                                 std::move(description), std::move(timeZone), log);
  return std::unique_ptr<HostPlatform>(new HostPlatform(std::move(services)));
}

const DeviceDirectory& HostPlatform::directory() const { return _services->directory; }
const DeviceDescription& HostPlatform::description() const { return _services->description; }
HostTallybook& HostPlatform::counters() { return _services->tallybook; }
HostDeviceRegistry& HostPlatform::describedRegistry() { return _services->deviceRegistry; }

}  // namespace vesprun
