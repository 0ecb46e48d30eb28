#include "platform/host/HostPlatform.h"

#include <mutex>
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
#include "platform/host/services/HostDailyWorkLock.h"
#include "platform/host/services/HostDiagnosticHeader.h"
#include "platform/host/services/HostEventHub.h"
#include "platform/host/services/HostFileSystem.h"
#include "platform/host/services/HostKernel.h"
#include "platform/host/services/HostLanguages.h"
#include "platform/host/services/HostLogsmith.h"
#include "platform/host/services/HostMessageDigest.h"
#include "platform/host/services/HostMurmur.h"
#include "platform/host/services/HostOrrery.h"
#include "platform/host/services/HostSystemLog.h"
#include "platform/host/services/HostTapline.h"

namespace vesprun {

// Destroyed from the last to the first: what writes at its end comes after what it needs for that.
struct HostPlatform::Services {
  Services(DeviceDirectory deviceDirectory, DeviceDescription deviceDescription,
           ProcessTimeZone processTimeZone, SystemLog* log)
      : directory(std::move(deviceDirectory)),
        description(std::move(deviceDescription)),
        timeZone(std::move(processTimeZone)),
        systemLog(log != nullptr ? *log : logFile) {}

  DeviceRegistry& deviceRegistry() {
    return interposedRegistry != nullptr ? *interposedRegistry : describedRegistry();
  }

  /// Laid out when it is first asked for, from whichever thread.
  HostDeviceRegistry& describedRegistry() {
    std::call_once(registryOnce,
                   [this] { registry.emplace(description.registry, directory, systemLog); });
    return *registry;
  }

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
  std::once_flag registryOnce;
  std::optional<HostDeviceRegistry> registry;
  DeviceRegistry* interposedRegistry = nullptr;
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

HostPlatform::HostPlatform(std::unique_ptr<Services> services) : _services(std::move(services)) {}

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
HostDeviceRegistry& HostPlatform::describedRegistry() { return _services->describedRegistry(); }
void HostPlatform::interposeDeviceRegistry(DeviceRegistry* registry) {
  _services->interposedRegistry = registry;
}

Clock& HostPlatform::clock() { return _services->clock; }
DeviceRegistry& HostPlatform::deviceRegistry() { return _services->deviceRegistry(); }
DailyWorkLock& HostPlatform::dailyWorkLock() { return _services->dailyWorkLock; }
DiagnosticHeader& HostPlatform::diagnosticHeader() { return _services->diagnosticHeader; }
EventHub& HostPlatform::eventHub() { return _services->eventHub; }
FileSystem& HostPlatform::fileSystem() { return _services->fileSystem; }
InstalledApplications& HostPlatform::installedApplications() {
  return _services->installedApplications;
}
Kernel& HostPlatform::kernel() { return _services->kernel; }
Languages& HostPlatform::languages() { return _services->languages; }
Logsmith& HostPlatform::logsmith() { return _services->logsmith; }
MainLoop& HostPlatform::mainLoop() { return _services->mainLoop; }
MessageDigest& HostPlatform::messageDigest() { return _services->messageDigest; }
MessageService& HostPlatform::messageService() { return _services->messageService; }
Murmur& HostPlatform::murmur() { return _services->murmur; }
NotificationCenter& HostPlatform::notificationCenter() { return _services->notificationCenter; }
Orrery& HostPlatform::orrery() { return _services->orrery; }
Preferences& HostPlatform::preferences() { return _services->preferences; }
ProcessInformation& HostPlatform::processInformation() { return _services->processInformation; }
PtreeSerialization& HostPlatform::ptreeSerialization() { return _services->ptreeSerialization; }
Reclaimer& HostPlatform::reclaimer() { return _services->reclaimer; }
LGSServicesClient& HostPlatform::servicesClient() { return _services->servicesClient; }
SupportLibrary& HostPlatform::supportLibrary() { return _services->supportLibrary; }
LGSSystemConfiguration& HostPlatform::systemConfiguration() {
  return _services->systemConfiguration;
}
SystemLog& HostPlatform::systemLog() { return _services->systemLog; }
Tallybook& HostPlatform::tallybook() { return _services->tallybook; }
Tapline& HostPlatform::tapline() { return _services->tapline; }
UserDefaults& HostPlatform::userDefaults() { return _services->userDefaults; }

}  // namespace vesprun
