#pragma once

#include <memory>
#include <string>

#include "platform/Platform.h"
#include "platform/host/DeviceDescription.h"
#include "platform/host/DeviceDirectory.h"

namespace vesprun {

class SqliteTallybook;

/// The platform of one device directory on the running Linux system. What the services hold back is
/// written when it is destroyed.
class HostPlatform : public Platform {
 public:
  /// Reads the description of the device. Nothing, with a text in `error` that names the place,
  /// when the folder or its `device.json` cannot be used.
  static std::unique_ptr<HostPlatform> open(const std::string& path, std::string& error);

  ~HostPlatform() override;

  const DeviceDirectory& directory() const;
  const DeviceDescription& description() const;
  /// The counter database with the operations that only tools need.
  SqliteTallybook& counters();

  Clock& clock() override;
  EventHub& eventHub() override;
  FileSystem& fileSystem() override;
  InstalledApplications& installedApplications() override;
  Kernel& kernel() override;
  Languages& languages() override;
  Logsmith& logsmith() override;
  MainLoop& mainLoop() override;
  MessageDigest& messageDigest() override;
  MessageService& messageService() override;
  NotificationCenter& notificationCenter() override;
  Orrery& orrery() override;
  Preferences& preferences() override;
  PtreeSerialization& ptreeSerialization() override;
  SupportLibrary& supportLibrary() override;
  SystemLog& systemLog() override;
  Tallybook& tallybook() override;

 private:
  struct Services;

  explicit HostPlatform(std::unique_ptr<Services> services);

  std::unique_ptr<Services> _services;
};

}  // namespace vesprun
