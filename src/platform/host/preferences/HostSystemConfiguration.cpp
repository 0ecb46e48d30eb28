#include "platform/host/preferences/HostSystemConfiguration.h"

#include <utility>

namespace vesprun {

std::optional<PropertyValue> HostSystemConfiguration::getPrefsKeyForDomainWithOptions(
    std::string_view key, std::string_view domain, std::uint32_t /*options*/) {
  return _values.LGSPreferencesGetValue(key, domain);
}

void HostSystemConfiguration::setPrefsKeyValueForDomainWithSync(std::optional<std::string_view> key,
                                                                std::optional<PropertyValue> value,
                                                                std::string_view domain,
                                                                bool sync) {
  _values.LGSPreferencesSetValue(key, std::move(value), domain);
  if (sync) {
    _values.LGSPreferencesSynchronize(domain);
  }
}

}  // namespace vesprun
