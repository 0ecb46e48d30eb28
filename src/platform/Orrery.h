#pragma once

#include <optional>
#include <string_view>

#include "common/PropertyValue.h"

namespace vesprun {

/// The platform's device-property query.
class Orrery {
 public:
  virtual ~Orrery() = default;

  /// The answer to a question such as "DiskUsage"; nothing when the platform has none.
  virtual std::optional<PropertyValue> OrreryCopyAnswer(std::string_view question) = 0;

  /// True when the answer is the boolean true.
  bool OrreryGetBoolAnswer(std::string_view question) {
    const std::optional<PropertyValue> answer = OrreryCopyAnswer(question);
    return answer && answer->boolean() != nullptr && *answer->boolean();
  }
};

}  // namespace vesprun
