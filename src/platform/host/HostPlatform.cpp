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
#include "platform/host/preferences/HostServicesClient.h"
#include "platform/host/preferences/HostSystemConfiguration.h"
#include "platform/host/preferences/HostUserDefaults.h"
#include "platform/host/registry/HostDeviceRegistry.h"
#include "platform/host/services/HostClock.h"
#include "platform/host/services/HostDailyWorkLock.h"
#include "platform/host/services/HostDiagnosticHeader.h"
#include "platform/host/services/HostEventHub.h"
#include "platform/host/services/HostFileSystem.h"
#include "platform/host/services/HostInstalledApplications.h"
#include "platform/host/services/HostKernel.h"
#include "platform/host/services/HostLanguages.h"
#include "platform/host/services/HostLogsmith.h"
#include "platform/host/services/HostMessageDigest.h"
#include "platform/host/services/HostMurmur.h"
#include "platform/host/services/HostNotificationCenter.h"
#include "platform/host/services/HostOrrery.h"
#include "platform/host/services/HostProcessInformation.h"
#include "platform/host/services/HostPtreeSerialization.h"
#include "platform/host/services/HostReclaimer.h"
#include "platform/host/services/HostSupportLibrary.h"
#include "platform/host/services/HostSystemLog.h"
#include "platform/host/services/HostTapline.h"

namespace vesprun {

// Destroyed from the last to the first: what writes at its end stands below what it needs for that.
struct HostPlatform::Services {
  /// A service that is made when it is first asked for, from whichever thread.
  template <typename Service>
  class Lazy {
   public:
    template <typename... Arguments>
    Service& get(Arguments&&... arguments) {
      std::call_once(_once, [&] { _service.emplace(std::forward<Arguments>(arguments)...); });
      return *_service;
    }

   private:
    std::once_flag _once;
    std::optional<Service> _service;
  };

  Services(DeviceDirectory deviceDirectory, DeviceDescription deviceDescription,
           ProcessTimeZone processTimeZone)
      : directory(std::move(deviceDirectory)),
        description(std::move(deviceDescription)),
        timeZone(std::move(processTimeZone)),
        clock(description.clock),
        systemLog(directory, clock, description.logLevel),
        outbox(directory, clock, systemLog) {}

  DeviceDirectory directory;
  DeviceDescription description;
  ProcessTimeZone timeZone;
  HostClock clock;
  HostSystemLog systemLog;
  Outbox outbox;
  Lazy<HostDailyWorkLock> dailyWorkLock;  // freed when what stands below has been written
  Lazy<HostPreferences> preferences;
  Lazy<HostTallybook> tallybook;
  Lazy<HostDeviceRegistry> describedRegistry;
  DeviceRegistry* interposedRegistry = nullptr;
  Lazy<HostDiagnosticHeader> diagnosticHeader;
  Lazy<HostEventHub> eventHub;
  Lazy<HostFileSystem> fileSystem;
  Lazy<HostInstalledApplications> installedApplications;
  Lazy<HostKernel> kernel;
  Lazy<HostLanguages> languages;
  Lazy<HostLogsmith> logsmith;
  Lazy<HostMessageDigest> messageDigest;
  Lazy<HostNotificationCenter> notificationCenter;
  Lazy<HostOrrery> orrery;
  Lazy<HostProcessInformation> processInformation;
  Lazy<HostPtreeSerialization> ptreeSerialization;
  Lazy<HostReclaimer> reclaimer;
  Lazy<HostServicesClient> servicesClient;
  Lazy<HostSupportLibrary> supportLibrary;
  Lazy<HostSystemConfiguration> systemConfiguration;
  Lazy<HostUserDefaults> userDefaults;
  Lazy<HostMainLoop> mainLoop;
  Lazy<HostMessageService> messageService;
  Lazy<HostTapline> tapline;
  Lazy<HostMurmur> murmur;  // last: until it has ended, a reply may use what stands above
};

HostPlatform::HostPlatform(std::unique_ptr<Services> services) : _services(std::move(services)) {}

HostPlatform::~HostPlatform() = default;

std::unique_ptr<HostPlatform> HostPlatform::open(const std::string& path, std::string& error) {
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
  auto services = std::make_unique<Services>(*std::move(directory), std::move(description),
                                             std::move(timeZone));
  return std::unique_ptr<HostPlatform>(new HostPlatform(std::move(services)));
}

const DeviceDirectory& HostPlatform::directory() const { return _services->directory; }

const DeviceDescription& HostPlatform::description() const { return _services->description; }

Clock& HostPlatform::clock() { return _services->clock; }

SystemLog& HostPlatform::systemLog() { return _services->systemLog; }

HostTallybook& HostPlatform::counters() {
  return _services->tallybook.get(directory(), clock(), preferences(), systemLog());
}

Tallybook& HostPlatform::tallybook() { return counters(); }

HostDeviceRegistry& HostPlatform::describedRegistry() {
  return _services->describedRegistry.get(description().registry, directory(), systemLog());
}

void HostPlatform::interposeDeviceRegistry(DeviceRegistry* registry) {
  _services->interposedRegistry = registry;
}

DeviceRegistry& HostPlatform::deviceRegistry() {
  return _services->interposedRegistry != nullptr ? *_services->interposedRegistry
                                                  : describedRegistry();
}

DailyWorkLock& HostPlatform::dailyWorkLock() {
  return _services->dailyWorkLock.get(directory(), systemLog());
}

DiagnosticHeader& HostPlatform::diagnosticHeader() {
  return _services->diagnosticHeader.get(description().system);
}

EventHub& HostPlatform::eventHub() {
  return _services->eventHub.get(description().events, _services->outbox);
}

FileSystem& HostPlatform::fileSystem() {
  return _services->fileSystem.get(directory(), description().userVolume, systemLog());
}

InstalledApplications& HostPlatform::installedApplications() {
  return _services->installedApplications.get(description());
}

Kernel& HostPlatform::kernel() {
  return _services->kernel.get(description().kernel, directory(), systemLog());
}

Languages& HostPlatform::languages() { return _services->languages.get(description().languages); }

Logsmith& HostPlatform::logsmith() {
  return _services->logsmith.get(description(), _services->outbox);
}

MainLoop& HostPlatform::mainLoop() { return _services->mainLoop.get(); }

MessageDigest& HostPlatform::messageDigest() { return _services->messageDigest.get(); }

MessageService& HostPlatform::messageService() {
  return _services->messageService.get(directory(), ptreeSerialization(), systemLog(),
                                       _services->mainLoop.get());
}

Murmur& HostPlatform::murmur() { return _services->murmur.get(description().usage, systemLog()); }

NotificationCenter& HostPlatform::notificationCenter() {
  return _services->notificationCenter.get(_services->outbox);
}

Orrery& HostPlatform::orrery() {
  return _services->orrery.get(description().properties, directory());
}

Preferences& HostPlatform::preferences() {
  return _services->preferences.get(directory(), clock(), systemLog());
}

ProcessInformation& HostPlatform::processInformation() {
  return _services->processInformation.get();
}

PtreeSerialization& HostPlatform::ptreeSerialization() {
  return _services->ptreeSerialization.get();
}

Reclaimer& HostPlatform::reclaimer() { return _services->reclaimer.get(description()); }

LGSServicesClient& HostPlatform::servicesClient() {
  return _services->servicesClient.get(directory(), clock(), systemLog());
}

SupportLibrary& HostPlatform::supportLibrary() {
  return _services->supportLibrary.get(description().supportLibrary);
}

LGSSystemConfiguration& HostPlatform::systemConfiguration() {
  return _services->systemConfiguration.get(description(), directory(), clock(), systemLog());
}

Tapline& HostPlatform::tapline() { return _services->tapline.get(description().channels); }

UserDefaults& HostPlatform::userDefaults() { return _services->userDefaults.get(preferences()); }

}  // namespace vesprun
