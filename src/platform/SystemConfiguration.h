#pragma once

#include <cstdint>
#include <optional>
#include <string_view>

#include "common/PropertyValue.h"

namespace vesprun {

/// The diagnostics service's own configuration: one dictionary of values for each domain. A change
/// is seen by this process at once.
///
/// A domain may be named by somebody else's data. The empty name, which also stands for a missing
/// one, and any other that cannot be a domain's are refused with an error in the system log.
class LGSSystemConfiguration {
 public:
  virtual ~LGSSystemConfiguration() = default;

  /// The configured value, or none. `options` is 0: no option is in use.
  virtual std::optional<PropertyValue> getPrefsKeyForDomainWithOptions(std::string_view key,
                                                                       std::string_view domain,
                                                                       std::uint32_t options) = 0;

  /// Sets `value`, or removes the key when there is none. With `sync` the next `synchronize` makes
  /// the domain's changes durable, else they are when the domain is next written or at the latest
  /// when the process ends. A missing `key` is refused like a bad domain.
  virtual void setPrefsKeyValueForDomainWithSync(std::optional<std::string_view> key,
                                                 std::optional<PropertyValue> value,
                                                 std::string_view domain, bool sync) = 0;

  /// Writes each domain that was changed with `sync`, once however many its changes are. What fails
  /// is told in the system log.
  virtual void synchronize() = 0;

  /// The log types that are disabled unless the user's preferences say otherwise, in order.
  virtual PropertyArray getLogBlacklist() = 0;
};

}  // namespace vesprun
