#pragma once

#include <cstdint>
#include <optional>
#include <string_view>

#include "vesprun/PropertyValue.h"

// Stored values. A process sees its own change at once; it is written when it is synchronized, or
// when the process ends. Setting nothing removes the key.
//
// Keys, domains and users may come from untrusted data. A missing key, an empty (or missing) domain
// or user and an impossible name are refused with an error in the system log.

namespace vesprun {

/// The job's own domain, its memory from one day to the next.
inline constexpr std::string_view kOwnDomain = "com.quill.aggregated.vesprun";

/// In it: the last day for which the daily tasks were run.
inline constexpr std::string_view kStoredDayKey = "LastCrashLogSerializationDateInDaysSince1970";

// In it: the current tasking, as the daily log reports it.
inline constexpr std::string_view kTaskingIDKey = "TaskingID";
inline constexpr std::string_view kTaskingDigestKey = "TaskingDigest";
inline constexpr std::string_view kTaskingPayloadKey = "TaskingPayload";

/// In the domain of all aggregated figures: how often the counter database was damaged.
inline constexpr std::string_view kAggregatedDomain = "com.quill.aggregated";
inline constexpr std::string_view kCorruptionCountKey = "DatabaseCorruptionCount";

/// The mobile user's preferences, a dictionary for each domain. Safe from any thread.
class Preferences {
 public:
  virtual ~Preferences() = default;

  virtual std::optional<PropertyValue> LGSPreferencesGetValue(std::string_view key,
                                                              std::string_view domain) = 0;

  virtual void LGSPreferencesSetValue(std::optional<std::string_view> key,
                                      std::optional<PropertyValue> value,
                                      std::string_view domain) = 0;

  /// Writes the domain's changes durably and keeps those of other processes. False on failure: the
  /// system log says why, and the changes stay for the next attempt.
  virtual bool LGSPreferencesSynchronize(std::string_view domain) = 0;

  /// A number as a signed 64-bit integer, a boolean as 1 or 0, anything else as 0.
  std::int64_t LGSPreferencesGetIntegerValue(std::string_view key, std::string_view domain);

  /// `found`: the key holds a boolean or a number, which is true unless it is 0.
  bool LGSPreferencesGetBoolValue(std::string_view key, std::string_view domain, bool& found);
};

/// The preferences of users other than the mobile one.
class LGSServicesClient {
 public:
  virtual ~LGSServicesClient() = default;

  virtual void setPreferenceForUserInDomainToValue(std::optional<std::string_view> key,
                                                   std::string_view user, std::string_view domain,
                                                   std::optional<PropertyValue> value) = 0;

  virtual void deletePreferenceForUserInDomain(std::optional<std::string_view> key,
                                               std::string_view user, std::string_view domain) = 0;

  /// Writes all changes durably; failures go to the system log.
  virtual void synchronizeAllUsers() = 0;
};

/// The diagnostics service's own configuration, a dictionary for each domain.
class LGSSystemConfiguration {
 public:
  virtual ~LGSSystemConfiguration() = default;

  /// `options` is 0: none is in use.
  virtual std::optional<PropertyValue> getPrefsKeyForDomainWithOptions(std::string_view key,
                                                                       std::string_view domain,
                                                                       std::uint32_t options) = 0;

  /// With `sync` the next `synchronize` writes the domain durably; without, the change waits for
  /// the domain's next write or the end of the process.
  virtual void setPrefsKeyValueForDomainWithSync(std::optional<std::string_view> key,
                                                 std::optional<PropertyValue> value,
                                                 std::string_view domain, bool sync) = 0;

  /// Writes each domain that was changed with `sync` once; failures go to the system log.
  virtual void synchronize() = 0;

  /// Log types that are disabled unless the user's preferences say otherwise, in order.
  virtual PropertyArray getLogBlacklist() = 0;
};

}  // namespace vesprun
