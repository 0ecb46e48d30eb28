#include "platform/host/preferences/HostServicesClient.h"

#include <utility>

namespace vesprun {

void HostServicesClient::setPreferenceForUserInDomainToValue(std::optional<std::string_view> key,
                                                             std::string_view user,
                                                             std::string_view domain,
                                                             std::optional<PropertyValue> value) {
  _users.try_emplace(std::string(user), _device, _clock, _log, user)
      .first->second.LGSPreferencesSetValue(key, std::move(value), domain);
}

void HostServicesClient::deletePreferenceForUserInDomain(std::optional<std::string_view> key,
                                                         std::string_view user,
                                                         std::string_view domain) {
  setPreferenceForUserInDomainToValue(key, user, domain, std::nullopt);
}

}  // namespace vesprun
