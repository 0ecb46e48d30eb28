#pragma once

#include <optional>
#include <string_view>

#include "common/PropertyValue.h"

namespace vesprun {

/// The door to the preferences of users other than the mobile one. A change is written when it is
/// synchronized, or at the latest when the process ends.
///
/// Key, user and domain may come from somebody else's data. A missing key, the empty name of a user
/// or domain, which also stands for a missing one, and a name that cannot be theirs are refused
/// with an error in the system log; nothing is changed then.
class LGSServicesClient {
 public:
  virtual ~LGSServicesClient() = default;

  /// Sets `value`, or removes the key when there is none.
  virtual void setPreferenceForUserInDomainToValue(std::optional<std::string_view> key,
                                                   std::string_view user, std::string_view domain,
                                                   std::optional<PropertyValue> value) = 0;

  virtual void deletePreferenceForUserInDomain(std::optional<std::string_view> key,
                                               std::string_view user, std::string_view domain) = 0;

  /// Makes all changes durable. What fails is told in the system log.
  virtual void synchronizeAllUsers() = 0;
};

}  // namespace vesprun
