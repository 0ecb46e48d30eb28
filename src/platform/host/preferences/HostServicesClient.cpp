#include "platform/host/preferences/HostServicesClient.h"

#include <utility>

namespace vesprun {

void HostServicesClient::setPreferenceForUserInDomainToValue(std::optional<std::string_view> key,
                                                             std::string_view user,
                                                             std::string_view domain,
                                                             std::optional<PropertyValue> value) {
  // Written when it goes.
  HostPreferences(_device, _clock, _log, user)
      .LGSPreferencesSetValue(key, std::move(value), domain);
}

void HostServicesClient::deletePreferenceForUserInDomain(std::optional<std::string_view> key,
                                                         std::string_view user,
                                                         std::string_view domain) {
  setPreferenceForUserInDomainToValue(key, user, domain, std::nullopt);
}

}  // namespace vesprun
