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

/// Gathers the services of the platform that the program runs on. A service may be made when it is
/// first asked for, and lives as long as the platform.
class Platform {
 public:
  virtual ~Platform() = default;

  virtual Clock& clock() = 0;
  virtual DailyWorkLock& dailyWorkLock() = 0;
  virtual DeviceRegistry& deviceRegistry() = 0;
  virtual DiagnosticHeader& diagnosticHeader() = 0;
  virtual EventHub& eventHub() = 0;
  virtual FileSystem& fileSystem() = 0;
  virtual InstalledApplications& installedApplications() = 0;
  virtual Kernel& kernel() = 0;
  virtual Languages& languages() = 0;
  virtual Logsmith& logsmith() = 0;
  virtual MainLoop& mainLoop() = 0;
  virtual MessageDigest& messageDigest() = 0;
  virtual MessageService& messageService() = 0;
  virtual Murmur& murmur() = 0;
  virtual NotificationCenter& notificationCenter() = 0;
  virtual Orrery& orrery() = 0;
  virtual Preferences& preferences() = 0;
  virtual ProcessInformation& processInformation() = 0;
  virtual PtreeSerialization& ptreeSerialization() = 0;
  virtual Reclaimer& reclaimer() = 0;
  virtual LGSServicesClient& servicesClient() = 0;
  virtual SupportLibrary& supportLibrary() = 0;
  virtual LGSSystemConfiguration& systemConfiguration() = 0;
  virtual SystemLog& systemLog() = 0;
  virtual Tallybook& tallybook() = 0;
  virtual UserDefaults& userDefaults() = 0;
  virtual Tapline& tapline() = 0;
};

bool platformIsInstalled();

/// The installed platform. Without one the process ends, with a line on the standard error stream.
Platform& platform();

/// Installs a platform for as long as it lives; a process has exactly one at a time.
class InstalledPlatform {
 public:
  explicit InstalledPlatform(Platform& installed);
  ~InstalledPlatform();

  InstalledPlatform(const InstalledPlatform&) = delete;
  InstalledPlatform& operator=(const InstalledPlatform&) = delete;
};

}  // namespace vesprun
