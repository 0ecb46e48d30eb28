#pragma once

#include <unistd.h>

#include <utility>

#include "platform/InstalledApplications.h"
#include "platform/NotificationCenter.h"
#include "platform/ProcessInformation.h"
#include "platform/PtreeSerialization.h"
#include "platform/Reclaimer.h"
#include "platform/SupportLibrary.h"
#include "platform/host/device/DeviceDescription.h"
#include "platform/host/device/LiveSystem.h"
#include "platform/host/device/Outbox.h"
#include "platform/host/documents/PtreeReader.h"
#include "platform/host/documents/PtreeWriter.h"

// The services that only hand on what another part of the host platform has.

namespace vesprun {

class HostInstalledApplications : public InstalledApplications {
 public:
  explicit HostInstalledApplications(const DeviceDescription& description)
      : _description(description) {}

  void EnumerateInstalledBundles(const Visitor& visitor) override {
    for (const auto& [bundle, user] :
         _description.apps ? *_description.apps : live::applications()) {
      visitor(bundle, user ? BundleType::User : BundleType::System);
    }
  }

 private:
  const DeviceDescription& _description;
};

/// Posted notifications stand in `outbox/notifications.jsonl`.
class HostNotificationCenter : public NotificationCenter {
 public:
  explicit HostNotificationCenter(Outbox& outbox) : _outbox(outbox) {}

  void PostNotification(std::string_view name) override {
    _outbox.append("notifications.jsonl", {{"name", name}});
  }

 private:
  Outbox& _outbox;
};

/// The job's process on the device: it is vesprun there, whichever program runs it here.
class HostProcessInformation : public ProcessInformation {
 public:
  std::string processName() override { return "vesprun"; }
  std::int32_t processIdentifier() override { return getpid(); }
};

class HostPtreeSerialization final : public PtreeSerialization {
 public:
  std::optional<PropertyValue> parse(std::string_view bytes, std::string& error) override {
    return readPtree(bytes, error);
  }

  std::optional<std::string> serialize(const PropertyDict& dict, std::string& error) override {
    std::string document;
    return writePtree(dict, document, error) ? std::optional(std::move(document)) : std::nullopt;
  }
};

/// Gives the described answer, whichever volume is asked for.
class HostReclaimer : public Reclaimer {
 public:
  explicit HostReclaimer(const DeviceDescription& description) : _description(description) {}

  bool isAvailable() override { return _description.purgeableServiceAvailable; }
  std::optional<PropertyDict> ReclaimerCopyItemizedPurgeableSpaceWithInfo(
      const PropertyDict& /*options*/) override {
    return _description.purgeable;
  }

 private:
  const DeviceDescription& _description;
};

/// The support library as described. It is simulated: what it offers, `Preferences` does.
class HostSupportLibrary : public SupportLibrary {
 public:
  explicit HostSupportLibrary(const SupportLibraryDescription& description)
      : _description(description) {}

  bool load() override { return _description.available; }
  bool offers(std::string_view symbol) override { return !_description.missing.contains(symbol); }

 private:
  const SupportLibraryDescription& _description;
};

}  // namespace vesprun
