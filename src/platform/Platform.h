#pragma once

#include "platform/Clock.h"
#include "platform/DailyWorkLock.h"
#include "platform/DeviceRegistry.h"
#include "platform/DiagnosticHeader.h"
#include "platform/EventHub.h"
#include "platform/FileSystem.h"
#include "platform/InstalledApplications.h"
#include "platform/Kernel.h"
#include "platform/Languages.h"
#include "platform/Logsmith.h"
#include "platform/MainLoop.h"
#include "platform/MessageDigest.h"
#include "platform/MessageService.h"
#include "platform/Murmur.h"
#include "platform/NotificationCenter.h"
#include "platform/Orrery.h"
#include "platform/Preferences.h"
#include "platform/ProcessInformation.h"
#include "platform/PtreeSerialization.h"
#include "platform/Reclaimer.h"
#include "platform/ServicesClient.h"
#include "platform/SupportLibrary.h"
#include "platform/SystemConfiguration.h"
#include "platform/SystemLog.h"
#include "platform/Tallybook.h"
#include "platform/Tapline.h"
#include "platform/UserDefaults.h"

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
  Service<DailyWorkLock> dailyWorkLock;
  Service<DeviceRegistry> deviceRegistry;
  Service<DiagnosticHeader> diagnosticHeader;
  Service<EventHub> eventHub;
  Service<FileSystem> fileSystem;
  Service<InstalledApplications> installedApplications;
  Service<Kernel> kernel;
  Service<Languages> languages;
  Service<Logsmith> logsmith;
  Service<MainLoop> mainLoop;
  Service<MessageDigest> messageDigest;
  Service<MessageService> messageService;
  Service<Murmur> murmur;
  Service<NotificationCenter> notificationCenter;
  Service<Orrery> orrery;
  Service<Preferences> preferences;
  Service<ProcessInformation> processInformation;
  Service<PtreeSerialization> ptreeSerialization;
  Service<Reclaimer> reclaimer;
  Service<LGSServicesClient> servicesClient;
  Service<SupportLibrary> supportLibrary;
  Service<LGSSystemConfiguration> systemConfiguration;
  Service<SystemLog> systemLog;
  Service<Tallybook> tallybook;
  Service<UserDefaults> userDefaults;
  Service<Tapline> tapline;
};

bool platformIsInstalled();

/// Without an installed platform the process ends with a line on standard error.
Platform& platform();

/// Installs a platform as long as it lives. A process has one at a time.
class InstalledPlatform {
 public:
  explicit InstalledPlatform(Platform& installed);
  ~InstalledPlatform();

  InstalledPlatform(const InstalledPlatform&) = delete;
  InstalledPlatform& operator=(const InstalledPlatform&) = delete;
};

}  // namespace vesprun
