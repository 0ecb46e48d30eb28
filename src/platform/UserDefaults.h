#pragma once

#include <optional>
#include <string_view>

#include "common/PropertyValue.h"

namespace vesprun {

/// The process's own stored values. This process sees a change at once; it is written when the
/// store is synchronized, or when the process ends.
class UserDefaults {
 public:
  virtual ~UserDefaults() = default;

  virtual std::optional<PropertyValue> valueForKey(std::string_view key) = 0;

  /// Sets a value, or removes the key when there is none.
  virtual void setValueForKey(std::optional<PropertyValue> value, std::string_view key) = 0;

  /// Writes the changes durably. False on failure: the system log has the reason, and the changes
  /// stay for the next attempt.
  virtual bool synchronize() = 0;
};

}  // namespace vesprun
