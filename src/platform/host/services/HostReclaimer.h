#pragma once

#include "platform/Reclaimer.h"
#include "platform/host/device/DeviceDescription.h"

namespace vesprun {

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

}  // namespace vesprun
