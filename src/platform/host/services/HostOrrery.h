#pragma once

#include "platform/Orrery.h"
#include "platform/host/device/DeviceDescription.h"
#include "platform/host/device/DeviceDirectory.h"

namespace vesprun {

/// Device properties: those described, and the live disk usage of the device directory.
class HostOrrery : public Orrery {
 public:
  HostOrrery(const DevicePropertyDescription& description, const DeviceDirectory& directory)
      : _description(description), _directory(directory) {}

  std::optional<PropertyValue> OrreryCopyAnswer(std::string_view question) override;

 private:
  std::optional<PropertyValue> diskUsage() const;

  const DevicePropertyDescription& _description;
  const DeviceDirectory& _directory;
};

}  // namespace vesprun
