#pragma once

#include <utility>

#include "platform/Preferences.h"
#include "platform/UserDefaults.h"

namespace vesprun {

/// The store as one more domain among the mobile user's preferences.
class HostUserDefaults : public UserDefaults {
 public:
  explicit HostUserDefaults(Preferences& preferences) : _preferences(preferences) {}

  std::optional<PropertyValue> valueForKey(std::string_view key) override {
    return _preferences.LGSPreferencesGetValue(key, kDomain);
  }
  void setValueForKey(std::optional<PropertyValue> value, std::string_view key) override {
    _preferences.LGSPreferencesSetValue(key, std::move(value), kDomain);
  }
  bool synchronize() override { return _preferences.LGSPreferencesSynchronize(kDomain); }

 private:
  static constexpr std::string_view kDomain = "vesprun";

  Preferences& _preferences;
};

}  // namespace vesprun
