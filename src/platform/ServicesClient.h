#pragma once

#include <optional>
#include <string_view>

#include "common/PropertyValue.h"

namespace vesprun {

/// The preferences of users other than the mobile one. Changes are written when they are
/// synchronized, or when the process ends.
///
/// Key, user and domain may come from foreign data. A missing key, an empty (or missing) user or
/// domain and an impossible name are refused with an error in the system log.
class LGSServicesClient {
 public:
  virtual ~LGSServicesClient() = default;

  /// Sets a value, or removes the key when there is none.
  virtual void setPreferenceForUserInDomainToValue(std::optional<std::string_view> key,
                                                   std::string_view user, std::string_view domain,
                                                   std::optional<PropertyValue> value) = 0;

  virtual void deletePreferenceForUserInDomain(std::optional<std::string_view> key,
                                               std::string_view user, std::string_view domain) = 0;

  /// Writes all changes durably; failures go to the system log.
  virtual void synchronizeAllUsers() = 0;
};

}  // namespace vesprun
