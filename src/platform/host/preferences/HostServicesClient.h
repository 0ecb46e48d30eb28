#pragma once

#include <functional>
#include <map>
#include <string>

#include "platform/ServicesClient.h"
#include "platform/host/preferences/HostPreferences.h"

namespace vesprun {

/// The preferences of each user as documents in var/USER/Library/Preferences.
/// What is refused is reported once for each user and domain.
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
  void synchronizeAllUsers() override { _users.clear(); }  // each writes when it goes

 private:
  const DeviceDirectory& _device;
  Clock& _clock;
  SystemLog& _log;
  std::map<std::string, HostPreferences, std::less<>> _users;
};

}  // namespace vesprun
