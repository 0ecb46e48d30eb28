#pragma once

#include "platform/ServicesClient.h"
#include "platform/host/HostPreferences.h"

namespace vesprun {

/// The preferences of each user as documents in var/USER/Library/Preferences.
class HostServicesClient final : public LGSServicesClient {
 public:
  /// Both must outlive the object.
  HostServicesClient(const DeviceDirectory& device, SystemLog& log) : _device(device), _log(log) {}

  void setPreferenceForUserInDomainToValue(std::optional<std::string_view> key,
                                           std::string_view user, std::string_view domain,
                                           std::optional<PropertyValue> value) override;
  void deletePreferenceForUserInDomain(std::optional<std::string_view> key, std::string_view user,
                                       std::string_view domain) override;

 private:
  const DeviceDirectory& _device;
  SystemLog& _log;
};

}  // namespace vesprun
