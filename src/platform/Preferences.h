#pragma once

#include <cstdint>
#include <optional>
#include <string_view>

#include "common/PropertyValue.h"

namespace vesprun {

/// The mobile user's preferences: one dictionary of values for each domain. A change is seen by
/// this process at once and is written when its domain is synchronized, or at the latest when the
/// process ends. May be called from any thread.
class Preferences {
 public:
  virtual ~Preferences() = default;

  virtual std::optional<PropertyValue> LGSPreferencesGetValue(std::string_view key,
                                                              std::string_view domain) = 0;

  /// Sets `value`, or removes the key when there is none. Key and domain may come from somebody
  /// else's data: a missing key, the empty domain, which also stands for a missing one, and a name
  /// that cannot be a domain's are refused with an error in the system log.
  virtual void LGSPreferencesSetValue(std::optional<std::string_view> key,
                                      std::optional<PropertyValue> value,
                                      std::string_view domain) = 0;

  /// Writes the domain's changes durably, keeping what other processes changed meanwhile. False
  /// when that failed; the system log says why, and the changes stay for the next attempt.
  virtual bool LGSPreferencesSynchronize(std::string_view domain) = 0;

  /// A number as a signed 64-bit integer, a boolean as 1 or 0; anything else, or nothing, is 0.
  std::int64_t LGSPreferencesGetIntegerValue(std::string_view key, std::string_view domain);

  /// Sets `found` when the key holds a usable value: a boolean, or a number, which is true when it
  /// is not 0. Returns false, and clears `found`, otherwise.
  bool LGSPreferencesGetBoolValue(std::string_view key, std::string_view domain, bool& found);
};

}  // namespace vesprun
