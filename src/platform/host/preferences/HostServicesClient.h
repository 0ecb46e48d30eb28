#pragma once

#include "platform/ServicesClient.h"
#include "platform/host/preferences/HostPreferences.h"

namespace vesprun {

/// The preferences of each user as documents in var/USER/Library/Preferences.
class HostServicesClient final : public LGSServicesClient {
 public:
  /// What the references name must outlive the object.
  HostServicesClient(const DeviceDirectory& device, Clock& clock, SystemLog& log)
      : _device(device), _clock(clock), _log(log) {}

  void setPreferenceForUserInDomainToValue(std::optional<std::string_view> key,
                                           std::string_view user, std::string_view domain,
                                           std::optional<PropertyValue> value) override;
  void deletePreferenceForUserInDomain(std::optional<std::string_view> key, std::string_view user,
                                       std::string_view domain) override;

 private:
  const DeviceDirectory& _device;
  Clock& _clock;
  SystemLog& _log;
};

}  // namespace vesprun
