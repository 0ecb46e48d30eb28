#pragma once

#include <memory>
#include <string>

#include "platform/Platform.h"
#include "platform/host/device/DeviceDescription.h"
#include "platform/host/device/DeviceDirectory.h"

namespace vesprun {

class HostDeviceRegistry;
class HostTallybook;

/// The platform of one device directory on the running Linux system. What the services hold back is
/// written when it is destroyed.
class HostPlatform : public Platform {
 public:
  /// Reads the description of the device. Nothing, with a text in `error` that names the place,
  /// when the folder or its `device.json` cannot be used. A described time zone is that of the
  /// whole process, in its environment variable TZ, until the platform is destroyed.
  static std::unique_ptr<HostPlatform> open(const std::string& path, std::string& error);

  /// The same, to look at the device without changing anything on it: no file is written, made or
  /// removed, a change of a preference holds for this platform alone, and `log`, which outlives it,
  /// takes what the system log would. The device need not be writable.
  static std::unique_ptr<HostPlatform> openReadOnly(const std::string& path, SystemLog& log,
                                                    std::string& error);

  ~HostPlatform() override;

  const DeviceDirectory& directory() const;
  const DeviceDescription& description() const;
  /// The counter database with the operations that only tools need.
  HostTallybook& counters();
  /// The described registry, which knows which handles are out.
  HostDeviceRegistry& describedRegistry();
  /// From now on `deviceRegistry` is this one, which outlives the platform: it stands between the
  /// program and the described registry, to watch the calls or to make some fail. Null: none.
  void interposeDeviceRegistry(DeviceRegistry* registry);

  Clock& clock() override;
  DailyWorkLock& dailyWorkLock() override;
  DeviceRegistry& deviceRegistry() override;
  DiagnosticHeader& diagnosticHeader() override;
  EventHub& eventHub() override;
  FileSystem& fileSystem() override;
  InstalledApplications& installedApplications() override;
  Kernel& kernel() override;
  Languages& languages() override;
  Logsmith& logsmith() override;
  MainLoop& mainLoop() override;
  MessageDigest& messageDigest() override;
  MessageService& messageService() override;
  Murmur& murmur() override;
  NotificationCenter& notificationCenter() override;
  Orrery& orrery() override;
  Preferences& preferences() override;
  ProcessInformation& processInformation() override;
  PtreeSerialization& ptreeSerialization() override;
  Reclaimer& reclaimer() override;
  LGSServicesClient& servicesClient() override;
  SupportLibrary& supportLibrary() override;
  LGSSystemConfiguration& systemConfiguration() override;
  SystemLog& systemLog() override;
  Tallybook& tallybook() override;
  UserDefaults& userDefaults() override;
  Tapline& tapline() override;

 private:
  struct Services;

  explicit HostPlatform(std::unique_ptr<Services> services);

  /// Read-only with a `log`.
  static std::unique_ptr<HostPlatform> open(const std::string& path, SystemLog* log,
                                            std::string& error);

  std::unique_ptr<Services> _services;
};

}  // namespace vesprun
