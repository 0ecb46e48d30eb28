#pragma once

#include <cstdint>
#include <optional>
#include <string_view>

#include "common/PropertyValue.h"

namespace vesprun {

/// The diagnostics service's own configuration, a dictionary for each domain. This process sees a
/// change at once.
///
/// A domain may come from foreign data. An empty (or missing) and an impossible name are refused
/// with an error in the system log.
class LGSSystemConfiguration {
 public:
  virtual ~LGSSystemConfiguration() = default;

  /// `options` is 0: none is in use.
  virtual std::optional<PropertyValue> getPrefsKeyForDomainWithOptions(std::string_view key,
                                                                       std::string_view domain,
                                                                       std::uint32_t options) = 0;

  /// Sets a value, or removes the key when there is none. With `sync` the next `synchronize` makes
  /// the domain durable; else it is when it is next written or the process ends. A missing key is
  /// refused like a bad domain.
  virtual void setPrefsKeyValueForDomainWithSync(std::optional<std::string_view> key,
                                                 std::optional<PropertyValue> value,
                                                 std::string_view domain, bool sync) = 0;

  /// Writes each domain that was changed with `sync`, once however many its changes are. The system
  /// log has what failed.
  virtual void synchronize() = 0;

  /// Log types that are disabled unless the user's preferences say otherwise, in order.
  virtual PropertyArray getLogBlacklist() = 0;
};

}  // namespace vesprun
