#include "platform/Preferences.h"

namespace vesprun {

std::int64_t Preferences::LGSPreferencesGetIntegerValue(std::string_view key,
                                                        std::string_view domain) {
  const std::optional<PropertyValue> value = LGSPreferencesGetValue(key, domain);
  if (!value) {
    return 0;
  }
  if (const Number* number = value->number()) {
    return number->asInt64();
  }
  const bool* boolean = value->boolean();
  return boolean != nullptr && *boolean ? 1 : 0;
}

bool Preferences::LGSPreferencesGetBoolValue(std::string_view key, std::string_view domain,
                                             bool& found) {
  const std::optional<PropertyValue> value = LGSPreferencesGetValue(key, domain);
  found = value && (value->boolean() != nullptr || value->number() != nullptr);
  if (!found) {
    return false;
  }
  return value->boolean() != nullptr ? *value->boolean() : value->number()->asDouble() != 0;
}

}  // namespace vesprun
