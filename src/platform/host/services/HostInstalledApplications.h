#pragma once

#include "platform/InstalledApplications.h"
#include "platform/host/device/DeviceDescription.h"
#include "platform/host/device/LiveSystem.h"

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

}  // namespace vesprun
