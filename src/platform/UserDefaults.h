#pragma once

#include <optional>
#include <string_view>

#include "common/PropertyValue.h"

namespace vesprun {

/// The process's own store of values that outlive it. A change is seen by this process at once and
/// is written when the store is synchronized, or at the latest when the process ends.
class UserDefaults {
 public:
  virtual ~UserDefaults() = default;

  virtual std::optional<PropertyValue> valueForKey(std::string_view key) = 0;

  /// Sets `value`, or removes the key when there is none.
  virtual void setValueForKey(std::optional<PropertyValue> value, std::string_view key) = 0;

  /// Writes the changes durably. False when that failed; the system log says why, and the changes
  /// stay for the next attempt.
  virtual bool synchronize() = 0;
};

}  // namespace vesprun
