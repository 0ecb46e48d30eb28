#pragma once

#include <cstdint>
#include <optional>
#include <string_view>

#include "common/PropertyValue.h"

namespace vesprun {

/// The mobile user's preferences, a dictionary for each domain. This process sees a change at once;
/// it is written when its domain is synchronized, or when the process ends. Safe from any thread.
class Preferences {
 public:
  virtual ~Preferences() = default;

  virtual std::optional<PropertyValue> LGSPreferencesGetValue(std::string_view key,
                                                              std::string_view domain) = 0;

  /// Sets a value, or removes the key when there is none. Key and domain may come from foreign
  /// data: a missing key, an empty (or missing) domain and an impossible domain name are refused
  /// with an error in the system log.
  virtual void LGSPreferencesSetValue(std::optional<std::string_view> key,
                                      std::optional<PropertyValue> value,
                                      std::string_view domain) = 0;

  /// Writes the domain's changes durably and keeps those of other processes. False on failure: the
  /// system log has the reason, and the changes stay for the next attempt.
  virtual bool LGSPreferencesSynchronize(std::string_view domain) = 0;

  /// A number as a signed 64-bit integer, a boolean as 1 or 0, anything else as 0.
  std::int64_t LGSPreferencesGetIntegerValue(std::string_view key, std::string_view domain);

  /// `found`: the key holds a boolean or a number, which is true unless it is 0.
  bool LGSPreferencesGetBoolValue(std::string_view key, std::string_view domain, bool& found);
};

}  // namespace vesprun
