#pragma once

#include "platform/SystemConfiguration.h"
#include "platform/host/device/DeviceDescription.h"
#include "platform/host/preferences/HostPreferences.h"

namespace vesprun {

/// The configuration as documents in Library/Logsmith. What was not synchronized is written when
/// the object is destroyed.
class HostSystemConfiguration final : public LGSSystemConfiguration {
 public:
  /// What the references name must outlive the object.
  HostSystemConfiguration(const DeviceDescription& description, const DeviceDirectory& device,
                          Clock& clock, SystemLog& log)
      : _description(description),
        _values(device, clock, log, PreferenceFolder{"Library/Logsmith"}) {}

  std::optional<PropertyValue> getPrefsKeyForDomainWithOptions(std::string_view key,
                                                               std::string_view domain,
                                                               std::uint32_t options) override;
  void setPrefsKeyValueForDomainWithSync(std::optional<std::string_view> key,
                                         std::optional<PropertyValue> value,
                                         std::string_view domain, bool sync) override;
  PropertyArray getLogBlacklist() override { return _description.logBlacklist; }

 private:
  const DeviceDescription& _description;
  HostPreferences _values;
};

}  // namespace vesprun
