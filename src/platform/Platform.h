#pragma once

#include "platform/Clock.h"
#include "platform/DeviceInformation.h"
#include "platform/DeviceRegistry.h"
#include "platform/EventHub.h"
#include "platform/FileSystem.h"
#include "platform/Kernel.h"
#include "platform/Logsmith.h"
#include "platform/MessageService.h"
#include "platform/Murmur.h"
#include "platform/Preferences.h"
#include "platform/PtreeSerialization.h"
#include "platform/SystemLog.h"
#include "platform/Tallybook.h"
#include "platform/Tapline.h"

namespace vesprun {

/// The services of the running platform: `platform().clock()` is the clock.
struct Platform {
  /// The object that offers a service, which must outlive the platform.
  template <typename T>
  class Service {
   public:
    Service(T& service) : _service(&service) {}  // NOLINT(google-explicit-constructor)
    T& operator()() const { return *_service; }

   private:
    T* _service;
  };

  Service<Clock> clock;
  Service<DeviceInformation> deviceInformation;
  Service<DeviceRegistry> deviceRegistry;
  Service<EventHub> eventHub;
  Service<FileSystem> fileSystem;
  Service<Kernel> kernel;
  Service<Logsmith> logsmith;
  Service<MainLoop> mainLoop;
  Service<MessageService> messageService;
  Service<Murmur> murmur;
  Service<Preferences> preferences;
  Service<PtreeSerialization> ptreeSerialization;
  Service<LGSServicesClient> servicesClient;
  Service<LGSSystemConfiguration> systemConfiguration;
  Service<SystemLog> systemLog;
  Service<Tallybook> tallybook;
  Service<Tapline> tapline;
};

bool platformIsInstalled();

/// Without an installed platform the process ends with a line on standard error.
Platform& platform();

/// Writes a printf-style message to the installed platform's log; formed only if its level is kept.
/// Pass a value's text form ("%@") as %s.
[[gnu::format(printf, 2, 3)]] void logMessage(LogLevel level, const char* format, ...);

/// Installs a platform as long as it lives. A process has one at a time.
class InstalledPlatform {
 public:
  explicit InstalledPlatform(Platform& installed);
  ~InstalledPlatform();

  InstalledPlatform(const InstalledPlatform&) = delete;
  InstalledPlatform& operator=(const InstalledPlatform&) = delete;
};

}  // namespace vesprun
