#pragma once

#include <functional>
#include <map>
#include <set>
#include <string>
#include <utility>

#include "platform/host/device/DeviceDescription.h"
#include "platform/host/preferences/HostPreferences.h"

// Services that keep their values as `HostPreferences`; the references must outlive them.

namespace vesprun {

/// Each user's preferences, as documents in var/USER/Library/Preferences.
class HostServicesClient final : public LGSServicesClient {
 public:
  HostServicesClient(const DeviceDirectory& device, Clock& clock, SystemLog& log)
      : _device(device), _clock(clock), _log(log) {}

  void setPreferenceForUserInDomainToValue(std::optional<std::string_view> key,
                                           std::string_view user, std::string_view domain,
                                           std::optional<PropertyValue> value) override {
    _users.try_emplace(std::string(user), _device, _clock, _log, user)
        .first->second.LGSPreferencesSetValue(key, std::move(value), domain);
  }
  void deletePreferenceForUserInDomain(std::optional<std::string_view> key, std::string_view user,
                                       std::string_view domain) override {
    setPreferenceForUserInDomainToValue(key, user, domain, std::nullopt);
  }
  void synchronizeAllUsers() override { _users.clear(); }  // each writes when it goes

 private:
  const DeviceDirectory& _device;
  Clock& _clock;
  SystemLog& _log;
  std::map<std::string, HostPreferences, std::less<>> _users;
};

/// Documents in Library/Logsmith.
class HostSystemConfiguration : public LGSSystemConfiguration {
 public:
  HostSystemConfiguration(const DeviceDescription& description, const DeviceDirectory& device,
                          Clock& clock, SystemLog& log)
      : _description(description),
        _values(device, clock, log, PreferenceFolder{"Library/Logsmith"}) {}

  std::optional<PropertyValue> getPrefsKeyForDomainWithOptions(std::string_view key,
                                                               std::string_view domain,
                                                               std::uint32_t /*options*/) override {
    return _values.LGSPreferencesGetValue(key, domain);
  }
  void setPrefsKeyValueForDomainWithSync(std::optional<std::string_view> key,
                                         std::optional<PropertyValue> value,
                                         std::string_view domain, bool sync) override {
    _values.LGSPreferencesSetValue(key, std::move(value), domain);
    if (sync) {
      _changed.emplace(domain);
    }
  }
  void synchronize() override {
    for (const std::string& domain : std::exchange(_changed, {})) {
      _values.LGSPreferencesSynchronize(domain);
    }
  }
  PropertyArray getLogBlacklist() override { return _description.logBlacklist; }

 private:
  const DeviceDescription& _description;
  HostPreferences _values;
  std::set<std::string, std::less<>> _changed;  ///< domains to be written
};

}  // namespace vesprun
